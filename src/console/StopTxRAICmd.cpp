#include "console/StopTxRAICmd.h"

#include "catalogue/generated/values.h"
#include "console/TrunkView.h"
#include "console/TrunkViewMgr.h"
#include "model/Trunk.h"

namespace lineprobe {

namespace {

// The alarm code of "Transmit RAI".
constexpr unsigned int TRANSMIT_RAI = tolk::wire::LCON::Alarm::TRANSMIT_RAI;

}  // namespace

int StopTxRAICmd::Execute() {
    return 0;
}

int StopTxRAICmd::Execute(int board, int line) {
    TrunkView* trunkView =
        manager->FindTrunkView(static_cast<unsigned int>(board), static_cast<unsigned int>(line));
    if (trunkView != nullptr) {
        vx7diag::Trunk* trunk = trunkView->GetTrunk();
        trunk->StopTransmitAlarm(TRANSMIT_RAI);
        Report("stopping of RAI transmission completed");
        RefreshView();
    } else {
        Report("ERROR - unable to find trunk view");
        RefreshView();
    }
    return 0;
}

}  // namespace lineprobe
