#include "console/MakeCallCmd.h"

#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "framework/String.h"
#include "model/Phone.h"

namespace lineprobe {

int MakeCallCmd::Execute() {
    return 0;
}

int MakeCallCmd::Execute(int board, int line, int chan) {
    PhoneView* phoneView =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    if (phoneView != nullptr) {
        vx7diag::Phone* phone = phoneView->GetPhone();
        phone->MakeCall(tolk::string(phone->GetOrigAddr().c_str()),
                        tolk::string(phone->GetDestAddr().c_str()));
        Report("makecall started successfully");
    } else {
        Report("ERROR - unable to find phone view");
    }
    RefreshView();
    return 0;
}

}  // namespace lineprobe
