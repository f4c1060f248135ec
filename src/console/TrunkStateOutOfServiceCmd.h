#pragma once

#include "console/TrunkCommand.h"

namespace lineprobe {

// `trunk_oos`: Puts the line out of service; the TrunkState column shows the result.
class TrunkStateOutOfServiceCmd : public TrunkCommand {
  public:
    using TrunkCommand::TrunkCommand;

    using Command::Execute;
    int Execute(int board, int line) override;
};

}  // namespace lineprobe
