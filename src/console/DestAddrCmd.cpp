#include "console/DestAddrCmd.h"

#include <cstring>
#include <string>

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int DestAddrCmd::Execute(int board, int line, int chan, char* text) {
    return OnPhoneView(board, line, chan, [text](PhoneView& view) {
        if (text == nullptr || std::strlen(text) < 2) {
            return Shown("ERROR - invalid destination address");
        }
        view.GetPhone()->SetDestAddr(std::string(text));
        return Shown("destination address set");
    });
}

}  // namespace lineprobe
