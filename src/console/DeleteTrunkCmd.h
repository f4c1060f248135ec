#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `deltrunk`: Stops the line's trunk view and clears its row.
class DeleteTrunkCmd : public Command {
  public:
    DeleteTrunkCmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
