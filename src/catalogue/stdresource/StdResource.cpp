#include "catalogue/stdresource/StdResource.h"

#include "catalogue/resourcemgr/ResourceMgr.h"

namespace tolk {

StdResource::StdResource(const CompDesc_t& target) : Addressable(target) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q)
    : Addressable(target, q) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q, int withMgr)
    : Addressable(target, q) {
    if (withMgr != 0) {
        resourceMgr = new ResourceMgr(this);
    }
}

StdResource::StdResource(const Addressable& other) : Addressable(other) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const StdResource& other) : Addressable(other), StdResource_Bodies() {
    resourceMgr = new ResourceMgr(this);
}

StdResource::~StdResource() {
    endDispatch();
    if (eventsDetected != 0) {
        try {
            CancelAllEvts(static_cast<Addressable*>(nullptr));
        } catch (...) {
        }
    }
    if (inUse != 0) {
        try {
            unuse();
        } catch (...) {
        }
    }
    if (freeOnDestroy != 0) {
        try {
            free();
        } catch (...) {
        }
    }
    delete resourceMgr;
}

MsgBody* StdResource::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = StdResource_Bodies::msgLookup(type)) {
        return body;
    }
    return superMsgBodyLookup(type);
}

MsgBody* StdResource::EvtBodyLookup(unsigned int group) {
    return superEvtBodyLookup(group);
}

void StdResource::free() {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->free(this);
}

void StdResource::use(unsigned int payload) {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->use(this, payload);
}

void StdResource::unuse() {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->unuse(this);
}

void StdResource::msgQueueAttach(isa::RefPtr<MsgQueue>& q) {
    if (inUse != 0) {
        unuse();
    }
    bool hadMgr = resourceMgr != nullptr;
    delete resourceMgr;
    resourceMgr = nullptr;
    Addressable::MsgQueueAttach(q);
    if (hadMgr) {
        resourceMgr = new ResourceMgr(this);
    }
    if (inUse != 0) {
        use(usePayload);
    }
}

unsigned int StdResource::eventId(const Addressable* target) const {
    return target != nullptr ? target->getId() : getId();
}

CompDesc_t StdResource::eventRetAddr(const Addressable* target) const {
    return target != nullptr ? target->getTgtDesc() : queue->getHostDesc();
}

void StdResource::GetParm(MsgGetParm_t* body, MsgGetParmCmplt_t* ret) {
    request(MsgGetParm_t::MsgType, body, MsgGetParmCmplt_t::MsgType, ret);
}

void StdResource::GetParm(unsigned int Num, MsgGetParmCmplt_t* ret) {
    MsgGetParm_t body(Num);
    request(MsgGetParm_t::MsgType, &body, MsgGetParmCmplt_t::MsgType, ret);
}

void StdResource::ArmRTC(MsgArmRTC_t* body) {
    request(MsgArmRTC_t::MsgType, body, MsgArmRTCCmplt_t::MsgType, nullptr, getId());
}

void StdResource::ArmRTC(unsigned int EvtGroup, unsigned int Action) {
    MsgArmRTC_t body(EvtGroup, Action);
    ArmRTC(&body);
}

void StdResource::ArmxRTCs(MsgArmxRTCs_t* body) {
    request(MsgArmxRTCs_t::MsgType, body, MsgArmxRTCsCmplt_t::MsgType, nullptr, getId());
}

void StdResource::ArmxRTCs(staticList<MsgArmxRTCs_t::EventGroupList_t>& EventGroupList) {
    unsigned int Count = 0xFFFFFFFF;
    MsgArmxRTCs_t body(Count, EventGroupList);
    ArmxRTCs(&body);
}

void StdResource::DisArmRTC(MsgDisarmRTC_t* body) {
    request(MsgDisarmRTC_t::MsgType, body, MsgDisarmRTCCmplt_t::MsgType, nullptr, getId());
}

