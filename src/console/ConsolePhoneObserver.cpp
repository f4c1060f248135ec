#include "console/ConsolePhoneObserver.h"

#include <cstdio>
#include <iostream>

#include "console/ConsoleLayout.h"
#include "console/DisplayGuard.h"
#include "console/ObserverTexts.h"
#include "console/View.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"

namespace vx7diag {

using namespace lineprobe;

ConsolePhoneObserver::ConsolePhoneObserver(int board, int line, int chan, int row, int col)
    : board(board), line(line), chan(chan), startingCol(col), row(row) {}

void ConsolePhoneObserver::SetView(View* v) {
    view = v;
}

View* ConsolePhoneObserver::GetView() {
    return view;
}

void ConsolePhoneObserver::PrintField(const char* value, int col) {
    std::snprintf(text, sizeof text, "%s", value);
    view->PrintString(text, row, col);
}

void ConsolePhoneObserver::Update(Subject*, Aspect& aspect) {
    std::cout << "Update Method called" << std::endl;
    if (view == nullptr) {
        return;
    }
    isa::AutoCriticalSection rowLock(lock);
    // The whole row with its refresh goes out under the display lock, so that another
    // thread's drawing never shows half of it.
    DisplayGuard guard;
    if (auto* chanState = dynamic_cast<TSCChanState*>(&aspect)) {
        if (auto* event = chanState->GetEvent()) {
            PrintField(ConsoleChanStateText(*event->pChanState), CHAN_STATE_START_COL);
        }
    } else if (auto* callState = dynamic_cast<TSCCallState*>(&aspect)) {
        if (auto* event = callState->GetEvent()) {
            std::snprintf(text, sizeof text, "0x%x", *event->pCallId);
            view->PrintString(text, row, CALLID_START_COL);
            PrintField(ConsoleCallStateText(*event->pCallState), CALL_STATE_START_COL);
            PrintField(ConsoleReasonText(*event->pReason), REASON_START_COL);
            curCallId = *event->pCallId;
        }
    }
    view->Refresh();
}

int ConsolePhoneObserver::DisplayCurrentPhoneState(int callId, int callState, int chanState,
                                                   int reason) {
    if (view == nullptr) {
        return 0;
    }
    isa::AutoCriticalSection rowLock(lock);
    DisplayGuard guard;
    PrintField(ConsoleChanStateText(static_cast<unsigned int>(chanState)), CHAN_STATE_START_COL);
    std::snprintf(text, sizeof text, "0x%x", static_cast<unsigned int>(callId));
    view->PrintString(text, row, CALLID_START_COL);
    PrintField(ConsoleCallStateText(static_cast<unsigned int>(callState)), CALL_STATE_START_COL);
    PrintField(ConsoleReasonText(static_cast<unsigned int>(reason)), REASON_START_COL);
    return 1;
}

}  // namespace vx7diag
