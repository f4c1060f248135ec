#include "console/TrunkStateOutOfServiceCmd.h"

#include "console/TrunkView.h"
#include "model/Trunk.h"

namespace lineprobe {

int TrunkStateOutOfServiceCmd::Execute(int board, int line) {
    return OnTrunkView(board, line, [](TrunkView& view) {
        view.GetTrunk()->PutOutOfService();
        return Silent();
    });
}

}  // namespace lineprobe
