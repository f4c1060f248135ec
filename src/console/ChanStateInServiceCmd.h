#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `chan_ins`: Takes the channel into service (state 256).
class ChanStateInServiceCmd : public Command {
  public:
    ChanStateInServiceCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
