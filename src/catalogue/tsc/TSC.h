#pragma once

#include "catalogue/OpText.h"
#include "catalogue/generated/tsc_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Call control of one board channel. One-way commands return after the error wait; the
// outcome arrives later as an event.
class TSC : public Instance, public TSC_Bodies {
  public:
    // Both register a null handler for 0x1220, the completion of StartSetChanState.
    TSC(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit TSC(const Instance& other);
    TSC(const TSC& other);
    TSC& operator=(const TSC&) = delete;
    ~TSC() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    using Text = staticList<char>;

    void AcceptCall(MsgAcceptCall_t* body);
    void AcceptCall(unsigned int CallId = 0);
    void AnswerCall(MsgAnswerCall_t* body);
    void AnswerCall(unsigned int CallId = 0, unsigned int NumRings = 0);
    void AnswerCall(unsigned int CallId, unsigned int NumRings,
                    staticList<MsgAnswerCall_t::KVSet_t>& KVSet);
    void BlindTransferCall(MsgBlindTransferCall_t* body);
    void BlindTransferCall(unsigned int CallId = 0, const Text& DestAddr = cat::emptyText(),
                           const Text& OrigAddr = cat::emptyText(), unsigned char CallProgress = 0);
    void CancelTransfer(MsgCancelTransfer_t* body);
    void CancelTransfer(unsigned int CallId = 0);
    void CancelComplete(MsgCancelComplete_t* body);
    void CancelComplete(unsigned int CmpltId);
    void CompleteCall(MsgCompleteCall_t* body, MsgCompleteCallCmplt_t* ret);
    void CompleteCall(unsigned int Mode, MsgCompleteCallCmplt_t* ret);
    void CompleteCall(unsigned int Mode, unsigned int CallId, MsgCompleteCallCmplt_t* ret);
    void CompleteTransfer(MsgCompleteTransfer_t* body);
    void CompleteTransfer(unsigned int ConCallId, unsigned int CallId = 0);
    void DropCall(MsgDropCall_t* body);
    void DropCall(unsigned int CallId = 0, unsigned int Reason = 0xE);
    void DropCall(unsigned int CallId, unsigned int Reason,
                  staticList<MsgDropCall_t::KVSet_t>& KVSet);
    void GetCallState(MsgGetCallState_t* body, MsgGetCallStateCmplt_t* ret);
    void GetCallState(MsgGetCallStateCmplt_t* ret);
    void GetCallState(unsigned int CallId, MsgGetCallStateCmplt_t* ret);
    void GetChanState(MsgGetChanState_t* body, MsgGetChanStateCmplt_t* ret);
    void GetChanState(MsgGetChanStateCmplt_t* ret);
    void HoldCall(MsgHoldCall_t* body);
    void HoldCall(unsigned int CallId = 0);
    void InitTransfer(MsgInitTransfer_t* body, MsgInitTransferCmplt_t* ret);
    void InitTransfer(MsgInitTransferCmplt_t* ret);
    void InitTransfer(unsigned int CallId, MsgInitTransferCmplt_t* ret);
    void InitTransfer(unsigned int CallId, const Text& DestAddr, MsgInitTransferCmplt_t* ret);
    void InitTransfer(unsigned int CallId, const Text& DestAddr, const Text& OrigAddr,
                      MsgInitTransferCmplt_t* ret);
    void InitTransfer(unsigned int CallId, const Text& DestAddr, const Text& OrigAddr,
                      unsigned char CallProgress, MsgInitTransferCmplt_t* ret);
    void MakeCall(MsgMakeCall_t* body, MsgMakeCallCmplt_t* ret);
    void MakeCall(MsgMakeCallCmplt_t* ret);
    void MakeCall(const Text& DestAddr, MsgMakeCallCmplt_t* ret);
    void MakeCall(const Text& DestAddr, const Text& OrigAddr, MsgMakeCallCmplt_t* ret);
    void MakeCall(const Text& DestAddr, const Text& OrigAddr, unsigned char CallProgress,
                  MsgMakeCallCmplt_t* ret);
    void MakeCall(const Text& DestAddr, const Text& OrigAddr, unsigned char CallProgress,
                  staticList<MsgMakeCall_t::KVSet_t>& KVSet, MsgMakeCallCmplt_t* ret);
    void ParkCall(MsgParkCall_t* body, MsgParkCallCmplt_t* ret);
    void ParkCall(MsgParkCallCmplt_t* ret);
    void ParkCall(unsigned int CallId, MsgParkCallCmplt_t* ret);
    void ParkCall(unsigned int CallId, const Text& ParkAddr, MsgParkCallCmplt_t* ret);
    void PickupCall(MsgPickupCall_t* body, MsgPickupCallCmplt_t* ret);
    void PickupCall(unsigned int ParkId, const Text& ParkAddr, MsgPickupCallCmplt_t* ret);
    void ReconnectCall(MsgReconnectCall_t* body);
    void ReconnectCall(unsigned int CallId = 0);
    void RedirectCall(MsgRedirectCall_t* body);
    void RedirectCall(unsigned int CallId = 0, const Text& DestAddr = cat::emptyText());
    void ReleaseCall(MsgReleaseCall_t* body);
    void ReleaseCall(unsigned int CallId = 0, unsigned int Reason = 0xE);
    void RejectCall(MsgRejectCall_t* body);
    void RejectCall(unsigned int CallId = 0, unsigned int Reason = 2);
    void RejectCall(unsigned int CallId, unsigned int Reason,
                    staticList<MsgRejectCall_t::KVSet_t>& KVSet);
    void RetrieveCall(MsgRetrieveCall_t* body);
    void RetrieveCall(unsigned int CallId = 0);
    void SetChanState(MsgSetChanState_t* body, MsgSetChanStateCmplt_t* ret);
    void SetChanState(unsigned int State, MsgSetChanStateCmplt_t* ret);
    // The one-way twin of SetChanState: its completion is dropped by the null handler.
    void StartSetChanState(MsgSetChanState_t* body);
    void StartSetChanState(unsigned int State);
    void GetCallInfo(MsgGetCallInfo_t* body, MsgGetCallInfoCmplt_t* ret);
    void GetCallInfo(staticList<unsigned int>& InfoIds, MsgGetCallInfoCmplt_t* ret);
    void GetCallInfo(staticList<unsigned int>& InfoIds, unsigned int CallId,
                     MsgGetCallInfoCmplt_t* ret);
    void GetCallInfo(staticList<unsigned int>& InfoIds, unsigned int CallId, unsigned int Count,
                     MsgGetCallInfoCmplt_t* ret);
    void SendISDN(MsgSendISDN_t* body, MsgSendISDNCmplt_t* ret);
    void SendISDN(unsigned int MessageType, staticList<unsigned char>& Data,
                  MsgSendISDNCmplt_t* ret);
    void SendISDN(unsigned int MessageType, staticList<unsigned char>& Data, unsigned int CallId,
                  MsgSendISDNCmplt_t* ret);
    void SendISDN(unsigned int MessageType, staticList<unsigned char>& Data, unsigned int CallId,
                  unsigned int DataLength, MsgSendISDNCmplt_t* ret);
    void Dial(MsgDial_t* body, MsgDialCmplt_t* ret);
    void Dial(const Text& DigitString, MsgDialCmplt_t* ret);
    void Dial(const Text& DigitString, unsigned int CallId, MsgDialCmplt_t* ret);
    void Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
              MsgDialCmplt_t* ret);
    void Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
              unsigned char EndOfDigits, MsgDialCmplt_t* ret);
    void Dial(const Text& DigitString, unsigned int CallId, unsigned char CallProgress,
              unsigned char EndOfDigits, staticList<MsgDial_t::KVSet_t>& KVSet,
              MsgDialCmplt_t* ret);
    void ProceedCall(MsgProceedCall_t* body);
    void ProceedCall(unsigned int CallId = 0);
    void ProceedCall(unsigned int CallId, staticList<MsgProceedCall_t::KVSet_t>& KVSet);
    void Attach(MsgAttach_t* body, MsgAttachCmplt_t* ret);
    void Attach(staticList<MsgAttach_t::MediaInfo_t>& MediaInfo, MsgAttachCmplt_t* ret);
    void Attach(staticList<MsgAttach_t::MediaInfo_t>& MediaInfo, unsigned char Count,
                MsgAttachCmplt_t* ret);
    void Detach(MsgDetach_t* body, MsgDetachCmplt_t* ret);
    void Detach(MsgDetachCmplt_t* ret);
    void SetAlarmMask(MsgSetAlarmMask_t* body, MsgSetAlarmMaskCmplt_t* ret);
    void SetAlarmMask(unsigned char Linenum, MsgSetAlarmMaskCmplt_t* ret);
    void SetAlarmMask(unsigned char Linenum, unsigned int Alarm_mask, MsgSetAlarmMaskCmplt_t* ret);
    void GetAlarmMask(MsgGetAlarmMask_t* body, MsgGetAlarmMaskCmplt_t* ret);
    void GetAlarmMask(unsigned char Linenum, MsgGetAlarmMaskCmplt_t* ret);
    void GCExtension(MsgGCExtension_t* body, MsgGCExtensionCmplt_t* ret);
    void GCExtension(MsgGCExtensionCmplt_t* ret);
    void GCExtension(unsigned int Int1Val, MsgGCExtensionCmplt_t* ret);
    void GCExtension(unsigned int Int1Val, unsigned int Int2Val, MsgGCExtensionCmplt_t* ret);
    void GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                     MsgGCExtensionCmplt_t* ret);
    void GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                     const Text& Str1Val, MsgGCExtensionCmplt_t* ret);
    void GCExtension(unsigned int Int1Val, unsigned int Int2Val, unsigned int Int3Val,
                     const Text& Str1Val, const Text& Str2Val, MsgGCExtensionCmplt_t* ret);
    void ResetLineDevice(MsgResetLineDevice_t* body, MsgResetLineDeviceCmplt_t* ret);
    void ResetLineDevice(MsgResetLineDeviceCmplt_t* ret);
    void ResetLineDevice(unsigned int state, MsgResetLineDeviceCmplt_t* ret);
    void GetSignalBits(MsgTxRxSignalingGet_t* body, MsgTxRxSignalingGetCmplt_t* ret);
    void GetSignalBits(MsgTxRxSignalingGetCmplt_t* ret);
    // Sent as 0x16 with this component's body; group, RetAddr and id as DetectEvt gives them.
    void DetectEvtSet(unsigned int EvtType, staticList<unsigned int>& Set, unsigned int EvtGroup,
                      Addressable* target);

  private:
    void registerNullHandlers();
};

}  // namespace tolk
