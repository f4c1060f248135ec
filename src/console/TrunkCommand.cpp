#include "console/TrunkCommand.h"

#include "console/TrunkViewMgr.h"

namespace lineprobe {

int TrunkCommand::OnTrunkView(int board, int line, const std::function<Outcome(TrunkView&)>& act) {
    TrunkView* view =
        manager->FindTrunkView(static_cast<unsigned int>(board), static_cast<unsigned int>(line));
    Show(view != nullptr ? act(*view) : Shown("ERROR - unable to find trunk view"));
    return 0;
}

}  // namespace lineprobe
