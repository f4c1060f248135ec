#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `phone`: Opens a phone view on the channel and starts it.
class NewPhoneCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
