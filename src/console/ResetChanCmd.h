#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `reset`: Resets the channel (state 256).
class ResetChanCmd : public Command {
  public:
    ResetChanCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
