#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `accept`: Accepts the call last shown on the channel's row (call id 0 before any).
class AcceptCallCmd : public Command {
  public:
    AcceptCallCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
