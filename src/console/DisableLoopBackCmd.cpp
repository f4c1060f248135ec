#include "console/DisableLoopBackCmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int DisableLoopBackCmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->DisableLoopBack();
        return Shown("Disabling loopback mode completed");
    });
}

}  // namespace lineprobe
