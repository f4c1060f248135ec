#include "catalogue/tsc/TSC.h"

#include "catalogue/generated/values.h"

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

void TSC::AcceptCall(MsgAcceptCall_t* body) {
    request(MsgAcceptCall_t::MsgType, body);
}

void TSC::AcceptCall(unsigned int CallId) {
    MsgAcceptCall_t body(CallId);
    request(MsgAcceptCall_t::MsgType, &body);
}

void TSC::AnswerCall(MsgAnswerCall_t* body) {
    request(MsgAnswerCall_t::MsgType, body);
}

void TSC::AnswerCall(unsigned int CallId, unsigned int NumRings) {
    staticList<MsgAnswerCall_t::KVSet_t> KVSet;
    AnswerCall(CallId, NumRings, KVSet);
}

void TSC::AnswerCall(unsigned int CallId, unsigned int NumRings,
                     staticList<MsgAnswerCall_t::KVSet_t>& KVSet) {
    MsgAnswerCall_t body(CallId, NumRings, KVSet);
    request(MsgAnswerCall_t::MsgType, &body);
}

void TSC::BlindTransferCall(MsgBlindTransferCall_t* body) {
    request(MsgBlindTransferCall_t::MsgType, body);
}

void TSC::BlindTransferCall(unsigned int CallId, const Text& DestAddr, const Text& OrigAddr,
                            unsigned char CallProgress) {
    Text dest(DestAddr);
    Text orig(OrigAddr);
    MsgBlindTransferCall_t body(CallId, dest, orig, CallProgress);
    request(MsgBlindTransferCall_t::MsgType, &body);
}

void TSC::CancelTransfer(MsgCancelTransfer_t* body) {
    request(MsgCancelTransfer_t::MsgType, body);
}

void TSC::CancelTransfer(unsigned int CallId) {
    MsgCancelTransfer_t body(CallId);
    request(MsgCancelTransfer_t::MsgType, &body);
}

void TSC::CancelComplete(MsgCancelComplete_t* body) {
    request(MsgCancelComplete_t::MsgType, body);
}

void TSC::CancelComplete(unsigned int CmpltId) {
    MsgCancelComplete_t body(CmpltId);
    request(MsgCancelComplete_t::MsgType, &body);
}

void TSC::CompleteCall(MsgCompleteCall_t* body, MsgCompleteCallCmplt_t* ret) {
    request(MsgCompleteCall_t::MsgType, body, MsgCompleteCallCmplt_t::MsgType, ret);
}

void TSC::CompleteCall(unsigned int Mode, MsgCompleteCallCmplt_t* ret) {
    CompleteCall(Mode, 0, ret);
}

void TSC::CompleteCall(unsigned int Mode, unsigned int CallId, MsgCompleteCallCmplt_t* ret) {
    MsgCompleteCall_t body(CallId, Mode);
    request(MsgCompleteCall_t::MsgType, &body, MsgCompleteCallCmplt_t::MsgType, ret);
}

void TSC::CompleteTransfer(MsgCompleteTransfer_t* body) {
    request(MsgCompleteTransfer_t::MsgType, body);
}

void TSC::CompleteTransfer(unsigned int ConCallId, unsigned int CallId) {
    MsgCompleteTransfer_t body(CallId, ConCallId);
    request(MsgCompleteTransfer_t::MsgType, &body);
}

void TSC::DropCall(MsgDropCall_t* body) {
    request(MsgDropCall_t::MsgType, body);
}

void TSC::DropCall(unsigned int CallId, unsigned int Reason) {
    staticList<MsgDropCall_t::KVSet_t> KVSet;
    DropCall(CallId, Reason, KVSet);
}

void TSC::DropCall(unsigned int CallId, unsigned int Reason,
                   staticList<MsgDropCall_t::KVSet_t>& KVSet) {
    MsgDropCall_t body(CallId, Reason, KVSet);
    request(MsgDropCall_t::MsgType, &body);
}

void TSC::GetCallState(MsgGetCallState_t* body, MsgGetCallStateCmplt_t* ret) {
    request(MsgGetCallState_t::MsgType, body, MsgGetCallStateCmplt_t::MsgType, ret);
}

void TSC::GetCallState(MsgGetCallStateCmplt_t* ret) {
    GetCallState(0u, ret);
}

void TSC::GetCallState(unsigned int CallId, MsgGetCallStateCmplt_t* ret) {
    MsgGetCallState_t body(CallId);
    request(MsgGetCallState_t::MsgType, &body, MsgGetCallStateCmplt_t::MsgType, ret);
}

