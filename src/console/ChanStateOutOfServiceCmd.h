#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `chan_oos`: Takes the channel out of service (state 257).
class ChanStateOutOfServiceCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
