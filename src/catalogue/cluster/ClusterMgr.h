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

    void ClusterFindInst(ClusterCompByAttr_t* body, ComponentResult_t* ret);
    void ClusterFindInst(CompDesc_t& ClustDesc, unsigned char& CompType,
                         staticList<CompAttr_t>& Attrs, ComponentResult_t* ret);
    void ClusterFindInst(CompDesc_t& ClustDesc, unsigned char& CompType,
                         staticList<CompAttr_t>& Attrs, unsigned char Count,
                         ComponentResult_t* ret);
    void ClusterCreate(ClusterCreate_t* body, ClusterResult_t* ret);
    void ClusterCreate(ClusterResult_t* ret);
    void ClusterDestroy(ClusterDestroy_t* body);
    void ClusterDestroy(CompDesc_t& ClustDesc);
    void ClusterFree(ClusterFree_t* body);
    void ClusterFree(CompDesc_t& ClustDesc);
    void ClusterFindByComp(ClusterByComp_t* body, ClusterResult_t* ret);
    void ClusterFindByComp(CompDesc_t& desc, ClusterResult_t* ret);
};

}  // namespace tolk