void StdResource::DisArmRTC(unsigned int EvtGroup) {
    MsgDisarmRTC_t body(EvtGroup);
    DisArmRTC(&body);
}

void StdResource::DisarmxRTCs(MsgDisarmxRTCs_t* body) {
    request(MsgDisarmxRTCs_t::MsgType, body, MsgDisarmxRTCsCmplt_t::MsgType, nullptr, getId());
}

void StdResource::DisarmxRTCs(staticList<unsigned int>& EventGroupList) {
    unsigned int Count = 0xFFFFFFFF;
    MsgDisarmxRTCs_t body(Count, EventGroupList);
    DisarmxRTCs(&body);
}

void StdResource::DisarmAllRTCs(MsgDisarmAllRTCs_t* body) {
    request(MsgDisarmAllRTCs_t::MsgType, body, MsgDisarmAllRTCsCmplt_t::MsgType, nullptr, getId());
}

void StdResource::DisarmAllRTCs() {
    MsgDisarmAllRTCs_t body;
    DisarmAllRTCs(&body);
}

void StdResource::DetectEvt(MsgDetectEvt_t* body) {
    request(MsgDetectEvt_t::MsgType, body, MsgDetectEvtCmplt_t::MsgType, nullptr, getId());
}

void StdResource::DetectEvt(unsigned int EvtType, unsigned int EvtGroup, Addressable* target) {
    CompDesc_t RetAddr = eventRetAddr(target);
    unsigned int group = EvtGroup != 0 ? EvtGroup : EvtType;
    MsgDetectEvt_t body(RetAddr, EvtType, group);
    request(MsgDetectEvt_t::MsgType, &body, MsgDetectEvtCmplt_t::MsgType, nullptr, eventId(target));
}

void StdResource::DetectxEvts(MsgDetectxEvts_t* body) {
    request(MsgDetectxEvts_t::MsgType, body, MsgDetectxEvtsCmplt_t::MsgType, nullptr, getId());
}

void StdResource::DetectxEvts(staticList<MsgDetectxEvts_t::List_t>& List, Addressable* target) {
    CompDesc_t RetAddr = eventRetAddr(target);
    unsigned int Count = 0xFFFFFFFF;
    MsgDetectxEvts_t body(RetAddr, Count, List);
    request(MsgDetectxEvts_t::MsgType, &body, MsgDetectxEvtsCmplt_t::MsgType, nullptr,
            eventId(target));
}

void StdResource::DetectxEvts(staticList<unsigned int>& types, unsigned int EvtGroup,
                              Addressable* target) {
    staticList<MsgDetectxEvts_t::List_t> pairs;
    pairs.realloc(types.length());
    for (unsigned int i = 0; i < types.length(); ++i) {
        unsigned int type = *types.element(i);
        pairs.element(i)->EvtType = type;
        pairs.element(i)->EvtGroup = EvtGroup != 0 ? EvtGroup : type;
    }
    DetectxEvts(pairs, target);
}

void StdResource::CancelEvt(MsgCancelEvt_t* body) {
    request(MsgCancelEvt_t::MsgType, body, MsgCancelEvtCmplt_t::MsgType, nullptr, getId());
}

void StdResource::CancelEvt(unsigned int Type, Addressable* target) {
    MsgCancelEvt_t body(Type);
    request(MsgCancelEvt_t::MsgType, &body, MsgCancelEvtCmplt_t::MsgType, nullptr, eventId(target));
}

void StdResource::CancelxEvts(MsgCancelxEvts_t* body) {
    request(MsgCancelxEvts_t::MsgType, body, MsgCancelxEvtsCmplt_t::MsgType, nullptr, getId());
}

void StdResource::CancelxEvts(staticList<unsigned int>& EvtTypeList, Addressable* target) {
    unsigned int Count = 0xFFFFFFFF;
    MsgCancelxEvts_t body(Count, EvtTypeList);
    request(MsgCancelxEvts_t::MsgType, &body, MsgCancelxEvtsCmplt_t::MsgType, nullptr,
            eventId(target));
}

