#pragma once

#include "catalogue/stdresource/StdResource.h"

namespace tolk {

// A resource of any type, with the standard operations only.
class Component : public StdResource {
  public:
    Component(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit Component(const StdResource& other);
    Component(const Component& other);
    Component& operator=(const Component&) = delete;
    ~Component() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;
};

}  // namespace tolk
