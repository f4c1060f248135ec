// A line's line control: line state, diagnostic mode, alarms and faults.
#include <algorithm>
#include <vector>

#include "catalogue/generated/lcon_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Lcon = tolk::LCON_Bodies;

void Emulation::handleLcon(Request& rq, const farm::Resource& r) {
    Line& line = *model_.line(r.board, r.trunk);
    std::vector<Event>& ev = scratch_;
    switch (rq.type) {
        case Lcon::MsgGetLineState_t::MsgType: {
            Lcon::MsgGetLineStateCmplt_t res;
            res.LineState = line.state;
            res.Reason = line.reason;
            reply(rq, Lcon::MsgGetLineStateCmplt_t::MsgType, &res);
            return;
        }
        case Lcon::MsgSetLineState_t::MsgType: {
            Lcon::MsgSetLineState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setLineState(line, f.State, f.Reason, ev),
                   Lcon::MsgSetLineStateCmplt_t::MsgType);
            return;
        }
        case Lcon::MsgTSPSetLineState_t::MsgType: {
            Lcon::MsgTSPSetLineState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setLineState(line, f.State, f.Reason, ev), 0);
            return;
        }
        case Lcon::MsgGetAlarms_t::MsgType: {
            Lcon::MsgGetAlarms_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::vector<std::uint32_t> ids;
            unsigned int n = std::min(f.Count, f.Alarms.length());
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t id = *f.Alarms[i];
                if (id == kGroupAlarms) {
                    const auto& all = Model::reportedAlarms();
                    ids.insert(ids.end(), all.begin(), all.end());
                } else {
                    ids.push_back(id);
                }
            }
            Lcon::MsgGetAlarmsCmplt_t res;
            res.AlarmInfo.realloc(static_cast<unsigned int>(ids.size()));
            for (unsigned int i = 0; i < ids.size(); ++i) {
                res.AlarmInfo[i]->Type = ids[i];
                res.AlarmInfo[i]->State = model_.alarmState(line, ids[i]);
            }
            res.Count = static_cast<unsigned int>(ids.size());
            reply(rq, Lcon::MsgGetAlarmsCmplt_t::MsgType, &res);
            return;
        }
        case Lcon::MsgGetFaults_t::MsgType: {
            Lcon::MsgGetFaults_t f;
            (void)f.readMsg(&rq.msg, 0);
            Lcon::MsgGetFaultsCmplt_t res;
            unsigned int n = std::min(f.Count, f.Faults.length());
            res.FaultInfo.realloc(n);
            for (unsigned int i = 0; i < n; ++i) {
                res.FaultInfo[i]->Type = *f.Faults[i];
                res.FaultInfo[i]->State = 0;
            }
            res.Count = n;
            reply(rq, Lcon::MsgGetFaultsCmplt_t::MsgType, &res);
            return;
        }
        case Lcon::MsgGetDiagMode_t::MsgType: {
            Lcon::MsgGetDiagModeCmplt_t res;
            res.DiagnosticMode = line.diagMode;
            reply(rq, Lcon::MsgGetDiagModeCmplt_t::MsgType, &res);
            return;
        }
        case Lcon::MsgSetDiagMode_t::MsgType: {
            Lcon::MsgSetDiagMode_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setDiagMode(line, f.Mode, ev), Lcon::MsgSetDiagModeCmplt_t::MsgType);
            return;
        }
        case Lcon::MsgSendAlarm_t::MsgType: {
            Lcon::MsgSendAlarm_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.sendAlarm(line, f.AlarmId, ev), Lcon::MsgSendAlarmCmplt_t::MsgType);
            return;
        }
        case Lcon::MsgStopAlarm_t::MsgType: {
            Lcon::MsgStopAlarm_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.stopAlarm(line, f.AlarmId, ev), 0);
            return;
        }
        case Lcon::MsgConfigureLine_t::MsgType:
        case Lcon::MsgTSPSetProtocol_t::MsgType:
        case Lcon::MsgReConfigureLine_t::MsgType:
            reply(rq, rq.type + 1, nullptr);
            return;
        default:
            unanswerable(rq, "a line control message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
