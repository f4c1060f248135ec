#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `disablelbk`: Ends either loopback.
class DisableLoopBackCmd : public Command {
  public:
    DisableLoopBackCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
