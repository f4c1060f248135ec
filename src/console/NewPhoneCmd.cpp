#include "console/NewPhoneCmd.h"

#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "console/View.h"

namespace lineprobe {

int NewPhoneCmd::Execute(int board, int line, int chan) {
    int result = PHONEVIEWMGR_ERROR;
    PhoneView* phoneView =
        manager->CreatePhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                                 static_cast<unsigned int>(chan), result);
    if (result == PHONEVIEWMGR_SUCCESS && phoneView != nullptr) {
        phoneView->Start();
        if (View* window = phoneView->GetView()) {
            window->Refresh();
        }
        Report("phone view creaed successfully");
    } else {
        Report("ERROR - unable to create phone view");
    }
    RefreshView();
    return 0;
}

}  // namespace lineprobe
