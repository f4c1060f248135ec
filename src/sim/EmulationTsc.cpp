// A channel's call control: every call operation goes to the call state machine of the model.
#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "catalogue/generated/tsc_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Tsc = tolk::TSC_Bodies;

namespace {

std::string text(tolk::staticList<char>& l) {
    const char* p = l.data();
    unsigned int n = l.length();
    unsigned int len = 0;
    while (len < n && p[len] != '\0') {
        ++len;
    }
    return std::string(p, len);
}

}  // namespace

void Emulation::handleTsc(Request& rq, const farm::Resource& r) {
    Channel& ch = *model_.channel(r.board, r.trunk, r.channel);
    std::vector<Event>& ev = scratch_;
    switch (rq.type) {
        case Tsc::MsgMakeCall_t::MsgType: {
            Tsc::MsgMakeCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0;
            // The completion goes before the events of the call it names.
            std::vector<Event> later;
            std::uint32_t code = model_.makeCall(ch, text(f.DestAddr), text(f.OrigAddr), id, later);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgMakeCallCmplt_t res;
            res.CallId = id;
            reply(rq, Tsc::MsgMakeCallCmplt_t::MsgType, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case Tsc::MsgAnswerCall_t::MsgType: {
            Tsc::MsgAnswerCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.answerCall(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgAcceptCall_t::MsgType: {
            Tsc::MsgAcceptCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.acceptCall(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgDropCall_t::MsgType: {
            Tsc::MsgDropCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.dropCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case Tsc::MsgReleaseCall_t::MsgType: {
            Tsc::MsgReleaseCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.releaseCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case Tsc::MsgRejectCall_t::MsgType: {
            Tsc::MsgRejectCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.rejectCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case Tsc::MsgHoldCall_t::MsgType: {
            Tsc::MsgHoldCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.holdCall(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgRetrieveCall_t::MsgType: {
            Tsc::MsgRetrieveCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.retrieveCall(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgBlindTransferCall_t::MsgType: {
            Tsc::MsgBlindTransferCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.blindTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgInitTransfer_t::MsgType: {
            Tsc::MsgInitTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0;
            // As with MakeCall, the completion names the consultation before its events do.
            std::vector<Event> later;
            std::uint32_t code = model_.initTransfer(ch, f.CallId, id, later);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgInitTransferCmplt_t res;
            res.CallId = id;
            reply(rq, Tsc::MsgInitTransferCmplt_t::MsgType, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case Tsc::MsgCompleteTransfer_t::MsgType: {
            Tsc::MsgCompleteTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.completeTransfer(ch, f.CallId, f.ConCallId, ev), 0);
            return;
        }
        case Tsc::MsgCancelTransfer_t::MsgType: {
            Tsc::MsgCancelTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.cancelTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case Tsc::MsgProceedCall_t::MsgType: {
            Tsc::MsgProceedCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0, state = 0, why = 0;
            std::uint32_t code = model_.callState(ch, f.CallId, id, state, why);
            answer(rq,
                   code != 0                ? code
                   : state == call::Offered ? 0u
                                            : std::uint32_t{kErrBadState},
                   0);
            return;
        }
        case Tsc::MsgGetCallState_t::MsgType: {
            Tsc::MsgGetCallState_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetCallStateCmplt_t res;
            std::uint32_t code =
                model_.callState(ch, f.CallId, res.CallId, res.CallState, res.Reason);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            reply(rq, Tsc::MsgGetCallStateCmplt_t::MsgType, &res);
            return;
        }
        case Tsc::MsgGetChanState_t::MsgType: {
            Tsc::MsgGetChanStateCmplt_t res;
            res.ChanState = ch.chanState;
            reply(rq, Tsc::MsgGetChanStateCmplt_t::MsgType, &res);
            return;
        }
        case Tsc::MsgSetChanState_t::MsgType: {
            Tsc::MsgSetChanState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setChanState(ch, f.State, ev), Tsc::MsgSetChanStateCmplt_t::MsgType);
            return;
        }
        case Tsc::MsgResetLineDevice_t::MsgType:
            answer(rq, model_.reset(ch, ev), Tsc::MsgResetLineDeviceCmplt_t::MsgType);
            return;
        case Tsc::MsgDial_t::MsgType: {
            Tsc::MsgDial_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t code = model_.dial(ch, f.CallId);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, Tsc::MsgDialCmplt_t::MsgType, &res);
            return;
        }
        case Tsc::MsgSendISDN_t::MsgType: {
            Tsc::MsgSendISDN_t f;
            (void)f.readMsg(&rq.msg, 0);
            if (ch.line->signaling != static_cast<int>(farm::Signaling::CCS)) {
                refuse(rq, kErrNotSupported);
                return;
            }
            answer(rq, model_.dial(ch, f.CallId), Tsc::MsgSendISDNCmplt_t::MsgType);
            return;
        }
        case Tsc::MsgAttach_t::MsgType: {
            Tsc::MsgAttach_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::vector<std::pair<std::uint32_t, Address>> media;
            unsigned int n = std::min<unsigned int>(f.Count, f.MediaInfo.length());
            for (unsigned int i = 0; i < n; ++i) {
                Address a = fromCD(f.MediaInfo[i]->InstDesc);
                if (!farm::resolve(model_.farm(), a)) {
                    refuse(rq, kErrNoSuchComponent);
                    return;
                }
                media.emplace_back(f.MediaInfo[i]->ComponentType, a);
            }
            answer(rq, model_.attachMedia(ch, std::move(media), ev),
                   Tsc::MsgAttachCmplt_t::MsgType);
            return;
        }
        case Tsc::MsgDetach_t::MsgType:
            answer(rq, model_.detachMedia(ch, ev), Tsc::MsgDetachCmplt_t::MsgType);
            return;
        case Tsc::MsgSetAlarmMask_t::MsgType: {
            Tsc::MsgSetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            alarmMasks_[addressKey(rq.tgt)] = f.Alarm_mask;
            reply(rq, Tsc::MsgSetAlarmMaskCmplt_t::MsgType, nullptr);
            return;
        }
        case Tsc::MsgGetAlarmMask_t::MsgType: {
            Tsc::MsgGetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetAlarmMaskCmplt_t res;
            res.Linenum = f.Linenum;
            auto it = alarmMasks_.find(addressKey(rq.tgt));
            res.Alarm_mask = it == alarmMasks_.end() ? 0x46 : it->second;
            reply(rq, Tsc::MsgGetAlarmMaskCmplt_t::MsgType, &res);
            return;
        }
        case Tsc::MsgGCExtension_t::MsgType:
            reply(rq, Tsc::MsgGCExtensionCmplt_t::MsgType, nullptr);
            return;
        case Tsc::MsgTxRxSignalingGet_t::MsgType: {
            Tsc::MsgTxRxSignalingGetCmplt_t res;
            // Off hook while a call holds the channel, on hook otherwise.
            res.signalbits = ch.call ? 0x0F : 0x00;
            reply(rq, Tsc::MsgTxRxSignalingGetCmplt_t::MsgType, &res);
            return;
        }
        default:
            unanswerable(rq, "a call control message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
