#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `origaddr`: Sets the number the phone's next calls come from. Takes a good address silently.
class OrigAddrCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan, char* text) override;
};

}  // namespace lineprobe
