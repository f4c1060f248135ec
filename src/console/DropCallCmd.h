#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `drop`: Drops the call last shown on the channel's row.
class DropCallCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
