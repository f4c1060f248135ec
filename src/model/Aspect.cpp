#include "model/Aspect.h"

#include <typeinfo>

namespace vx7diag {

Aspect::~Aspect() {
    delete[] zlgText;
}

bool Aspect::operator==(const Aspect& other) const {
    return typeid(*this) == typeid(other);
}

bool Aspect::operator<(const Aspect& other) const {
    return !(*this == other);
}

char* Aspect::ToZLG() {
    return nullptr;
}

}  // namespace vx7diag
