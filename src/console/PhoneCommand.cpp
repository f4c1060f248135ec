#include "console/PhoneCommand.h"

#include "console/PhoneViewMgr.h"

namespace lineprobe {

int PhoneCommand::OnPhoneView(int board, int line, int chan,
                              const std::function<Outcome(PhoneView&)>& act) {
    PhoneView* view =
        manager->FindPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
    Show(view != nullptr ? act(*view) : Shown("ERROR - unable to find phone view"));
    return 0;
}

}  // namespace lineprobe
