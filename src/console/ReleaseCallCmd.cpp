#include "console/ReleaseCallCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ReleaseCallCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->ReleaseCall(view.GetCurCallId());
        return Silent();
    });
}

}  // namespace lineprobe
