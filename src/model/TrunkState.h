#pragma once

#include "catalogue/lcon/LCON.h"
#include "model/EventPublication.h"

namespace vx7diag {

class TrunkState : public EventPublication<TrunkState, tolk::LCON::Evt_0x1611_t> {
  public:
    static constexpr int ComponentKind = VX7EventPublisher::LCON_COMPONENT;
    static constexpr unsigned int GroupNumber = tolk::LCON::Evt_0x1611_t::EvtGroup_;

    ~TrunkState() override;
    void Format(char* text);
};

}  // namespace vx7diag