void TSC::GetChanState(MsgGetChanState_t* body, MsgGetChanStateCmplt_t* ret) {
    request(MsgGetChanState_t::MsgType, body, MsgGetChanStateCmplt_t::MsgType, ret);
}

void TSC::GetChanState(MsgGetChanStateCmplt_t* ret) {
    MsgGetChanState_t body;
    request(MsgGetChanState_t::MsgType, &body, MsgGetChanStateCmplt_t::MsgType, ret);
}

void TSC::HoldCall(MsgHoldCall_t* body) {
    request(MsgHoldCall_t::MsgType, body);
}

void TSC::HoldCall(unsigned int CallId) {
    MsgHoldCall_t body(CallId);
    request(MsgHoldCall_t::MsgType, &body);
}

void TSC::InitTransfer(MsgInitTransfer_t* body, MsgInitTransferCmplt_t* ret) {
    request(MsgInitTransfer_t::MsgType, body, MsgInitTransferCmplt_t::MsgType, ret);
}

void TSC::InitTransfer(MsgInitTransferCmplt_t* ret) {
    InitTransfer(0u, cat::emptyText(), cat::emptyText(), 0, ret);
}

void TSC::InitTransfer(unsigned int CallId, MsgInitTransferCmplt_t* ret) {
    InitTransfer(CallId, cat::emptyText(), cat::emptyText(), 0, ret);
}

void TSC::InitTransfer(unsigned int CallId, const Text& DestAddr, MsgInitTransferCmplt_t* ret) {
    InitTransfer(CallId, DestAddr, cat::emptyText(), 0, ret);
}

void TSC::InitTransfer(unsigned int CallId, const Text& DestAddr, const Text& OrigAddr,
                       MsgInitTransferCmplt_t* ret) {
    InitTransfer(CallId, DestAddr, OrigAddr, 0, ret);
}

void TSC::InitTransfer(unsigned int CallId, const Text& DestAddr, const Text& OrigAddr,
                       unsigned char CallProgress, MsgInitTransferCmplt_t* ret) {
    Text dest(DestAddr);
    Text orig(OrigAddr);
    MsgInitTransfer_t body(CallId, dest, orig, CallProgress);
    request(MsgInitTransfer_t::MsgType, &body, MsgInitTransferCmplt_t::MsgType, ret);
}

void TSC::MakeCall(MsgMakeCall_t* body, MsgMakeCallCmplt_t* ret) {
    request(MsgMakeCall_t::MsgType, body, MsgMakeCallCmplt_t::MsgType, ret);
}

void TSC::MakeCall(MsgMakeCallCmplt_t* ret) {
    MakeCall(cat::emptyText(), cat::emptyText(), 0, ret);
}

void TSC::MakeCall(const Text& DestAddr, MsgMakeCallCmplt_t* ret) {
    MakeCall(DestAddr, cat::emptyText(), 0, ret);
}

void TSC::MakeCall(const Text& DestAddr, const Text& OrigAddr, MsgMakeCallCmplt_t* ret) {
    MakeCall(DestAddr, OrigAddr, 0, ret);
}

void TSC::MakeCall(const Text& DestAddr, const Text& OrigAddr, unsigned char CallProgress,
                   MsgMakeCallCmplt_t* ret) {
    staticList<MsgMakeCall_t::KVSet_t> KVSet;
    MakeCall(DestAddr, OrigAddr, CallProgress, KVSet, ret);
}

void TSC::MakeCall(const Text& DestAddr, const Text& OrigAddr, unsigned char CallProgress,
                   staticList<MsgMakeCall_t::KVSet_t>& KVSet, MsgMakeCallCmplt_t* ret) {
    Text dest(DestAddr);
    Text orig(OrigAddr);
    MsgMakeCall_t body(dest, orig, CallProgress, KVSet);
    request(MsgMakeCall_t::MsgType, &body, MsgMakeCallCmplt_t::MsgType, ret);
}

void TSC::ParkCall(MsgParkCall_t* body, MsgParkCallCmplt_t* ret) {
    request(MsgParkCall_t::MsgType, body, MsgParkCallCmplt_t::MsgType, ret);
}

void TSC::ParkCall(MsgParkCallCmplt_t* ret) {
    ParkCall(0u, cat::emptyText(), ret);
}

void TSC::ParkCall(unsigned int CallId, MsgParkCallCmplt_t* ret) {
    ParkCall(CallId, cat::emptyText(), ret);
}

void TSC::ParkCall(unsigned int CallId, const Text& ParkAddr, MsgParkCallCmplt_t* ret) {
    Text park(ParkAddr);
    MsgParkCall_t body(CallId, park);
    request(MsgParkCall_t::MsgType, &body, MsgParkCallCmplt_t::MsgType, ret);
}

