#include "console/AcceptCallCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int AcceptCallCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->AcceptCall(view.GetCurCallId());
        return RefreshedOnly();
    });
}

}  // namespace lineprobe
