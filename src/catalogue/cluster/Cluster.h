#pragma once

#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/stdresource/Instance.h"
#include "framework/Addressable.h"
#include "framework/CompAttr_t.h"

namespace tolk {

class ClusterMgr;
class ResourceMgr;

// One cluster of a board: finds the instances in it, activates ports, assigns time slots.
class Cluster : public Addressable, public Cluster_Bodies {
  public:
    Cluster(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit Cluster(const Addressable& other);
    Cluster(const Cluster& other);
    Cluster& operator=(const Cluster&) = delete;
    ~Cluster() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;

    // `type` 0 adds no attribute; the result neither claims nor frees the instance.
    TmpInstance find(unsigned char type);
    TmpInstance find(unsigned char type, staticList<CompAttr_t> attrs);
    // As find, but allocates from the resource manager when the search fails in any way.
    TmpInstance findAutoAllocate(unsigned char type);
    TmpInstance findAutoAllocate(unsigned char type, staticList<CompAttr_t> attrs);
    TmpInstance allocateInst(unsigned char type, staticList<CompAttr_t> attrs);

    // The operation families, from the schema.
#include "catalogue/generated/cluster_ops.h"

    // A null talker sends all-ones in talkerDesc.
    void Activate(unsigned int portId, Addressable* talker, unsigned char options);
    void TSAssign(unsigned int portId, staticList<unsigned short>& slotIds, unsigned char encoding,
                  unsigned char idlePattern);
    // Null out-arguments are skipped.
    void TSInfo(unsigned int portId, unsigned char* width, unsigned char* encoding,
                unsigned char* idlePattern, staticList<unsigned short>* slotIds);
    // One-way, like the emulated and real service: no completion is awaited. A null instance
    // stands for the cluster itself.
    void Connect(unsigned int portId1, unsigned int portId2, Addressable* a, Addressable* b);
    void Disconnect(unsigned int portId1, unsigned int portId2, Addressable* a, Addressable* b);
    void ClusterCompInfo(staticList<CompDesc_t>* out, CompDesc_t ClustDesc);

    ClusterMgr* getClusterMgr() const {
        return clusterMgr;
    }
    ResourceMgr* getResourceMgr() const {
        return resourceMgr;
    }

  protected:
    // Nothing in the system sets it; when set, the destructor destroys the cluster on the board.
    int destroyOnDelete = 0;
    ClusterMgr* clusterMgr = nullptr;
    ResourceMgr* resourceMgr = nullptr;

  private:
    void makeManagers();
};

}  // namespace tolk