void TSC::PickupCall(MsgPickupCall_t* body, MsgPickupCallCmplt_t* ret) {
    request(MsgPickupCall_t::MsgType, body, MsgPickupCallCmplt_t::MsgType, ret);
}

void TSC::PickupCall(unsigned int ParkId, const Text& ParkAddr, MsgPickupCallCmplt_t* ret) {
    Text park(ParkAddr);
    MsgPickupCall_t body(ParkId, park);
    request(MsgPickupCall_t::MsgType, &body, MsgPickupCallCmplt_t::MsgType, ret);
}

void TSC::ReconnectCall(MsgReconnectCall_t* body) {
    request(MsgReconnectCall_t::MsgType, body);
}

void TSC::ReconnectCall(unsigned int CallId) {
    MsgReconnectCall_t body(CallId);
    request(MsgReconnectCall_t::MsgType, &body);
}

void TSC::RedirectCall(MsgRedirectCall_t* body) {
    request(MsgRedirectCall_t::MsgType, body);
}

void TSC::RedirectCall(unsigned int CallId, const Text& DestAddr) {
    Text dest(DestAddr);
    MsgRedirectCall_t body(CallId, dest);
    request(MsgRedirectCall_t::MsgType, &body);
}

void TSC::ReleaseCall(MsgReleaseCall_t* body) {
    request(MsgReleaseCall_t::MsgType, body);
}

void TSC::ReleaseCall(unsigned int CallId, unsigned int Reason) {
    MsgReleaseCall_t body(CallId, Reason);
    request(MsgReleaseCall_t::MsgType, &body);
}

void TSC::RejectCall(MsgRejectCall_t* body) {
    request(MsgRejectCall_t::MsgType, body);
}

void TSC::RejectCall(unsigned int CallId, unsigned int Reason) {
    staticList<MsgRejectCall_t::KVSet_t> KVSet;
    RejectCall(CallId, Reason, KVSet);
}

void TSC::RejectCall(unsigned int CallId, unsigned int Reason,
                     staticList<MsgRejectCall_t::KVSet_t>& KVSet) {
    MsgRejectCall_t body(CallId, Reason, KVSet);
    request(MsgRejectCall_t::MsgType, &body);
}

void TSC::RetrieveCall(MsgRetrieveCall_t* body) {
    request(MsgRetrieveCall_t::MsgType, body);
}

void TSC::RetrieveCall(unsigned int CallId) {
    MsgRetrieveCall_t body(CallId);
    request(MsgRetrieveCall_t::MsgType, &body);
}

void TSC::SetChanState(MsgSetChanState_t* body, MsgSetChanStateCmplt_t* ret) {
    request(MsgSetChanState_t::MsgType, body, MsgSetChanStateCmplt_t::MsgType, ret);
}

void TSC::SetChanState(unsigned int State, MsgSetChanStateCmplt_t* ret) {
    MsgSetChanState_t body(State);
    request(MsgSetChanState_t::MsgType, &body, MsgSetChanStateCmplt_t::MsgType, ret);
}

void TSC::StartSetChanState(MsgSetChanState_t* body) {
    request(MsgSetChanState_t::MsgType, body);
}

void TSC::StartSetChanState(unsigned int State) {
    MsgSetChanState_t body(State);
    request(MsgSetChanState_t::MsgType, &body);
}

void TSC::GetCallInfo(MsgGetCallInfo_t* body, MsgGetCallInfoCmplt_t* ret) {
    request(MsgGetCallInfo_t::MsgType, body, MsgGetCallInfoCmplt_t::MsgType, ret);
}

void TSC::GetCallInfo(staticList<unsigned int>& InfoIds, MsgGetCallInfoCmplt_t* ret) {
    GetCallInfo(InfoIds, 0, 0xFFFFFFFF, ret);
}

void TSC::GetCallInfo(staticList<unsigned int>& InfoIds, unsigned int CallId,
                      MsgGetCallInfoCmplt_t* ret) {
    GetCallInfo(InfoIds, CallId, 0xFFFFFFFF, ret);
}

void TSC::GetCallInfo(staticList<unsigned int>& InfoIds, unsigned int CallId, unsigned int Count,
                      MsgGetCallInfoCmplt_t* ret) {
    MsgGetCallInfo_t body(CallId, Count, InfoIds);
    request(MsgGetCallInfo_t::MsgType, &body, MsgGetCallInfoCmplt_t::MsgType, ret);
}

