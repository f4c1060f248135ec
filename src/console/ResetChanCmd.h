#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `reset`: Resets the channel (state 256).
class ResetChanCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
