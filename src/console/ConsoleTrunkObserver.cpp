#include "console/ConsoleTrunkObserver.h"

#include <cstdio>

#include "console/ConsoleLayout.h"
#include "console/DisplayGuard.h"
#include "console/ObserverTexts.h"
#include "console/View.h"
#include "model/AllAlarms.h"
#include "model/Trunk.h"
#include "model/TrunkState.h"

namespace vx7diag {

using namespace lineprobe;

namespace {

constexpr unsigned int STATE_ACTIVE = 1;

}  // namespace

ConsoleTrunkObserver::ConsoleTrunkObserver(int board, int line, int row, int col)
    : board(board), line(line), startingCol(col), row(row) {}

void ConsoleTrunkObserver::SetView(View* v) {
    view = v;
}

View* ConsoleTrunkObserver::GetView() {
    return view;
}

void ConsoleTrunkObserver::ShowFlag(bool set, int col) {
    view->PrintString(set ? "X" : " ", row, col);
}

void ConsoleTrunkObserver::ShowCount(unsigned int count, int col) {
    std::snprintf(text, sizeof text, "%d", static_cast<int>(count));
    view->PrintString(text, row, col);
}

void ConsoleTrunkObserver::ShowLineState(unsigned int state, unsigned int reason) {
    view->PrintString(g_LineStateStr[state == LINE_STATE_IN_SERVICE ? 0 : 1].c_str(), row,
                      LINESTATE_START_COL);
    std::snprintf(text, sizeof text, "%s", ConsoleLineStateReasonText(reason));
    view->PrintString(text, row, LINESTATE_REASON_START_COL);
}

void ConsoleTrunkObserver::Update(Subject*, Aspect& aspect) {
    if (view == nullptr) {
        return;
    }
    isa::AutoCriticalSection rowLock(lock);
    DisplayGuard guard;
    if (auto* alarms = dynamic_cast<AllAlarms*>(&aspect)) {
        if (auto* event = alarms->GetEvent()) {
            const bool active = *event->pState == STATE_ACTIVE;
            switch (*event->pType) {
                case ALARM_RED:
                    ShowFlag(active, RED_CFA_START_COL);
                    break;
                case ALARM_YELLOW:
                    ShowFlag(active, YELLOW_CFA_START_COL);
                    break;
                case ALARM_AIS:
                    ShowFlag(active, AIS_CFA_START_COL);
                    break;
                // "Sig" and "DChan" tell that the signal or the D channel is good.
                case ALARM_LOS:
                    ShowFlag(!active, LOS_CFA_START_COL);
                    break;
                case ALARM_LOOPBACK:
                    ShowFlag(active, LOOPBACK_CFA_START_COL);
                    break;
                case ALARM_RAI_CRC:
                    ShowFlag(active, CRC_CFA_START_COL);
                    break;
                case ALARM_DCHAN:
                    ShowFlag(!active, DCHAN_START_COL);
                    break;
                case ALARM_BPV_SATURATION:
                    ShowCount(++bipolarViolations, BPVS_START_COL);
                    break;
                case ALARM_FERR_SATURATION:
                    ShowCount(++frameErrors, FERR_START_COL);
                    break;
                default:
                    break;
            }
        }
    } else if (auto* trunkState = dynamic_cast<TrunkState*>(&aspect)) {
        if (auto* event = trunkState->GetEvent()) {
            ShowLineState(*event->pType, *event->pReason);
        }
    }
    view->Refresh();
}

int ConsoleTrunkObserver::DisplayCurrentTrunkStatus(TrunkStatus* status) {
    if (view == nullptr || status == nullptr) {
        return 0;
    }
    isa::AutoCriticalSection rowLock(lock);
    DisplayGuard guard;
    ShowLineState(status->GetState(), status->GetReason());
    ShowFlag(status->GetRedCFA() == STATE_ACTIVE, RED_CFA_START_COL);
    ShowFlag(status->GetYellowCFA() == STATE_ACTIVE, YELLOW_CFA_START_COL);
    ShowFlag(status->GetLOSCFA() != STATE_ACTIVE, LOS_CFA_START_COL);
    ShowFlag(status->GetDChanCFA() != STATE_ACTIVE, DCHAN_START_COL);
    ShowFlag(status->GetLoopBackCFA() == STATE_ACTIVE, LOOPBACK_CFA_START_COL);
    ShowCount(bipolarViolations, BPVS_START_COL);
    ShowCount(frameErrors, FERR_START_COL);
    return 1;
}

}  // namespace vx7diag
