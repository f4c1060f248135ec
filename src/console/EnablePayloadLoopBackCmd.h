#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `payloadlbk`: Switches the line to payload loopback.
class EnablePayloadLoopBackCmd : public Command {
  public:
    EnablePayloadLoopBackCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
