#pragma once

#include "transport/IsaSync.h"

namespace vx7diag {
class Aspect;
class ConsoleTrunkObserver;
class Observer;
class Trunk;
class VX7EventPublisher;
}  // namespace vx7diag

namespace lineprobe {

class View;

// One live row for one line: the line's Trunk, the publisher of its events and the
// observer that draws its state, alarms and error counts.
class TrunkView {
  public:
    // Throws what the Trunk's constructor throws (no such board or line, a board that
    // refuses or is silent); nothing is left behind then.
    TrunkView(int board, int line, int row, int col);
    // Frees the Trunk as well: see PhoneView.
    virtual ~TrunkView();
    TrunkView(const TrunkView&) = delete;
    TrunkView& operator=(const TrunkView&) = delete;

    virtual int Start();
    virtual int Stop();
    virtual void SetView(View* view);
    virtual View* GetView();

    vx7diag::Trunk* GetTrunk() { return trunk; }
    // Reads the line's status from the board and draws it; nothing is drawn when the
    // board cannot tell.
    void GetCurrentTrunkStatus();

  private:
    // The task that makes the row right again when the relay connection comes back; 0
    // when none is registered.
    int restoreId = 0;
    isa::RefPtr<vx7diag::VX7EventPublisher> publisher;
    vx7diag::Trunk* trunk = nullptr;
    int board;
    int line;
    [[maybe_unused]] int chan = 1;
    vx7diag::ConsoleTrunkObserver* observer = nullptr;
    isa::RefPtr<vx7diag::Observer> observerRef;
    vx7diag::Aspect* allAlarmsAspect = nullptr;
    vx7diag::Aspect* trunkStateAspect = nullptr;
    int row;
    int startingCol;
    View* view = nullptr;
};

}  // namespace lineprobe
