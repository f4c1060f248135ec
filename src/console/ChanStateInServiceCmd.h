#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `chan_ins`: Takes the channel into service (state 256).
class ChanStateInServiceCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
