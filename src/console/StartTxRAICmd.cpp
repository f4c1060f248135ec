#include "console/StartTxRAICmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

namespace {

// The alarm code of "Transmit RAI".
constexpr unsigned int TRANSMIT_RAI = 5643;

}  // namespace

int StartTxRAICmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->StartTransmitAlarm(TRANSMIT_RAI);
        return Shown("starting of RAI transmission completed");
    });
}

}  // namespace lineprobe
