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

    // Shows what was drawn in the window, unless output is held (see IsOutputHeld), and
    // leaves the terminal's cursor in the cursor window, so that a row drawn by an event
    // does not take it away from the line being typed.
    void RefreshWindow(WindowHandle window);
    void SetCursorWindow(WindowHandle window);

    // The next key typed, or the curses error value when none is waiting; never waits.
    // Keys are read through a window that nothing draws on: reading a key through a
    // window that has changes shows them, even while output is held.
    int ReadKey();

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

    // Repaints the whole screen at the terminal's present size: the layout is fixed, so
    // a larger terminal shows it in its top left corner. A terminal below the minimum
    // size gets a short notice instead, and the windows keep what is drawn into them,
    // without showing it, until the terminal is large enough again. Runs on the thread
    // that watches for size changes, and after the pager.
    void Redraw();
    // True while the terminal is below the minimum size.
    bool IsTooSmall() const { return tooSmall_; }
    // Nothing reaches the terminal while the pager has it or while it is too small.
    bool IsOutputHeld() const { return suspended_ || tooSmall_; }

    bool IsStarted() const { return started_; }

  protected:
    ConsoleDisplay() = default;

  private:
    // A window with the size and place it was made with, which a change of the terminal's
    // size must not alter.
    struct Placed {
        WindowHandle window;
        int rows;
        int cols;
        int startRow;
        int startCol;
    };

    void WatchResizes();
    void ShowTooSmall(int rows, int cols);

    static ConsoleDisplay* _instance;

    int minRows_ = 0;
    int minCols_ = 0;
    bool started_ = false;
    bool stopped_ = false;
    std::vector<Placed> windows_;
    WindowHandle cursorWindow_ = nullptr;
    WindowHandle inputWindow_ = nullptr;
    std::atomic<bool> echo_{false};
    std::atomic<bool> suspended_{false};
    std::atomic<bool> tooSmall_{false};
};

}  // namespace lineprobe
