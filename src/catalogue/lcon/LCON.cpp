#include "catalogue/lcon/LCON.h"

namespace tolk {

LCON::LCON(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Instance(target, q) {
    registerNullHandlers();
}

LCON::LCON(const Instance& other) : Instance(other) {
    registerNullHandlers();
}

LCON::LCON(const LCON& other) : Instance(other), LCON_Bodies() {
    registerNullHandlers();
}

void LCON::registerNullHandlers() {
    asyncRegisterMsgType(MsgSetLineStateCmplt_t::MsgType, static_cast<EvtCallback::MsgFn>(nullptr),
                         0);
}

LCON::~LCON() {
    endDispatch();
}

MsgBody* LCON::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = LCON_Bodies::msgLookup(type)) {
        return body;
    }
    return Instance::superMsgBodyLookup(type);
}

MsgBody* LCON::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = LCON_Bodies::evtLookup(group)) {
        return body;
    }
    return Instance::superEvtBodyLookup(group);
}

}  // namespace tolk