void TSC::SendISDN(MsgSendISDN_t* body, MsgSendISDNCmplt_t* ret) {
    request(MsgSendISDN_t::MsgType, body, MsgSendISDNCmplt_t::MsgType, ret);
}

void TSC::SendISDN(unsigned int MessageType, staticList<unsigned char>& Data,
                   MsgSendISDNCmplt_t* ret) {
    SendISDN(MessageType, Data, 0, 0xFFFFFFFF, ret);
}

void TSC::SendISDN(unsigned int MessageType, staticList<unsigned char>& Data, unsigned int CallId,
                   MsgSendISDNCmplt_t* ret) {
    SendISDN(MessageType, Data, CallId, 0xFFFFFFFF, ret);
}

void TSC::SendISDN(unsigned int MessageType, staticList<unsigned char>& Data, unsigned int CallId,
                   unsigned int DataLength, MsgSendISDNCmplt_t* ret) {
    MsgSendISDN_t body(CallId, MessageType, DataLength, Data);
    request(MsgSendISDN_t::MsgType, &body, MsgSendISDNCmplt_t::MsgType, ret);
}

void TSC::Dial(MsgDial_t* body, MsgDialCmplt_t* ret) {
    request(MsgDial_t::MsgType, body, MsgDialCmplt_t::MsgType, ret);
}

void TSC::Dial(const Text& DigitString, MsgDialCmplt_t* ret) {
    Dial(DigitString, 0, 0, 2, ret);
}

void TSC::Dial(const Text& DigitString, unsigned int CallId, MsgDialCmplt_t* ret) {
    Dial(DigitString, CallId, 0, 2, ret);
}

void TSC::Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
               MsgDialCmplt_t* ret) {
    Dial(DigitString, CallId, CallProgress, 2, ret);
}

void TSC::Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
               unsigned char EndOfDigits, MsgDialCmplt_t* ret) {
    staticList<MsgDial_t::KVSet_t> KVSet;
    Dial(DigitString, CallId, CallProgress, EndOfDigits, KVSet, ret);
}

void TSC::Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
               unsigned char EndOfDigits, staticList<MsgDial_t::KVSet_t>& KVSet,
               MsgDialCmplt_t* ret) {
    Text digits(DigitString);
    MsgDial_t body(CallId, digits, CallProgress, EndOfDigits, KVSet);
    request(MsgDial_t::MsgType, &body, MsgDialCmplt_t::MsgType, ret);
}

void TSC::ProceedCall(MsgProceedCall_t* body) {
    request(MsgProceedCall_t::MsgType, body);
}

void TSC::ProceedCall(unsigned int CallId) {
    staticList<MsgProceedCall_t::KVSet_t> KVSet;
    ProceedCall(CallId, KVSet);
}

void TSC::ProceedCall(unsigned int CallId, staticList<MsgProceedCall_t::KVSet_t>& KVSet) {
    MsgProceedCall_t body(CallId, KVSet);
    request(MsgProceedCall_t::MsgType, &body);
}

void TSC::Attach(MsgAttach_t* body, MsgAttachCmplt_t* ret) {
    request(MsgAttach_t::MsgType, body, MsgAttachCmplt_t::MsgType, ret);
}

void TSC::Attach(staticList<MsgAttach_t::MediaInfo_t>& MediaInfo, MsgAttachCmplt_t* ret) {
    Attach(MediaInfo, 0xFF, ret);
}

void TSC::Attach(staticList<MsgAttach_t::MediaInfo_t>& MediaInfo, unsigned char Count,
                 MsgAttachCmplt_t* ret) {
    MsgAttach_t body(Count, MediaInfo);
    request(MsgAttach_t::MsgType, &body, MsgAttachCmplt_t::MsgType, ret);
}

void TSC::Detach(MsgDetach_t* body, MsgDetachCmplt_t* ret) {
    request(MsgDetach_t::MsgType, body, MsgDetachCmplt_t::MsgType, ret);
}

void TSC::Detach(MsgDetachCmplt_t* ret) {
    MsgDetach_t body;
    request(MsgDetach_t::MsgType, &body, MsgDetachCmplt_t::MsgType, ret);
}

void TSC::SetAlarmMask(MsgSetAlarmMask_t* body, MsgSetAlarmMaskCmplt_t* ret) {
    request(MsgSetAlarmMask_t::MsgType, body, MsgSetAlarmMaskCmplt_t::MsgType, ret);
}

void TSC::SetAlarmMask(unsigned char Linenum, MsgSetAlarmMaskCmplt_t* ret) {
    SetAlarmMask(Linenum, 0x46, ret);
}

