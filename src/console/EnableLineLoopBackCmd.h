#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `linelbk`: Switches the line to line loopback.
class EnableLineLoopBackCmd : public Command {
  public:
    EnableLineLoopBackCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
