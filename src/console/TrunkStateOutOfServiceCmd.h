#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `trunk_oos`: Puts the line out of service; the TrunkState column shows the result.
class TrunkStateOutOfServiceCmd : public Command {
  public:
    TrunkStateOutOfServiceCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
