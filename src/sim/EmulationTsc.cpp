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
        case 0x1214: {
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
            reply(rq, 0x1215, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case 0x1201: {
            Tsc::MsgAnswerCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.answerCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1200: {
            Tsc::MsgAcceptCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.acceptCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x120A: {
            Tsc::MsgDropCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.dropCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x121C: {
            Tsc::MsgReleaseCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.releaseCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x121D: {
            Tsc::MsgRejectCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.rejectCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x1211: {
            Tsc::MsgHoldCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.holdCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x121E: {
            Tsc::MsgRetrieveCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.retrieveCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1202: {
            Tsc::MsgBlindTransferCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.blindTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1212: {
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
            reply(rq, 0x1213, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case 0x1207: {
            Tsc::MsgCompleteTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.completeTransfer(ch, f.CallId, f.ConCallId, ev), 0);
            return;
        }
        case 0x1203: {
            Tsc::MsgCancelTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.cancelTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case 0x122D: {
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
        case 0x120D: {
            Tsc::MsgGetCallState_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetCallStateCmplt_t res;
            std::uint32_t code =
                model_.callState(ch, f.CallId, res.CallId, res.CallState, res.Reason);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            reply(rq, 0x120E, &res);
            return;
        }
        case 0x120F: {
            Tsc::MsgGetChanStateCmplt_t res;
            res.ChanState = ch.chanState;
            reply(rq, 0x1210, &res);
            return;
        }
        case 0x121F: {
            Tsc::MsgSetChanState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setChanState(ch, f.State, ev), 0x1220);
            return;
        }
        case 0x1246:
            answer(rq, model_.reset(ch, ev), 0x1247);
            return;
        case 0x1224: {
            Tsc::MsgDial_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t code = model_.dial(ch, f.CallId);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, 0x1225, &res);
            return;
        }
        case 0x1222: {
            Tsc::MsgSendISDN_t f;
            (void)f.readMsg(&rq.msg, 0);
            if (ch.line->signaling != static_cast<int>(farm::Signaling::CCS)) {
                refuse(rq, kErrNotSupported);
                return;
            }
            answer(rq, model_.dial(ch, f.CallId), 0x1223);
            return;
        }
        case 0x1234: {
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
            answer(rq, model_.attachMedia(ch, std::move(media), ev), 0x1235);
            return;
        }
        case 0x1236:
            answer(rq, model_.detachMedia(ch, ev), 0x1237);
            return;
        case 0x1242: {
            Tsc::MsgSetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            alarmMasks_[addressKey(rq.tgt)] = f.Alarm_mask;
            reply(rq, 0x1243, nullptr);
            return;
        }
        case 0x1244: {
            Tsc::MsgGetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetAlarmMaskCmplt_t res;
            res.Linenum = f.Linenum;
            auto it = alarmMasks_.find(addressKey(rq.tgt));
            res.Alarm_mask = it == alarmMasks_.end() ? 0x46 : it->second;
            reply(rq, 0x1245, &res);
            return;
        }
        case 0x1248:
            reply(rq, 0x1249, nullptr);
            return;
        case 0x124E: {
            Tsc::MsgTxRxSignalingGetCmplt_t res;
            // Off hook while a call holds the channel, on hook otherwise.
            res.signalbits = ch.call ? 0x0F : 0x00;
            reply(rq, 0x124F, &res);
            return;
        }
        default:
            unanswerable(rq, "a call control message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
