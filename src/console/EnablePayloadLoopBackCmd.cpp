#include "console/EnablePayloadLoopBackCmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int EnablePayloadLoopBackCmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->EnableLoopBack(1);
        return Shown("enabling Payload loopback completed");
    });
}

}  // namespace lineprobe
