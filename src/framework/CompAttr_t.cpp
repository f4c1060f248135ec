#include "framework/CompAttr_t.h"

#include "framework/Marshal.h"

namespace tolk {

void CompAttr_t::toStream(std::ostream* os) const {
    *os << "{key " << key << " value " << value << "}";
}

unsigned int CompAttr_t::writeMsg(Msg* msg, unsigned int offset) {
    offset = putFirst(msg, offset, 0x380000, &key);
    return putField(msg, offset, 0x180000, &value);
}

unsigned int CompAttr_t::readMsg(Msg* msg, unsigned int offset) {
    offset = getFirst(msg, offset, 0x380000, &key);
    return getField(msg, offset, 0x180000, &value);
}

}  // namespace tolk
