#include "console/EnableLineLoopBackCmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int EnableLineLoopBackCmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->EnableLoopBack(2);
        return Shown("enabling line loopback completed");
    });
}

}  // namespace lineprobe
