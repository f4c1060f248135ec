#include "console/DeletePhoneCmd.h"

#include "console/PhoneViewMgr.h"

namespace lineprobe {

int DeletePhoneCmd::Execute(int board, int line, int chan) {
    const int result =
        manager->DestroyPhoneView(static_cast<unsigned int>(board), static_cast<unsigned int>(line),
                                  static_cast<unsigned int>(chan));
    Report(result == PHONEVIEWMGR_SUCCESS ? "successfully deleted phone view"
                                          : "ERROR - unable to delete phone view");
    RefreshView();
    return 0;
}

}  // namespace lineprobe
