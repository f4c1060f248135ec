#include "framework/virtualObject.h"

#include "framework/Exception.h"

namespace tolk {

void virtualObject::toStream(std::ostream*) const {}

std::ostream& operator<<(std::ostream& os, const virtualObject& obj) {
    obj.toStream(&os);
    return os;
}

void Exception::toStream(std::ostream* os) const {
    *os << text;
}

}  // namespace tolk
