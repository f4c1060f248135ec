#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `deltrunk`: Stops the line's trunk view and clears its row.
class DeleteTrunkCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
