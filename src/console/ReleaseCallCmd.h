#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `release`: Releases the call last shown on the channel's row.
class ReleaseCallCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
