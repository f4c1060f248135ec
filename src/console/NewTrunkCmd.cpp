#include "console/NewTrunkCmd.h"

#include "console/TrunkView.h"
#include "console/TrunkViewMgr.h"
#include "console/View.h"

namespace lineprobe {

int NewTrunkCmd::Execute(int board, int line) {
    int result = TRUNKVIEWMGR_ERROR;
    TrunkView* trunkView = manager->CreateTrunkView(static_cast<unsigned int>(board),
                                                    static_cast<unsigned int>(line), result);
    if (result == TRUNKVIEWMGR_SUCCESS && trunkView != nullptr) {
        trunkView->Start();
        if (View* window = trunkView->GetView()) {
            window->Refresh();
        }
        Report("trunk view creaed successfully");
    } else {
        Report("ERROR - unable to create trunk view");
    }
    RefreshView();
    return 0;
}

}  // namespace lineprobe