void TSC::SetAlarmMask(unsigned char Linenum, unsigned int Alarm_mask,
                       MsgSetAlarmMaskCmplt_t* ret) {
    MsgSetAlarmMask_t body(Linenum, Alarm_mask);
    request(MsgSetAlarmMask_t::MsgType, &body, MsgSetAlarmMaskCmplt_t::MsgType, ret);
}

void TSC::GetAlarmMask(MsgGetAlarmMask_t* body, MsgGetAlarmMaskCmplt_t* ret) {
    request(MsgGetAlarmMask_t::MsgType, body, MsgGetAlarmMaskCmplt_t::MsgType, ret);
}

void TSC::GetAlarmMask(unsigned char Linenum, MsgGetAlarmMaskCmplt_t* ret) {
    MsgGetAlarmMask_t body(Linenum);
    request(MsgGetAlarmMask_t::MsgType, &body, MsgGetAlarmMaskCmplt_t::MsgType, ret);
}

void TSC::GCExtension(MsgGCExtension_t* body, MsgGCExtensionCmplt_t* ret) {
    request(MsgGCExtension_t::MsgType, body, MsgGCExtensionCmplt_t::MsgType, ret);
}

void TSC::GCExtension(MsgGCExtensionCmplt_t* ret) {
    GCExtension(0u, 0, 0, cat::emptyText(), cat::emptyText(), ret);
}

void TSC::GCExtension(unsigned int Int1Val, MsgGCExtensionCmplt_t* ret) {
    GCExtension(Int1Val, 0, 0, cat::emptyText(), cat::emptyText(), ret);
}

void TSC::GCExtension(unsigned int Int1Val, unsigned int Int2Val, MsgGCExtensionCmplt_t* ret) {
    GCExtension(Int1Val, Int2Val, 0, cat::emptyText(), cat::emptyText(), ret);
}

void TSC::GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                      MsgGCExtensionCmplt_t* ret) {
    GCExtension(Int1Val, Int2Val, Int3Val, cat::emptyText(), cat::emptyText(), ret);
}

void TSC::GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                      const Text& Str1Val, MsgGCExtensionCmplt_t* ret) {
    GCExtension(Int1Val, Int2Val, Int3Val, Str1Val, cat::emptyText(), ret);
}

void TSC::GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                      const Text& Str1Val, const Text& Str2Val, MsgGCExtensionCmplt_t* ret) {
    Text str1(Str1Val);
    Text str2(Str2Val);
    MsgGCExtension_t body(Int1Val, Int2Val, Int3Val, str1, str2);
    request(MsgGCExtension_t::MsgType, &body, MsgGCExtensionCmplt_t::MsgType, ret);
}

void TSC::ResetLineDevice(MsgResetLineDevice_t* body, MsgResetLineDeviceCmplt_t* ret) {
    request(MsgResetLineDevice_t::MsgType, body, MsgResetLineDeviceCmplt_t::MsgType, ret);
}

void TSC::ResetLineDevice(MsgResetLineDeviceCmplt_t* ret) {
    ResetLineDevice(wire::TSC::SetChanState::IN_SERVICE, ret);
}

void TSC::ResetLineDevice(unsigned int state, MsgResetLineDeviceCmplt_t* ret) {
    MsgResetLineDevice_t body(state);
    request(MsgResetLineDevice_t::MsgType, &body, MsgResetLineDeviceCmplt_t::MsgType, ret);
}

void TSC::GetSignalBits(MsgTxRxSignalingGet_t* body, MsgTxRxSignalingGetCmplt_t* ret) {
    request(MsgTxRxSignalingGet_t::MsgType, body, MsgTxRxSignalingGetCmplt_t::MsgType, ret);
}

void TSC::GetSignalBits(MsgTxRxSignalingGetCmplt_t* ret) {
    MsgTxRxSignalingGet_t body;
    request(MsgTxRxSignalingGet_t::MsgType, &body, MsgTxRxSignalingGetCmplt_t::MsgType, ret);
}

void TSC::DetectEvtSet(unsigned int EvtType, staticList<unsigned int>& Set, unsigned int EvtGroup,
                       Addressable* target) {
    CompDesc_t RetAddr = eventRetAddr(target);
    unsigned int group = EvtGroup != 0 ? EvtGroup : EvtType;
    unsigned int Count = 0xFFFFFFFF;
    MsgDetectEvtSet_t body(RetAddr, EvtType, group, Count, Set);
    request(MsgDetectEvtSet_t::MsgType, &body, StdResource_Bodies::MsgDetectEvtCmplt_t::MsgType,
            nullptr, eventId(target));
}

}  // namespace tolk
