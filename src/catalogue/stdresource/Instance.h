#pragma once

#include "catalogue/stdresource/StdResource.h"

namespace tolk {

class TmpInstance;

// A resource claimed from the board's resource manager for the proxy's lifetime.
class Instance : public StdResource {
  public:
    // Claims with use(0); the flags are set only once the claim succeeded, so a refused
    // claim leaves nothing to undo.
    Instance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    // withMgr 0: no manager and no claim.
    Instance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue, int withMgr);
    explicit Instance(const StdResource& other);
    // Copies claim nothing.
    Instance(const Instance& other);
    Instance(const TmpInstance& other, int);
    Instance& operator=(const Instance&) = delete;
    ~Instance() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;
    // Where the lookups of the component classes end: the numbers of every resource.
    MsgBody* superMsgBodyLookup(unsigned int type);
    MsgBody* superEvtBodyLookup(unsigned int group);
};

// A proxy that never unclaims, frees or cancels anything on the board.
class TmpInstance : public Instance {
  public:
    TmpInstance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    TmpInstance(const TmpInstance& other);
    TmpInstance& operator=(const TmpInstance&) = delete;
    ~TmpInstance() override;
};

}  // namespace tolk
