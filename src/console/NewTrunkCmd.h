#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `trunk`: Opens a trunk view on the line and starts it.
class NewTrunkCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
