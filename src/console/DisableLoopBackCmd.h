#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `disablelbk`: Ends either loopback.
class DisableLoopBackCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
