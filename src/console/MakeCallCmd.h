#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `makecall`: Makes a call from the phone's origination address to its destination address.
// "started" means only that the request went out: the row shows how the call goes.
class MakeCallCmd : public Command {
  public:
    MakeCallCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
