#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `trunk_ins`: Puts the line in service; the TrunkState column shows the result.
class TrunkStateInServiceCmd : public Command {
  public:
    TrunkStateInServiceCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
