#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `release`: Releases the call last shown on the channel's row.
class ReleaseCallCmd : public Command {
  public:
    ReleaseCallCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
