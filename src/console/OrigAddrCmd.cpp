#include "console/OrigAddrCmd.h"

#include <cstring>
#include <string>

#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "model/Phone.h"

namespace lineprobe {

int OrigAddrCmd::Execute() {
    return 0;
}

int OrigAddrCmd::Execute(int board, int line, int chan, char* text) {
    PhoneView* phoneView =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    if (phoneView == nullptr) {
        Report("ERROR - unable to find phone view");
        RefreshView();
        return 0;
    }
    if (text == nullptr || std::strlen(text) < 2) {
        Report("ERROR - invalid origination address");
        RefreshView();
        return 0;
    }
    phoneView->GetPhone()->SetOrigAddr(std::string(text));
    return 0;
}

}  // namespace lineprobe
