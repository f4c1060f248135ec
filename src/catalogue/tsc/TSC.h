#pragma once

#include "catalogue/OpText.h"
#include "catalogue/generated/tsc_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Call control of one board channel. One-way commands return after the error wait; the
// outcome arrives later as an event.
class TSC : public Instance, public TSC_Bodies {
  public:
    // Both register a null handler for the completion of StartSetChanState.
    TSC(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit TSC(const Instance& other);
    TSC(const TSC& other);
    TSC& operator=(const TSC&) = delete;
    ~TSC() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    using Text = staticList<char>;

    // The operation families, from the schema.
#include "catalogue/generated/tsc_ops.h"

    // Sent under the standard number of DetectEvt with this component's body; group, RetAddr
    // and id as DetectEvt gives them.
    void DetectEvtSet(unsigned int EvtType, staticList<unsigned int>& Set, unsigned int EvtGroup,
                      Addressable* target);

  private:
    void registerNullHandlers();
};

}  // namespace tolk
