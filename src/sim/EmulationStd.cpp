// The standard operations every component takes: parameters, the one-way and plain
// acknowledged commands, and the subscription commands, which go on to their own unit.
#include <algorithm>

#include "catalogue/generated/stdresource_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Std = tolk::StdResource_Bodies;

bool Emulation::parmValue(const farm::Resource& r, std::uint32_t num, std::uint32_t& val) const {
    const farm::Board* b = model_.farm().board(r.board);
    if (num == kParmRouting) {
        val = b && b->flexible() ? 1 : 0;
        return true;
    }
    if (r.kind == farm::ResourceKind::Lcon && (num == kParmTrunkType || num == kParmSignaling)) {
        const farm::Trunk* t = b ? b->trunk(r.trunk) : nullptr;
        if (!t) {
            return false;
        }
        val = num == kParmTrunkType ? static_cast<std::uint32_t>(t->type)
              : t->analog()         ? static_cast<std::uint32_t>(farm::Signaling::CAS)
                                    : static_cast<std::uint32_t>(t->signaling);
        return true;
    }
    return false;
}

void Emulation::handleStd(Request& rq, const farm::Resource& r) {
    std::uint64_t key = addressKey(rq.tgt);
    switch (rq.type) {
        case 0x01:
        case 0x06:
            return;  // one-way
        case 0x02:
        case 0x04:
            reply(rq, rq.type + 1, nullptr);
            return;
        case 0x08: {
            Std::MsgSetParm_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t v;
            if (parmValue(r, f.Parm, v)) {
                refuse(rq, kErrBadParameter);  // the board's own parameters are read only
                return;
            }
            parms_[key][f.Parm] = f.Val;
            reply(rq, 0x09, nullptr);
            return;
        }
        case 0x0A: {
            Std::MsgSetxParms_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.Parms.length());
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t v;
                if (parmValue(r, f.Parms[i]->Parm, v)) {
                    refuse(rq, kErrBadParameter);
                    return;
                }
            }
            for (unsigned int i = 0; i < n; ++i) {
                parms_[key][f.Parms[i]->Parm] = f.Parms[i]->Val;
            }
            reply(rq, 0x0B, nullptr);
            return;
        }
        case 0x0C: {
            Std::MsgSetParmDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            parms_[key].erase(f.Parm);
            reply(rq, 0x0D, nullptr);
            return;
        }
        case 0x0E: {
            Std::MsgSetxParmsDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.Parms.length());
            for (unsigned int i = 0; i < n; ++i) {
                parms_[key].erase(f.Parms[i]->Parm);
            }
            reply(rq, 0x0F, nullptr);
            return;
        }
        case 0x10:
            parms_.erase(key);
            reply(rq, 0x11, nullptr);
            return;
        case 0x12: {
            Std::MsgGetParm_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t v = 0;
            bool known = parmValue(r, f.Num, v);
            if (!known) {
                auto p = parms_.find(key);
                if (p != parms_.end() && p->second.count(f.Num)) {
                    v = p->second[f.Num];
                    known = true;
                }
            }
            if (!known) {
                refuse(rq, kErrBadParameter);
                return;
            }
            Std::MsgGetParmCmplt_t res;
            res.Num = f.Num;
            res.Val = v;
            res.TextSize = 0;
            reply(rq, 0x13, &res);
            return;
        }
        case 0x14: {
            Std::MsgGetxParms_t f;
            (void)f.readMsg(&rq.msg, 0);
            Std::MsgGetxParmsCmplt_t res;
            unsigned int n = std::min(f.Count, f.Parms.length());
            res.Parms.realloc(n);
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t num = f.Parms[i]->Parm, v = 0;
                bool known = parmValue(r, num, v);
                auto p = parms_.find(key);
                if (!known && p != parms_.end() && p->second.count(num)) {
                    v = p->second[num];
                    known = true;
                }
                if (!known) {
                    refuse(rq, kErrBadParameter);
                    return;
                }
                res.Parms[i]->Parm = num;
                res.Parms[i]->Val = v;
            }
            res.Count = n;
            reply(rq, 0x15, &res);
            return;
        }
        case 0x16:
        case 0x18:
        case 0x1A:
        case 0x1C:
        case 0x1E:
            handleSubscription(rq);
            return;
        case 0x21:
        case 0x23:
        case 0x25:
        case 0x27:
        case 0x29:
            reply(rq, rq.type + 1, nullptr);
            return;
        default:
            unanswerable(rq, "not a standard message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
