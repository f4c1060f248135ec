#pragma once

#include "catalogue/generated/chp_bodies.h"
#include "catalogue/stdresource/StdResource.h"

namespace tolk {

// A protocol component of a channel: only subscribed to, never commanded. It knows its two
// events and no message number at all.
class CHP : public StdResource, public CHP_Bodies {
  public:
    CHP(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit CHP(const StdResource& other);
    CHP(const CHP& other);
    CHP& operator=(const CHP&) = delete;
    ~CHP() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;
};

}  // namespace tolk
