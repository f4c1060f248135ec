#pragma once

#include "catalogue/generated/resourcemgr_bodies.h"
#include "catalogue/stdresource/Instance.h"
#include "framework/Addressable.h"
#include "framework/CompAttr_t.h"

namespace tolk {

class Cluster;

// Client of a board's resource service, which stands at instance 5, processor 1,
// component 0 of the owner's board and node.
class ResourceMgr : public Addressable, public ResourceMgr_Bodies {
  public:
    explicit ResourceMgr(const Addressable* owner);
    ResourceMgr(const ResourceMgr&) = delete;
    ResourceMgr& operator=(const ResourceMgr&) = delete;

    MsgBody* MsgBodyLookup(unsigned int type) override;

    // `type` 0 adds no attribute; any other adds (0, type) behind the caller's attributes.
    StdResource find(unsigned int type, unsigned char processor, unsigned short instance,
                     staticList<CompAttr_t> attrs = staticList<CompAttr_t>());
    // A null cluster sends a ClustDesc with every field at its maximum. The result is set to
    // be freed on destruction.
    TmpInstance allocate(unsigned int type, unsigned char processor, unsigned short instance,
                         Cluster* cluster, staticList<CompAttr_t> attrs = staticList<CompAttr_t>());
    // One-way: a refusal inside the error wait raises, silence is success.
    void free(StdResource* resource);
    void use(StdResource* resource, unsigned int payload);
    void unuse(StdResource* resource);

    // The operation families, from the schema.
#include "catalogue/generated/resourcemgr_ops.h"
};

}  // namespace tolk
