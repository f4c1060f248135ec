#pragma once

#include "catalogue/lcon/LCON.h"
#include "model/EventPublication.h"

namespace vx7diag {

class AllAlarms : public EventPublication<AllAlarms, tolk::LCON::Evt_0x1600_t> {
  public:
    static constexpr int ComponentKind = VX7EventPublisher::LCON_COMPONENT;
    static constexpr unsigned int GroupNumber = tolk::LCON::Evt_0x1600_t::EvtGroup_;

    ~AllAlarms() override;
    void Format(char* text);
};

}  // namespace vx7diag
