#pragma once

#include "console/PhoneCommand.h"

namespace lineprobe {

// `answer`: Answers the call last shown on the channel's row (call id 0 before any).
class AnswerCallCmd : public PhoneCommand {
  public:
    using PhoneCommand::PhoneCommand;

    using Command::Execute;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
