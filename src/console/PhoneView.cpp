#include "console/PhoneView.h"

#include <cstdio>
#include <iostream>

#include "console/AspectInstanceFactory.h"
#include "console/ConsolePhoneObserver.h"
#include "console/DisplayGuard.h"
#include "console/View.h"
#include "model/Phone.h"
#include "model/RelayRestore.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/VX7EventPublisher.h"

namespace lineprobe {

PhoneView::PhoneView(vx7diag::BoardManager* manager, int board, int line, int chan, int row,
                     int col)
    : publisher(new vx7diag::VX7EventPublisher(static_cast<unsigned int>(board),
                                               static_cast<unsigned int>(line),
                                               static_cast<unsigned int>(chan))),
      board(board),
      line(line),
      chan(chan),
      observer(new vx7diag::ConsolePhoneObserver(board, line, chan, row, col)),
      observerRef(observer),
      boardManager(manager),
      row(row),
      startingCol(col) {
    phone = new vx7diag::Phone(manager, static_cast<unsigned int>(line),
                               static_cast<unsigned int>(chan));
}

PhoneView::~PhoneView() {
    if (restoreId != 0) {
        vx7diag::RelayRestore::Remove(restoreId);
    }
    delete phone;
}

int PhoneView::Start() {
    callStateAspect = AspectInstanceFactory::GetCallStateAspectInstance();
    chanStateAspect = AspectInstanceFactory::GetChanStateAspectInstance();

    // Watch before reading: an event that comes while the state is read then shows on
    // the row, whichever of the two is the later.
    const bool callsFollowed = publisher->Attach(observerRef, callStateAspect);
    const bool chanFollowed = publisher->Attach(observerRef, chanStateAspect);
    // The command still reports the view as made, and the row shows the state read below;
    // what failed is in the trace log, this says what it costs.
    if (!callsFollowed || !chanFollowed) {
        std::cerr << "phone view " << board << "." << line << "." << chan
                  << ": subscription to the board's events failed, the view will not follow "
                     "the board"
                  << std::endl;
    }

    GetCurrentPhoneState();
    phone->Start();

    if (view != nullptr) {
        char label[40];
        std::snprintf(label, sizeof label, "%d.%d.%d", board, line, chan);
        DisplayGuard guard;
        view->PrintString(label, row, startingCol);
    }
    if (restoreId == 0) {
        restoreId = vx7diag::RelayRestore::Add([this] {
            std::cout << "PhoneView: relay back, restoring " << board << "." << line << "." << chan
                      << std::endl;
            publisher->Resubscribe();
            GetCurrentPhoneState();
        });
    }
    return 0;
}

int PhoneView::Stop() {
    // Before the publisher is let go: a restore that has begun finishes first.
    if (restoreId != 0) {
        vx7diag::RelayRestore::Remove(restoreId);
        restoreId = 0;
    }
    std::cout << "PhoneView::Stop() called: board=" << board << " line=" << line << " chan=" << chan
              << std::endl;
    phone->Stop();
    if (chanStateAspect != nullptr) {
        publisher->Detach(observerRef, *chanStateAspect);
    }
    if (callStateAspect != nullptr) {
        publisher->Detach(observerRef, *callStateAspect);
    }
    return 0;
}

void PhoneView::SetView(View* v) {
    view = v;
    observer->SetView(v);
}

View* PhoneView::GetView() {
    return view;
}

unsigned int PhoneView::GetCurCallId() {
    return observer->GetCurCallId();
}

int PhoneView::GetCurrentPhoneState() {
    tolk::TSC::MsgGetCallStateCmplt_t reply;
    phone->GetCallState(0, &reply);
    const unsigned int chanState = phone->GetChanState();
    return observer->DisplayCurrentPhoneState(
        static_cast<int>(*reply.pCallId), static_cast<int>(*reply.pCallState),
        static_cast<int>(chanState), static_cast<int>(*reply.pReason));
}

}  // namespace lineprobe
