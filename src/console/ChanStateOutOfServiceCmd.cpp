#include "console/ChanStateOutOfServiceCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ChanStateOutOfServiceCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->SetChanState(257);
        return Silent();
    });
}

}  // namespace lineprobe
