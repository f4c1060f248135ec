#include "framework/MsgDefault_t.h"

#include "framework/Marshal.h"

namespace tolk {

void MsgDefault_t::toStream(std::ostream* os) const {
    *os << "{ByteData {";
    for (unsigned int i = 0; i < data->length(); ++i) {
        *os << static_cast<unsigned int>(*data->element(i)) << " ";
    }
    *os << "}}";
}

unsigned int MsgDefault_t::writeMsg(Msg* msg, unsigned int offset) {
    return putList(msg, offset, wire::U8, *data, true);
}

unsigned int MsgDefault_t::readMsg(Msg* msg, unsigned int offset) {
    return getList(msg, offset, wire::U8, *data, remaining(msg, offset), true);
}

}  // namespace tolk
