#include "console/AnswerCallCmd.h"

#include "console/PhoneView.h"
#include "model/Phone.h"

namespace lineprobe {

int AnswerCallCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        view.GetPhone()->AnswerCall(view.GetCurCallId());
        return RefreshedOnly();
    });
}

}  // namespace lineprobe
