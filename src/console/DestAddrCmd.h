#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `destaddr`: Sets the number the phone's next calls go to.
class DestAddrCmd : public Command {
  public:
    DestAddrCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan, char* text) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
