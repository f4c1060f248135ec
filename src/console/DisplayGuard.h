#pragma once

#include <chrono>

namespace lineprobe {

// The one lock around every curses call of the process. Curses keeps global state, and
// event threads draw rows while the main thread prompts, so no two threads may be inside
// it at once. The lock is recursive: an observer holds a guard across several
// PrintString calls and the Refresh that shows them, and each of those calls takes the
// lock again, so that the whole row goes out at once.
//
//     {
//         lineprobe::DisplayGuard guard;
//         view->PrintString(callId, row, CALLID_START_COL);
//         view->PrintString(state, row, CALL_STATE_START_COL);
//         view->Refresh();
//     }
//
// Never hold a guard while waiting for something another thread must do (a reply, a
// key press): that thread may need the screen first.
class DisplayGuard {
  public:
    DisplayGuard();

    // For the shutdown path, which runs in a signal handler and must not hang on a
    // thread that keeps the screen. If the lock cannot be had within `bound`, this
    // thread stops taking it for good: its later guards own nothing and it goes on
    // without the lock, since the process is about to end.
    explicit DisplayGuard(std::chrono::milliseconds bound);

    ~DisplayGuard();

    DisplayGuard(const DisplayGuard&) = delete;
    DisplayGuard& operator=(const DisplayGuard&) = delete;

    bool Owns() const { return owns_; }

  private:
    bool owns_ = false;
};

}  // namespace lineprobe
