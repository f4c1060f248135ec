#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `trunk`: Opens a trunk view on the line and starts it.
class NewTrunkCmd : public Command {
  public:
    NewTrunkCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
