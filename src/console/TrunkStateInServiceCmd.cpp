#include "console/TrunkStateInServiceCmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int TrunkStateInServiceCmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->PutInService();
        return Silent();
    });
}

}  // namespace lineprobe
