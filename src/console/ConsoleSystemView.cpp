#include "console/ConsoleSystemView.h"

#include <algorithm>
#include <cstdio>
#include <string>

#include "console/DisplayGuard.h"
#include "console/View.h"
#include "model/BoardManager.h"

namespace lineprobe {

namespace {

constexpr int SIGNALING_CAS = 4;
constexpr int SIGNALING_CCS = 5;
constexpr int FIRST_BOARD_ROW = 2;
constexpr int BOARD_COL = 1;

}  // namespace

ConsoleSystemView::ConsoleSystemView() : boards(GetActiveBoardList()) {}

void ConsoleSystemView::SetView(View* v) {
    view = v;
}

int ConsoleSystemView::SetVisible() {
    if (view == nullptr) {
        return -1;
    }
    view->SetVisible();
    return 0;
}

const char* ConsoleSystemView::SignalingText(int signaling) {
    switch (signaling) {
        case SIGNALING_CAS:
            return "CAS";
        case SIGNALING_CCS:
            return "CCS";
        default:
            return "CLEAR";
    }
}

void ConsoleSystemView::Display() {
    if (view == nullptr) {
        return;
    }
    DisplayGuard guard;
    const std::string name = GetSystemName();
    std::snprintf(text, sizeof text, "SYSTEM VIEW - %s", name.c_str());
    view->SetReverseVideo();
    view->PrintString(text, 0, TITLE_COL);
    view->SetNormalVideo();

    int row = FIRST_BOARD_ROW;
    int col = BOARD_COL;
    for (const auto& [number, manager] : boards) {
        const std::string boardName = manager->GetBoardName();
        int length = std::snprintf(text, sizeof text, "brd %d: (%s):", static_cast<int>(number),
                                   boardName.c_str());
        view->PrintString(text, row, col);
        col += std::min<int>(length, sizeof text - 1) + 2;
        for (int trunk = 1; trunk <= manager->GetNumberOfTrunks(); ++trunk) {
            const auto t = static_cast<unsigned int>(trunk);
            length = std::snprintf(text, sizeof text, "(L%d c=%d %s) ", trunk,
                                   manager->GetNumChannelsOnTrunk(t),
                                   SignalingText(manager->GetSignalingType(t)));
            view->PrintString(text, row, col);
            col += length;
            if (col > WRAP_AFTER_COL) {
                ++row;
                col = WRAP_COL;
            }
        }
        ++row;
        col = BOARD_COL;
    }
    view->Refresh();
}

}  // namespace lineprobe
