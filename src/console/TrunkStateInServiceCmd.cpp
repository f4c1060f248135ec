#include "console/TrunkStateInServiceCmd.h"

#include "console/TrunkView.h"
#include "console/TrunkViewMgr.h"
#include "model/Trunk.h"

namespace lineprobe {

int TrunkStateInServiceCmd::Execute() {
    return 0;
}

int TrunkStateInServiceCmd::Execute(int board, int line) {
    TrunkView* trunkView =
        manager->FindTrunkView(static_cast<unsigned int>(board), static_cast<unsigned int>(line));
    if (trunkView != nullptr) {
        vx7diag::Trunk* trunk = trunkView->GetTrunk();
        trunk->PutInService();
    } else {
        Report("ERROR - unable to find trunk view");
        RefreshView();
    }
    return 0;
}

}  // namespace lineprobe
