#pragma once

#include "transport/IsaSync.h"

namespace vx7diag {
class Aspect;
class BoardManager;
class ConsolePhoneObserver;
class Observer;
class Phone;
class VX7EventPublisher;
}  // namespace vx7diag

namespace lineprobe {

class View;

// One live row for one channel: the channel's Phone, the publisher of its events and the
// observer that draws them, started and stopped in the order that keeps the row right.
class PhoneView {
  public:
    // Throws what the Phone's constructor throws (a line or channel out of range, a board
    // without the channel); nothing is left behind then.
    PhoneView(vx7diag::BoardManager* manager, int board, int line, int chan, int row, int col);
    // Frees the Phone as well: by then Stop has parted it from the board, and the
    // publisher's release makes sure no event thread can reach the observer any more.
    virtual ~PhoneView();
    PhoneView(const PhoneView&) = delete;
    PhoneView& operator=(const PhoneView&) = delete;

    virtual int Start();
    virtual int Stop();
    virtual void SetView(View* view);
    virtual View* GetView();

    vx7diag::Phone* GetPhone() { return phone; }
    unsigned int GetCurCallId();
    // Reads the call and channel state from the board and draws them; 1 when drawn.
    int GetCurrentPhoneState();

  private:
    // The task that makes the row right again when the relay connection comes back; 0
    // when none is registered.
    int restoreId = 0;
    isa::RefPtr<vx7diag::VX7EventPublisher> publisher;
    vx7diag::Phone* phone = nullptr;
    int board;
    int line;
    int chan;
    vx7diag::ConsolePhoneObserver* observer = nullptr;
    isa::RefPtr<vx7diag::Observer> observerRef;
    vx7diag::Aspect* callStateAspect = nullptr;
    vx7diag::Aspect* chanStateAspect = nullptr;
    [[maybe_unused]] vx7diag::BoardManager* boardManager;
    int row;
    int startingCol;
    View* view = nullptr;
};

}  // namespace lineprobe
