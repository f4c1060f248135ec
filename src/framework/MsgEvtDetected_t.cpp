#include "framework/MsgEvtDetected_t.h"

#include "framework/Marshal.h"

namespace tolk {

void MsgEvtDetected_t::toStream(std::ostream* os) const {
    *os << "{EvtGroup " << EvtGroup << " Data " << Data << "}";
}

unsigned int MsgEvtDetected_t::writeMsg(Msg* msg, unsigned int offset) {
    offset = putFirst(msg, offset, 0x380000, &EvtGroup);
    return putList(msg, offset, 4, Data, false);
}

unsigned int MsgEvtDetected_t::readMsg(Msg* msg, unsigned int offset) {
    offset = getFirst(msg, offset, 0x380000, &EvtGroup);
    return getList(msg, offset, 4, Data, remaining(msg, offset), false);
}

}  // namespace tolk
