#include "console/RelayStatus.h"

#include <cstring>
#include <string>

#include "console/ConsoleDisplay.h"
#include "console/ConsoleLayout.h"
#include "console/Curses.h"
#include "console/DisplayGuard.h"
#include "console/Lifecycle.h"
#include "transport/TKSMsgQueue.h"

namespace lineprobe {

static_assert(RELAY_STATUS_ROW == TRUNKVIEWS_SEPARATOR_ROW);

void ShowRelayState(bool cutOff) {
    DisplayGuard guard;
    if (g_curDisplay == nullptr || !g_curDisplay->IsStarted()) {
        return;
    }
    const int length = static_cast<int>(std::strlen(RELAY_CUT_OFF_TEXT));
    const int col = RELAY_STATUS_END_COL - length;
    if (cutOff) {
        mvwaddstr(stdscr, RELAY_STATUS_ROW, col, RELAY_CUT_OFF_TEXT);
    } else if (wmove(stdscr, RELAY_STATUS_ROW, col) != ERR) {
        whline(stdscr, 0, length);
    }
    g_curDisplay->Refresh();
}

void WatchRelayState() {
    TKSMsgQueue::addRelayListener([](bool cutOff, const std::string&) { ShowRelayState(cutOff); });
}

}  // namespace lineprobe
