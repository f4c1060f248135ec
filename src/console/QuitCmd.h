#pragma once

#include "console/Command.h"

namespace lineprobe {

// `quit`, alone or with board, line and channel. Raises SIGUSR1, whose handler ends the
// process with status 1 inside the raise; the 1 returned is never seen in practice.
class QuitCmd : public Command {
  public:
    explicit QuitCmd(std::string name) : Command(std::move(name)) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;
};

}  // namespace lineprobe
