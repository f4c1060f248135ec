#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `drop`: Drops the call last shown on the channel's row.
class DropCallCmd : public Command {
  public:
    DropCallCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
