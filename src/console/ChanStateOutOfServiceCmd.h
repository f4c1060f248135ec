#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `chan_oos`: Takes the channel out of service (state 257).
class ChanStateOutOfServiceCmd : public Command {
  public:
    ChanStateOutOfServiceCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
