#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `startrai`: Starts transmitting the remote alarm indication.
class StartTxRAICmd : public Command {
  public:
    StartTxRAICmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
