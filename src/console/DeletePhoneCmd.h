#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `delphone`: Stops the channel's phone view and clears its row.
class DeletePhoneCmd : public Command {
  public:
    DeletePhoneCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
