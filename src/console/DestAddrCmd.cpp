#include "console/DestAddrCmd.h"

#include <cstring>
#include <string>

#include "console/PhoneView.h"
#include "console/PhoneViewMgr.h"
#include "model/Phone.h"

namespace lineprobe {

int DestAddrCmd::Execute() {
    return 0;
}

int DestAddrCmd::Execute(int board, int line, int chan, char* text) {
    PhoneView* phoneView =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    if (phoneView == nullptr) {
        Report("ERROR - unable to find phone view");
        RefreshView();
        return 0;
    }
    if (text == nullptr || std::strlen(text) < 2) {
        Report("ERROR - invalid destination address");
        RefreshView();
        return 0;
    }
    phoneView->GetPhone()->SetDestAddr(std::string(text));
    Report("destination address set");
    RefreshView();
    return 0;
}

}  // namespace lineprobe
