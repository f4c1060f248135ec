#include "console/ResetChanCmd.h"

#include "catalogue/generated/values.h"
#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "model/Phone.h"

namespace lineprobe {

int ResetChanCmd::Execute() {
    return 0;
}

int ResetChanCmd::Execute(int board, int line, int chan) {
    PhoneView* phoneView =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    if (phoneView != nullptr) {
        vx7diag::Phone* phone = phoneView->GetPhone();
        phone->Reset(tolk::wire::TSC::SetChanState::IN_SERVICE);
        Report("channel reset completed");
    } else {
        Report("ERROR - unable to find phone view");
    }
    RefreshView();
    return 0;
}

}  // namespace lineprobe
