#pragma once

#include "catalogue/OpText.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Line control of one digital trunk: line state, loopback, alarms, faults and metrics.
class LCON : public Instance, public LCON_Bodies {
  public:
    // Both register a null handler for the completion of StartSetLineState.
    LCON(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit LCON(const Instance& other);
    LCON(const LCON& other);
    LCON& operator=(const LCON&) = delete;
    ~LCON() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    // The operation families, from the schema.
#include "catalogue/generated/lcon_ops.h"

  private:
    void registerNullHandlers();
};

}  // namespace tolk