void StdResource::CancelAllEvts(Addressable* target) {
    MsgCancelAllEvts_t body;
    request(MsgCancelAllEvts_t::MsgType, &body, 0x1F, nullptr, eventId(target));
}

void StdResource::Error(MsgError_t* body) {
    request(MsgError_t::MsgType, body);
}

void StdResource::Error(unsigned int ErrorMsg, unsigned int ErrorCode, cat::ValueWord Data) {
    MsgError_t body(ErrorMsg, ErrorCode, Data);
    request(MsgError_t::MsgType, &body);
}

void StdResource::ComTest(MsgComtest_t* body, MsgComtestCmplt_t* ret) {
    request(MsgComtest_t::MsgType, body, MsgComtestCmplt_t::MsgType, ret);
}

void StdResource::ComTest(MsgComtestCmplt_t* ret) {
    MsgComtest_t body;
    request(MsgComtest_t::MsgType, &body, MsgComtestCmplt_t::MsgType, ret);
}

void StdResource::SetParm(MsgSetParm_t* body, MsgSetParmCmplt_t* ret) {
    request(MsgSetParm_t::MsgType, body, MsgSetParmCmplt_t::MsgType, ret);
}

void StdResource::SetParm(unsigned int Parm, unsigned int Val, MsgSetParmCmplt_t* ret) {
    MsgSetParm_t body(Parm, Val);
    request(MsgSetParm_t::MsgType, &body, MsgSetParmCmplt_t::MsgType, ret);
}

void StdResource::SetxParms(MsgSetxParms_t* body, MsgSetxParmsCmplt_t* ret) {
    request(MsgSetxParms_t::MsgType, body, MsgSetxParmsCmplt_t::MsgType, ret);
}

void StdResource::SetxParms(staticList<MsgSetxParms_t::Parms_t>& Parms, MsgSetxParmsCmplt_t* ret) {
    SetxParms(Parms, 0xFFFFFFFF, ret);
}

void StdResource::SetxParms(staticList<MsgSetxParms_t::Parms_t>& Parms, unsigned int Count,
                            MsgSetxParmsCmplt_t* ret) {
    MsgSetxParms_t body(Count, Parms);
    request(MsgSetxParms_t::MsgType, &body, MsgSetxParmsCmplt_t::MsgType, ret);
}

void StdResource::GetxParms(MsgGetxParms_t* body, MsgGetxParmsCmplt_t* ret) {
    request(MsgGetxParms_t::MsgType, body, MsgGetxParmsCmplt_t::MsgType, ret);
}

void StdResource::GetxParms(staticList<MsgGetxParms_t::Parms_t>& Parms, MsgGetxParmsCmplt_t* ret) {
    GetxParms(Parms, 0xFFFFFFFF, ret);
}

void StdResource::GetxParms(staticList<MsgGetxParms_t::Parms_t>& Parms, unsigned int Count,
                            MsgGetxParmsCmplt_t* ret) {
    MsgGetxParms_t body(Count, Parms);
    request(MsgGetxParms_t::MsgType, &body, MsgGetxParmsCmplt_t::MsgType, ret);
}

void StdResource::SetVParm(MsgSetVParm_t* body, MsgSetVParmCmplt_t* ret) {
    request(MsgSetVParm_t::MsgType, body, MsgSetVParmCmplt_t::MsgType, ret);
}

void StdResource::SetVParm(staticList<MsgSetVParm_t::Parms_t>& Parms, MsgSetVParmCmplt_t* ret) {
    SetVParm(Parms, static_cast<unsigned short>(0xFFFF), ret);
}

