#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `makecall`: Makes a call from the phone's origination address to its destination address.
// "started" means only that the request went out: the row shows how the call goes.
class MakeCallCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
