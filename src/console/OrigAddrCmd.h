#pragma once

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;

// `origaddr`: Sets the number the phone's next calls come from. Takes a good address silently.
class OrigAddrCmd : public Command {
  public:
    OrigAddrCmd(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan, char* text) override;

  private:
    PhoneViewMgr* manager;
};

}  // namespace lineprobe
