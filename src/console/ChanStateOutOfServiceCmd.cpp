#include "console/ChanStateOutOfServiceCmd.h"

#include "catalogue/generated/values.h"
#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "model/Phone.h"

namespace lineprobe {

int ChanStateOutOfServiceCmd::Execute() {
    return 0;
}

int ChanStateOutOfServiceCmd::Execute(int board, int line, int chan) {
    PhoneView* phoneView =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    if (phoneView != nullptr) {
        vx7diag::Phone* phone = phoneView->GetPhone();
        phone->SetChanState(tolk::wire::TSC::SetChanState::OUT_OF_SERVICE);
    } else {
        Report("ERROR - unable to find phone view");
        RefreshView();
    }
    return 0;
}

}  // namespace lineprobe
