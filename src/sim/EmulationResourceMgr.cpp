// The board's resource manager: component searches and allocations, use and unuse.
#include <algorithm>

#include "catalogue/generated/resourcemgr_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Rm = tolk::ResourceMgr_Bodies;

void Emulation::handleResourceMgr(Request& rq, const farm::Resource&) {
    switch (rq.type) {
        case Rm::CompFind_t::MsgType: {
            Rm::CompFind_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start = fromCD(f.CompStart);
            start.board = rq.tgt.board;
            std::uint8_t type = f.CompStart.component == 255 ? 0 : f.CompStart.component;
            const Component* c = findComponent(start, nullptr, type, f.attr, f.count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Rm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, Rm::ComponentResult_t::MsgType, &res);
            return;
        }
        case Rm::CompInstAllocate_t::MsgType: {
            Rm::CompInstAllocate_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start = fromCD(f.CompStart);
            start.board = rq.tgt.board;
            Address cluster = fromCD(f.ClustDesc);
            bool anyCluster = f.ClustDesc.instance == 0xFFFF;
            std::uint8_t type = f.CompStart.component == 255 ? 0 : f.CompStart.component;
            const Component* c =
                findComponent(start, anyCluster ? nullptr : &cluster, type, f.attr, f.count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Rm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, Rm::ComponentResult_t::MsgType, &res);
            return;
        }
        case Rm::CompUse_t::MsgType:
        case Rm::CompUnuse_t::MsgType: {
            // Every component of the farm exists from the start, so use and unuse only check
            // that what they name is there.
            Rm::CompUnuse_t u;
            (void)u.readMsg(&rq.msg, 0);
            unsigned int n = rq.type == Rm::CompUse_t::MsgType
                                 ? 0
                                 : std::min<unsigned int>(u.Count, u.List.length());
            if (rq.type == Rm::CompUse_t::MsgType) {
                Rm::CompUse_t use;
                (void)use.readMsg(&rq.msg, 0);
                n = std::min<unsigned int>(use.Count, use.List.length());
                for (unsigned int i = 0; i < n; ++i) {
                    if (!farm::resolve(model_.farm(), fromCD(use.List[i]->desc))) {
                        refuse(rq, kErrNoSuchComponent);
                        return;
                    }
                }
            } else {
                for (unsigned int i = 0; i < n; ++i) {
                    if (!farm::resolve(model_.farm(), fromCD(u.List[i]->desc))) {
                        refuse(rq, kErrNoSuchComponent);
                        return;
                    }
                }
            }
            reply(rq, Rm::ResultComplete_t::MsgType, nullptr);
            return;
        }
        case Rm::CompInstFree_t::MsgType:
            return;  // one-way: the farm's components are never really freed
        default:
            unanswerable(rq, "not a resource manager message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
