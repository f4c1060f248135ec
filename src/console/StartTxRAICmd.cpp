#include "console/StartTxRAICmd.h"

#include "catalogue/generated/values.h"
#include "console/TrunkView.h"
#include "console/TrunkViewMgr.h"
#include "model/Trunk.h"

namespace lineprobe {

namespace {

// The alarm code of "Transmit RAI".
constexpr unsigned int TRANSMIT_RAI = tolk::wire::LCON::Alarm::TRANSMIT_RAI;

}  // namespace

int StartTxRAICmd::Execute() {
    return 0;
}

int StartTxRAICmd::Execute(int board, int line) {
    TrunkView* trunkView =
        manager->FindTrunkView(static_cast<unsigned int>(board), static_cast<unsigned int>(line));
    if (trunkView != nullptr) {
        vx7diag::Trunk* trunk = trunkView->GetTrunk();
        trunk->StartTransmitAlarm(TRANSMIT_RAI);
        Report("starting of RAI transmission completed");
        RefreshView();
    } else {
        Report("ERROR - unable to find trunk view");
        RefreshView();
    }
    return 0;
}

}  // namespace lineprobe
