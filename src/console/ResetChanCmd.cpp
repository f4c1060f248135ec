#include "console/ResetChanCmd.h"

#include "catalogue/generated/values.h"
#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ResetChanCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->Reset(tolk::wire::TSC::SetChanState::IN_SERVICE);
        return Shown("channel reset completed");
    });
}

}  // namespace lineprobe
