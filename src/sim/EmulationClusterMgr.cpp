// The board's cluster manager: cluster searches, and a component's cluster.
#include "catalogue/generated/clustermgr_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Cm = tolk::ClusterMgr_Bodies;

void Emulation::handleClusterMgr(Request& rq, const farm::Resource&) {
    switch (rq.type) {
        case Cm::ClusterFind_t::MsgType: {
            Cm::ClusterFind_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start{kAnyInstance, rq.tgt.board, 0, 0, 0};
            const Component* c = findComponent(start, nullptr, 0, f.attr, f.count);
            if (!c || f.count == 0) {
                refuse(rq, kErrNoSuchCluster);
                return;
            }
            Cm::ClusterResult_t res;
            res.desc = toCD(c->cluster);
            reply(rq, Cm::ClusterResult_t::MsgType, &res);
            return;
        }
        case Cm::ClusterCompByAttr_t::MsgType: {
            Cm::ClusterCompByAttr_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address cluster = fromCD(f.ClustDesc);
            Address start{kAnyInstance, cluster.board, 0, 0, 0};
            const Component* c = findComponent(start, &cluster, f.CompType, f.Attrs, f.Count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Cm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, Cm::ComponentResult_t::MsgType, &res);
            return;
        }
        case Cm::ClusterByComp_t::MsgType: {
            Cm::ClusterByComp_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address want = fromCD(f.desc);
            auto it = components_.find(want.board);
            if (it != components_.end()) {
                for (const Component& c : it->second) {
                    if (c.addr == want) {
                        Cm::ClusterResult_t res;
                        res.desc = toCD(c.cluster);
                        reply(rq, Cm::ClusterResult_t::MsgType, &res);
                        return;
                    }
                }
            }
            refuse(rq, kErrNoSuchCluster);
            return;
        }
        case Cm::ClusterDestroy_t::MsgType:
        case Cm::ClusterFree_t::MsgType:
            return;  // one-way; the farm's clusters stay
        default:
            unanswerable(rq, "not a cluster manager message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
