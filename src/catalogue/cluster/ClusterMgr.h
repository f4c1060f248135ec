#pragma once

#include "catalogue/cluster/Cluster.h"
#include "catalogue/generated/clustermgr_bodies.h"
#include "framework/Addressable.h"
#include "framework/CompAttr_t.h"

namespace tolk {

// Client of a board's cluster service, which stands at instance 8, processor 1, component 0
// of the owner's board and node.
class ClusterMgr : public Addressable, public ClusterMgr_Bodies {
  public:
    explicit ClusterMgr(const Addressable* owner);
    ClusterMgr(const ClusterMgr&) = delete;
    ClusterMgr& operator=(const ClusterMgr&) = delete;

    MsgBody* MsgBodyLookup(unsigned int type) override;

    // Accepts the answer from any source: the cluster, not the service, may reply.
    Cluster find(staticList<CompAttr_t> attrs);
    Cluster findByTSC(unsigned int trunk, unsigned int channel);
    Cluster findByTSC(unsigned int trunk, unsigned int channel, staticList<CompAttr_t> attrs);
    Cluster findByLCON(unsigned int line);
    Cluster findByLCON(unsigned int line, staticList<CompAttr_t> attrs);

    // The operation families, from the schema.
#include "catalogue/generated/clustermgr_ops.h"
};

}  // namespace tolk
