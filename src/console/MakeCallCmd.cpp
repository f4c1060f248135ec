#include "console/MakeCallCmd.h"

#include "console/PhoneView.h"
#include "framework/String.h"
#include "model/Phone.h"

namespace lineprobe {

int MakeCallCmd::Execute(int board, int line, int chan) {
    return OnPhoneView(board, line, chan, [](PhoneView& view) {
        vx7diag::Phone* phone = view.GetPhone();
        phone->MakeCall(tolk::string(phone->GetOrigAddr().c_str()),
                        tolk::string(phone->GetDestAddr().c_str()));
        return Shown("makecall started successfully");
    });
}

}  // namespace lineprobe
