#pragma once

#include <atomic>

#include "model/Observer.h"
#include "transport/IsaSync.h"

namespace lineprobe {
class View;
}

namespace vx7diag {

// Draws one row of the phone views window: the call id, channel state, call state and
// reason of one channel. Update runs on the reader thread of the channel's events; the
// first picture is drawn on the main thread by DisplayCurrentPhoneState.
class ConsolePhoneObserver : public Observer {
  public:
    ConsolePhoneObserver(int board, int line, int chan, int row, int col);

    void Update(Subject* subject, Aspect& aspect) override;
    // Draws the state read from the board when the view starts; 0 without a window, else 1.
    // Leaves the refresh to the caller.
    virtual int DisplayCurrentPhoneState(int callId, int callState, int chanState, int reason);

    void SetView(lineprobe::View* view);
    lineprobe::View* GetView();
    // The call id of the last call state shown; 0 until one has been.
    unsigned int GetCurCallId() const { return curCallId; }

  private:
    void PrintField(const char* text, int col);

    lineprobe::View* view = nullptr;
    char text[256] = {};
    isa::CriticalSection lock;
    [[maybe_unused]] int board;
    [[maybe_unused]] int line;
    [[maybe_unused]] int chan;
    int startingCol;
    int row;
    // Written by the reader thread, read by the commands on the main thread.
    std::atomic<unsigned int> curCallId{0};
};

}  // namespace vx7diag
