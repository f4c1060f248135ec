// A channel's CAS signalling: plays only what a diagnostic asks of it.
#include "catalogue/generated/cas_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Cas = tolk::CAS_Bodies;

void Emulation::handleCas(Request& rq, const farm::Resource&) {
    switch (rq.type) {
        case Cas::MsgDisableSignal_t::MsgType:
        case Cas::MsgEnableSignal_t::MsgType:
        case Cas::MsgGenerateSignal_t::MsgType:
            reply(rq, rq.type + 1, nullptr);
            return;
        case Cas::MsgStopSignal_t::MsgType:
            return;  // one-way
        case Cas::MsgDial_t::MsgType: {
            Cas::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, Cas::MsgDialCmplt_t::MsgType, &res);
            return;
        }
        case Cas::MsgMatchCondition_t::MsgType: {
            Cas::MsgMatchCondition_t f;
            (void)f.readMsg(&rq.msg, 0);
            Cas::MsgMatchConditionCmplt_t res;
            res.SignalId = f.SignalId;
            res.Condition = f.Condition;
            res.Match = 0;
            reply(rq, Cas::MsgMatchConditionCmplt_t::MsgType, &res);
            return;
        }
        default:
            unanswerable(rq, "a signalling message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
