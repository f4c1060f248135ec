#include "console/StartTxRAICmd.h"

#include "catalogue/generated/values.h"
#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int StartTxRAICmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->StartTransmitAlarm(tolk::wire::LCON::Alarm::TRANSMIT_RAI);
        return Shown("starting of RAI transmission completed");
    });
}

}  // namespace lineprobe
