#pragma once

#include <functional>

#include "console/Command.h"

namespace lineprobe {

class PhoneView;
class PhoneViewMgr;

// A command on the phones: it finds a view by board, line and channel, calls the model
// through it and shows the outcome. Which field counts it takes is the derived class's
// choice, as for every command.
class PhoneCommand : public Command {
  public:
    PhoneCommand(std::string name, PhoneViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

  protected:
    // Calls `act` on the view of the channel and shows what it returns; without such a view,
    // says so. Always 0: a phone command never stops the prompt.
    int OnPhoneView(int board, int line, int chan, const std::function<Outcome(PhoneView&)>& act);

    PhoneViewMgr* manager;
};

}  // namespace lineprobe
