#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `trunk_ins`: Puts the line in service; the TrunkState column shows the result.
class TrunkStateInServiceCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
