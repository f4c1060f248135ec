#pragma once

#include "catalogue/tsc/TSC.h"

namespace tolk {

// A TSC whose one-way commands return almost at once: its error wait is 1 ms.
class TSCAsync : public TSC {
  public:
    static constexpr unsigned int AsyncErrorWaitTime = 1;

    TSCAsync(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit TSCAsync(const Instance& other);
    ~TSCAsync() override;
};

}  // namespace tolk
