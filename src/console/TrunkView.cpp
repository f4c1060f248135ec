#include "console/TrunkView.h"

#include <cstdio>
#include <iostream>

#include "console/AspectInstanceFactory.h"
#include "console/ConsoleTrunkObserver.h"
#include "console/DisplayGuard.h"
#include "console/View.h"
#include "model/AllAlarms.h"
#include "model/RelayRestore.h"
#include "model/Trunk.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace lineprobe {

TrunkView::TrunkView(int board, int line, int row, int col)
    : publisher(new vx7diag::VX7EventPublisher(static_cast<unsigned int>(board),
                                               static_cast<unsigned int>(line), 1)),
      board(board),
      line(line),
      observer(new vx7diag::ConsoleTrunkObserver(board, line, row, col)),
      observerRef(observer),
      row(row),
      startingCol(col) {
    trunk = new vx7diag::Trunk(static_cast<unsigned int>(board), static_cast<unsigned int>(line));
    std::cout << "TrunkView::TrunkView - successfully created trunk" << std::endl;
}

TrunkView::~TrunkView() {
    if (restoreId != 0) {
        vx7diag::RelayRestore::Remove(restoreId);
    }
    delete trunk;
}

int TrunkView::Start() {
    std::cout << "TrunkView::STart() - entered" << std::endl;
    std::cout << "TrunkView::STart() - getting Aspects" << std::endl;
    allAlarmsAspect = AspectInstanceFactory::GetAllAlarmsAspectInstance();
    trunkStateAspect = AspectInstanceFactory::GetTrunkStateAspectInstance();

    std::cout << "TrunkView::STart() - attachig AllAlarms Aspect" << std::endl;
    const bool alarmsFollowed = publisher->Attach(observerRef, allAlarmsAspect);
    std::cout << "TrunkView::STart() - attachig TrunkState Aspect" << std::endl;
    const bool stateFollowed = publisher->Attach(observerRef, trunkStateAspect);
    // The command still reports the view as made; what failed is in the trace log, this
    // says what it costs.
    if (!alarmsFollowed || !stateFollowed) {
        std::cerr << "trunk view " << board << "." << line
                  << ": subscription to the board's events failed, the view will not follow "
                     "the board"
                  << std::endl;
    }

    std::cout << "TrunkView::STart() - Displaying Trunk View string" << std::endl;
    if (view != nullptr) {
        char label[30];
        std::snprintf(label, sizeof label, "%d.%d", board, line);
        DisplayGuard guard;
        view->PrintString(label, row, startingCol);
    }
    std::cout << "TrunkView::STart() - Getttig Currrent Trunk Status" << std::endl;
    GetCurrentTrunkStatus();
    if (restoreId == 0) {
        restoreId = vx7diag::RelayRestore::Add([this] {
            std::cout << "TrunkView: relay back, restoring " << board << "." << line << std::endl;
            publisher->Resubscribe();
            GetCurrentTrunkStatus();
        });
    }
    return 0;
}

int TrunkView::Stop() {
    // Before the publisher is let go: a restore that has begun finishes first.
    if (restoreId != 0) {
        vx7diag::RelayRestore::Remove(restoreId);
        restoreId = 0;
    }
    std::cout << "Stopping Trunk Viev: board=" << board << " line=" << line << std::endl;
    if (allAlarmsAspect != nullptr) {
        publisher->Detach(observerRef, *allAlarmsAspect);
    }
    if (trunkStateAspect != nullptr) {
        publisher->Detach(observerRef, *trunkStateAspect);
    }
    return 0;
}

void TrunkView::SetView(View* v) {
    view = v;
    observer->SetView(v);
}

View* TrunkView::GetView() {
    return view;
}

void TrunkView::GetCurrentTrunkStatus() {
    std::cout << "TrunkView::GetCurrentTrunkStatus - creating a TrunkStatus instance" << std::endl;
    // A board that cannot tell its status leaves the row to the events that follow; the
    // reason is in the log.
    vx7diag::TrunkStatus* status = vx7diag::TrunkStatus::TryCreate(trunk);
    if (status == nullptr) {
        std::cerr << "trunk view " << board << "." << line
                  << ": the line's status could not be read" << std::endl;
        return;
    }
    std::cout << "TrunkView::GetCurrentTrunkStatus - Displaying trunk status" << std::endl;
    observer->DisplayCurrentTrunkStatus(status);
    delete status;
}

}  // namespace lineprobe
