// A channel's CAS signalling: plays only what a diagnostic asks of it.
#include "catalogue/generated/cas_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Cas = tolk::CAS_Bodies;

void Emulation::handleCas(Request& rq, const farm::Resource&) {
    switch (rq.type) {
        case 0x1407:
        case 0x1409:
        case 0x140B:
            reply(rq, rq.type + 1, nullptr);
            return;
        case 0x140D:
            return;  // one-way
        case 0x1415: {
            Cas::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, 0x1416, &res);
            return;
        }
        case 0x1417: {
            Cas::MsgMatchCondition_t f;
            (void)f.readMsg(&rq.msg, 0);
            Cas::MsgMatchConditionCmplt_t res;
            res.SignalId = f.SignalId;
            res.Condition = f.Condition;
            res.Match = 0;
            reply(rq, 0x1418, &res);
            return;
        }
        default:
            unanswerable(rq, "a signalling message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
