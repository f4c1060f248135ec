#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `startrai`: Starts transmitting the remote alarm indication.
class StartTxRAICmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
