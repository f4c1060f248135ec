#pragma once

#include "model/Observer.h"
#include "transport/IsaSync.h"

namespace vx7diag {

// Writes every event it is told of to the trace library and to standard output.
class VX7EventZLGLogger : public Observer {
  public:
    static constexpr unsigned int MaxStringLength = 256;

    VX7EventZLGLogger();
    ~VX7EventZLGLogger() override;
    void Update(Subject* subject, Aspect& aspect) override;

    unsigned int GetModuleHandle() const { return moduleHandle; }
    unsigned int GetLabelHandle() const { return labelHandle; }

  private:
    unsigned int moduleHandle = 0;
    unsigned int labelHandle = 0;
    isa::CriticalSection lock;
};

}  // namespace vx7diag
