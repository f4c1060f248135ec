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
        case Std::MsgAck_t::MsgType:
        case Std::MsgExit_t::MsgType:
            return;  // one-way
        case Std::MsgComtest_t::MsgType:
        case Std::MsgInit_t::MsgType:
            reply(rq, rq.type + 1, nullptr);
            return;
        case Std::MsgSetParm_t::MsgType: {
            Std::MsgSetParm_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t v;
            if (parmValue(r, f.Parm, v)) {
                refuse(rq, kErrBadParameter);  // the board's own parameters are read only
                return;
            }
            parms_[key][f.Parm] = f.Val;
            reply(rq, Std::MsgSetParmCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgSetxParms_t::MsgType: {
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
            reply(rq, Std::MsgSetxParmsCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgSetParmDef_t::MsgType: {
            Std::MsgSetParmDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            parms_[key].erase(f.Parm);
            reply(rq, Std::MsgSetParmDefCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgSetxParmsDef_t::MsgType: {
            Std::MsgSetxParmsDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.Parms.length());
            for (unsigned int i = 0; i < n; ++i) {
                parms_[key].erase(f.Parms[i]->Parm);
            }
            reply(rq, Std::MsgSetxParmsDefCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgSetAllParmsDef_t::MsgType:
            parms_.erase(key);
            reply(rq, Std::MsgSetAllParmsDefCmplt_t::MsgType, nullptr);
            return;
        case Std::MsgGetParm_t::MsgType: {
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
            reply(rq, Std::MsgGetParmCmplt_t::MsgType, &res);
            return;
        }
        case Std::MsgGetxParms_t::MsgType: {
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
            reply(rq, Std::MsgGetxParmsCmplt_t::MsgType, &res);
            return;
        }
        case Std::MsgDetectEvt_t::MsgType:
        case Std::MsgDetectxEvts_t::MsgType:
        case Std::MsgCancelEvt_t::MsgType:
        case Std::MsgCancelxEvts_t::MsgType:
        case Std::MsgCancelAllEvts_t::MsgType:
            handleSubscription(rq);
            return;
        case Std::MsgArmRTC_t::MsgType:
        case Std::MsgArmxRTCs_t::MsgType:
        case Std::MsgDisarmRTC_t::MsgType:
        case Std::MsgDisarmxRTCs_t::MsgType:
        case Std::MsgDisarmAllRTCs_t::MsgType:
            reply(rq, rq.type + 1, nullptr);
            return;
        default:
            unanswerable(rq, "not a standard message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
