#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `destaddr`: Sets the number the phone's next calls go to.
class DestAddrCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan, char* text) override;
};

}  // namespace lineprobe
