#include "console/StopTxRAICmd.h"

#include "catalogue/generated/values.h"
#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int StopTxRAICmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->StopTransmitAlarm(tolk::wire::LCON::Alarm::TRANSMIT_RAI);
        return Shown("stopping of RAI transmission completed");
    });
}

}  // namespace lineprobe
