#include "catalogue/cas/CAS.h"

namespace tolk {

CAS::CAS(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Instance(target, q) {
    registerNullHandlers();
}

CAS::CAS(const Instance& other) : Instance(other) {
    registerNullHandlers();
}

CAS::CAS(const CAS& other) : Instance(other), CAS_Bodies() {
    registerNullHandlers();
}

void CAS::registerNullHandlers() {
    asyncRegisterMsgType(MsgDialCmplt_t::MsgType, static_cast<EvtCallback::MsgFn>(nullptr), 0);
}

CAS::~CAS() {
    endDispatch();
}

MsgBody* CAS::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = CAS_Bodies::msgLookup(type)) {
        return body;
    }
    return Instance::superMsgBodyLookup(type);
}

MsgBody* CAS::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = CAS_Bodies::evtLookup(group)) {
        return body;
    }
    return Instance::superEvtBodyLookup(group);
}

}  // namespace tolk
