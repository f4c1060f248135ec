#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `stoprai`: Stops transmitting the remote alarm indication.
class StopTxRAICmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
