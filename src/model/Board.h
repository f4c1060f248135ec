#pragma once

#include "catalogue/cluster/Cluster.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/cluster/Component.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "framework/Addressable.h"

namespace tolk {

// One board: its address (the board number, every other field 0), its resource manager and its
// cluster manager, and the searches the model makes through them.
class Board : public Addressable {
  public:
    explicit Board(unsigned int boardNumber);
    Board(unsigned int boardNumber, isa::RefPtr<MsgQueue>& queue);
    Board(const Board&) = delete;
    Board& operator=(const Board&) = delete;
    ~Board() override;

    void MsgQueueAttach(const isa::RefPtr<MsgQueue>& queue) override;
    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    Component findComp(unsigned char type, unsigned char instance);
    Cluster findClustByLCON(unsigned int lconNumber);
    Cluster findClustByTSC(unsigned int trunk, unsigned int channel);

    ResourceMgr* GetResourceMgr() const { return resourceMgr; }
    ClusterMgr* GetClusterMgr() const { return clusterMgr; }

  private:
    static CompDesc_t Address(unsigned int boardNumber);

    ResourceMgr* resourceMgr = nullptr;
    ClusterMgr* clusterMgr = nullptr;
};

}  // namespace tolk
