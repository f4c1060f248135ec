#include "console/DropCallCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int DropCallCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->DropCall(view.GetCurCallId());
        return Silent();
    });
}

}  // namespace lineprobe
