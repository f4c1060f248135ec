#include "console/DeleteTrunkCmd.h"

#include "console/TrunkViewMgr.h"

namespace lineprobe {

int DeleteTrunkCmd::Execute(int board, int line) {
    const int result = manager->DestroyTrunkView(static_cast<unsigned int>(board),
                                                 static_cast<unsigned int>(line));
    Report(result == TRUNKVIEWMGR_SUCCESS ? "successfully deleted trunk view"
                                          : "ERROR - unable to delete trunk view");
    RefreshView();
    return 0;
}

}  // namespace lineprobe
