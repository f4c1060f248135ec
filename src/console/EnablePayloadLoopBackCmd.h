#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `payloadlbk`: Switches the line to payload loopback.
class EnablePayloadLoopBackCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
