#include "console/ChanStateInServiceCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ChanStateInServiceCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->SetChanState(256);
        return Silent();
    });
}

}  // namespace lineprobe
