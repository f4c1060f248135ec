#pragma once

#include <functional>

#include "console/Command.h"

namespace lineprobe {

class TrunkView;
class TrunkViewMgr;

// A command on the trunks: it finds a view by board and line, calls the model through it and
// shows the outcome.
class TrunkCommand : public Command {
  public:
    TrunkCommand(std::string name, TrunkViewMgr* manager)
        : Command(std::move(name)), manager(manager) {}

  protected:
    // Calls `act` on the view of the line and shows what it returns; without such a view,
    // says so. Always 0: a trunk command never stops the prompt.
    int OnTrunkView(int board, int line, const std::function<Outcome(TrunkView&)>& act);

    TrunkViewMgr* manager;
};

}  // namespace lineprobe
