#pragma once

#include "catalogue/tsc/TSC.h"
#include "model/EventPublication.h"

namespace vx7diag {

class TSCCallInfo : public EventPublication<TSCCallInfo, tolk::TSC::EvtCallInfo_t> {
  public:
    static constexpr int ComponentKind = VX7EventPublisher::TSC_COMPONENT;
    static constexpr unsigned int GroupNumber = tolk::TSC::EvtCallInfo_t::EvtGroup_;

    ~TSCCallInfo() override;
    tolk::staticList<unsigned int> EventTypeList() const override;
    char* ToZLG() override;
    void Format(char* text);
};

}  // namespace vx7diag
