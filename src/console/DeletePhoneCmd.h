#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `delphone`: Stops the channel's phone view and clears its row.
class DeletePhoneCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
