#pragma once

#include "catalogue/tsc/TSC.h"
#include "model/EventPublication.h"

namespace vx7diag {

class TSCCallState : public EventPublication<TSCCallState, tolk::TSC::EvtCallState_t> {
  public:
    static constexpr int ComponentKind = VX7EventPublisher::TSC_COMPONENT;
    static constexpr unsigned int GroupNumber = tolk::TSC::EvtCallState_t::EvtGroup_;

    ~TSCCallState() override;
    tolk::staticList<unsigned int> EventTypeList() const override;
    void Format(char* text);
};

}  // namespace vx7diag