void StdResource::SetVParm(staticList<MsgSetVParm_t::Parms_t>& Parms, unsigned short Count,
                           MsgSetVParmCmplt_t* ret) {
    MsgSetVParm_t body(Count, Parms);
    request(MsgSetVParm_t::MsgType, &body, MsgSetVParmCmplt_t::MsgType, ret);
}

void StdResource::GetVParm(MsgGetVParm_t* body, MsgGetVParmCmplt_t* ret) {
    request(MsgGetVParm_t::MsgType, body, MsgGetVParmCmplt_t::MsgType, ret);
}

void StdResource::GetVParm(staticList<MsgGetVParm_t::Parms_t>& Parms, MsgGetVParmCmplt_t* ret) {
    GetVParm(Parms, static_cast<unsigned short>(0xFFFF), ret);
}

void StdResource::GetVParm(staticList<MsgGetVParm_t::Parms_t>& Parms, unsigned short Count,
                           MsgGetVParmCmplt_t* ret) {
    MsgGetVParm_t body(Count, Parms);
    request(MsgGetVParm_t::MsgType, &body, MsgGetVParmCmplt_t::MsgType, ret);
}

void StdResource::Init(MsgInit_t* body, MsgInitCmplt_t* ret) {
    request(MsgInit_t::MsgType, body, MsgInitCmplt_t::MsgType, ret);
}

void StdResource::Init(MsgInitCmplt_t* ret) {
    MsgInit_t body;
    request(MsgInit_t::MsgType, &body, MsgInitCmplt_t::MsgType, ret);
}

void StdResource::Ack(MsgAck_t* body) {
    request(MsgAck_t::MsgType, body);
}

void StdResource::Ack() {
    MsgAck_t body;
    request(MsgAck_t::MsgType, &body);
}

void StdResource::Exit(MsgExit_t* body) {
    request(MsgExit_t::MsgType, body);
}

void StdResource::Exit() {
    MsgExit_t body;
    request(MsgExit_t::MsgType, &body);
}

void StdResource::SetParmDef(MsgSetParmDef_t* body, MsgSetParmDefCmplt_t* ret) {
    request(MsgSetParmDef_t::MsgType, body, MsgSetParmDefCmplt_t::MsgType, ret);
}

void StdResource::SetParmDef(unsigned int Parm, MsgSetParmDefCmplt_t* ret) {
    MsgSetParmDef_t body(Parm);
    request(MsgSetParmDef_t::MsgType, &body, MsgSetParmDefCmplt_t::MsgType, ret);
}

void StdResource::SetxParmsDef(MsgSetxParmsDef_t* body, MsgSetxParmsDefCmplt_t* ret) {
    request(MsgSetxParmsDef_t::MsgType, body, MsgSetxParmsDefCmplt_t::MsgType, ret);
}

void StdResource::SetxParmsDef(staticList<MsgSetxParmsDef_t::Parms_t>& Parms,
                               MsgSetxParmsDefCmplt_t* ret) {
    SetxParmsDef(Parms, 0xFFFFFFFF, ret);
}

void StdResource::SetxParmsDef(staticList<MsgSetxParmsDef_t::Parms_t>& Parms, unsigned int Count,
                               MsgSetxParmsDefCmplt_t* ret) {
    MsgSetxParmsDef_t body(Count, Parms);
    request(MsgSetxParmsDef_t::MsgType, &body, MsgSetxParmsDefCmplt_t::MsgType, ret);
}

void StdResource::SetAllParmsDef(MsgSetAllParmsDef_t* body, MsgSetAllParmsDefCmplt_t* ret) {
    request(MsgSetAllParmsDef_t::MsgType, body, MsgSetAllParmsDefCmplt_t::MsgType, ret);
}

void StdResource::SetAllParmsDef(MsgSetAllParmsDefCmplt_t* ret) {
    MsgSetAllParmsDef_t body;
    request(MsgSetAllParmsDef_t::MsgType, &body, MsgSetAllParmsDefCmplt_t::MsgType, ret);
}

}  // namespace tolk
