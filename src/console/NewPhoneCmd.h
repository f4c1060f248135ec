#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `phone`: Opens a phone view on the channel and starts it.
class NewPhoneCmd : public Command {
  public:
    NewPhoneCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
