#include "catalogue/tsc/TSC.h"

namespace tolk {

TSC::TSC(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Instance(target, q) {
    registerNullHandlers();
}

TSC::TSC(const Instance& other) : Instance(other) {
    registerNullHandlers();
}

TSC::TSC(const TSC& other) : Instance(other), TSC_Bodies() {
    registerNullHandlers();
}

void TSC::registerNullHandlers() {
    asyncRegisterMsgType(MsgSetChanStateCmplt_t::MsgType, static_cast<EvtCallback::MsgFn>(nullptr),
                         0);
}

TSC::~TSC() {
    endDispatch();
}

MsgBody* TSC::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = TSC_Bodies::msgLookup(type)) {
        return body;
    }
    return Instance::superMsgBodyLookup(type);
}

MsgBody* TSC::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = TSC_Bodies::evtLookup(group)) {
        return body;
    }
    return Instance::superEvtBodyLookup(group);
}

void TSC::DetectEvtSet(unsigned int EvtType, staticList<unsigned int>& Set, unsigned int EvtGroup,
                       Addressable* target) {
    CompDesc_t RetAddr = eventRetAddr(target);
    unsigned int group = EvtGroup != 0 ? EvtGroup : EvtType;
    unsigned int Count = 0xFFFFFFFF;
    MsgDetectEvtSet_t body(RetAddr, EvtType, group, Count, Set);
    request(MsgDetectEvtSet_t::MsgType, &body, MsgDetectEvtCmplt_t::MsgType, nullptr,
            eventId(target));
}

}  // namespace tolk
