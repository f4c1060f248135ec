#include "console/StopTxRAICmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

namespace {

// The alarm code of "Transmit RAI".
constexpr unsigned int TRANSMIT_RAI = 5643;

}  // namespace

int StopTxRAICmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->StopTransmitAlarm(TRANSMIT_RAI);
        return Shown("stopping of RAI transmission completed");
    });
}

}  // namespace lineprobe
