#include "framework/MsgEvtDetected_t.h"

#include "framework/Marshal.h"

namespace tolk {

void MsgEvtDetected_t::toStream(std::ostream* os) const {
    *os << "{EvtGroup " << EvtGroup << " Data " << Data << "}";
}

unsigned int MsgEvtDetected_t::writeMsg(Msg* msg, unsigned int offset) {
    offset = putFirst(msg, offset, wire::pack(wire::U32), &EvtGroup);
    return putList(msg, offset, wire::U8, Data, false);
}

unsigned int MsgEvtDetected_t::readMsg(Msg* msg, unsigned int offset) {
    offset = getFirst(msg, offset, wire::pack(wire::U32), &EvtGroup);
    return getList(msg, offset, wire::U8, Data, remaining(msg, offset), false);
}

}  // namespace tolk
