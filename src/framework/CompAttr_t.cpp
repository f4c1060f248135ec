#include "framework/CompAttr_t.h"

#include "framework/Marshal.h"

namespace tolk {

void CompAttr_t::toStream(std::ostream* os) const {
    *os << "{key " << key << " value " << value << "}";
}

unsigned int CompAttr_t::writeMsg(Msg* msg, unsigned int offset) {
    offset = putFirst(msg, offset, wire::pack(wire::U32), &key);
    return putField(msg, offset, wire::pack(wire::I32), &value);
}

unsigned int CompAttr_t::readMsg(Msg* msg, unsigned int offset) {
    offset = getFirst(msg, offset, wire::pack(wire::U32), &key);
    return getField(msg, offset, wire::pack(wire::I32), &value);
}

}  // namespace tolk
