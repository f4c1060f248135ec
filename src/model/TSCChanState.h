#pragma once

#include "catalogue/tsc/TSC.h"
#include "model/EventPublication.h"

namespace vx7diag {

class TSCChanState : public EventPublication<TSCChanState, tolk::TSC::EvtChanState_t> {
  public:
    static constexpr int ComponentKind = VX7EventPublisher::TSC_COMPONENT;
    static constexpr unsigned int GroupNumber = tolk::TSC::EvtChanState_t::EvtGroup_;

    ~TSCChanState() override;
    tolk::staticList<unsigned int> EventTypeList() const override;
    void Format(char* text);
};

}  // namespace vx7diag
