#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `linelbk`: Switches the line to line loopback.
class EnableLineLoopBackCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
