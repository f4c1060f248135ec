#pragma once

#include "console/Command.h"

namespace lineprobe {

class TrunkViewMgr;

// `stoprai`: Stops transmitting the remote alarm indication.
class StopTxRAICmd : public Command {
  public:
    StopTxRAICmd(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line) override;

  private:
    TrunkViewMgr* manager;
};

}  // namespace lineprobe
