#pragma once

#include <atomic>
#include <vector>

#include "console/WindowHandle.h"

namespace lineprobe {

// The terminal: starts and stops curses, hands out windows and draws on the standard
// screen. One per process. Every operation takes the display lock (DisplayGuard).
class ConsoleDisplay {
  public:
    static ConsoleDisplay* GetDisplay();

    virtual int DrawHorizontalLine(int row, int col, int length);
    virtual void Refresh();

    // Checks the size of the terminal on standard input and starts curses; 0 or -1.
    // The size messages go to std::cerr, which is still the terminal at this point.
    int Start(int minCols, int minRows);
    // Ends curses if it was started; also the last step of every shutdown.
    int Stop();

    WindowHandle NewWindow(int rows, int cols, int startRow, int startCol);
    void RefreshAllWindows();

    // Typed input is echoed by the command window's line reader while this is on;
    // curses' own echo stays off so that keys are only ever shown by that reader.
    void SetEcho(bool on) { echo_ = on; }
    bool IsEchoOn() const { return echo_; }

    // Hands the terminal to another program (the help pager) and takes it back. While
    // suspended, drawing still lands in the windows but nothing reaches the terminal;
    // Resume repaints the whole screen.
    void Suspend();
    void Resume();
    bool IsSuspended() const { return suspended_; }

    bool IsStarted() const { return started_; }

  protected:
    ConsoleDisplay() = default;

  private:
    static ConsoleDisplay* _instance;

    int minRows_ = 0;
    int minCols_ = 0;
    bool started_ = false;
    std::vector<WindowHandle> windows_;
    std::atomic<bool> echo_{false};
    std::atomic<bool> suspended_{false};
};

}  // namespace lineprobe
