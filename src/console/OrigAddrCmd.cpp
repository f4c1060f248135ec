#include "console/OrigAddrCmd.h"

#include <cstring>
#include <string>

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int OrigAddrCmd::Execute(int board, int line, int chan, char* text) {
    return OnPhoneView(board, line, chan, [text](PhoneView& view) {
        if (text == nullptr || std::strlen(text) < 2) {
            return Shown("ERROR - invalid origination address");
        }
        view.GetPhone()->SetOrigAddr(std::string(text));
        return Silent();
    });
}

}  // namespace lineprobe
