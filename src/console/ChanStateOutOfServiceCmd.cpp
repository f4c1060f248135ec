#include "console/ChanStateOutOfServiceCmd.h"

#include "catalogue/generated/values.h"
#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int ChanStateOutOfServiceCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->SetChanState(tolk::wire::TSC::SetChanState::OUT_OF_SERVICE);
        return Silent();
    });
}

}  // namespace lineprobe
