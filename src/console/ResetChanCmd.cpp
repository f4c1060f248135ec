#include "console/ResetChanCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ResetChanCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->Reset(256);
        return Shown("channel reset completed");
    });
}

}  // namespace lineprobe
