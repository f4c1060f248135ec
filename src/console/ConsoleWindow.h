#pragma once

#include <atomic>
#include <cstddef>
#include <string>

#include "console/LineEditor.h"
#include "console/WindowHandle.h"

namespace lineprobe {

class ConsoleDisplay;

// One curses window with the few drawing operations the tool needs. Every operation
// takes the display lock (DisplayGuard), which also stands for a per-window refresh
// lock: holding a guard across several calls makes them one update.
class ConsoleWindow {
  public:
    ConsoleWindow(ConsoleDisplay* display, int rows, int cols, int startRow, int startCol,
                  bool boxed);
    virtual ~ConsoleWindow() = default;

    virtual WindowHandle GetWindow();
    virtual int SetWindow(WindowHandle window);
    virtual void Refresh();
    virtual int PrintString(const char* text, int row, int col);
    virtual int SetAttrib(int attr);
    virtual int ClearAttrib(int attr);
    virtual int SetReverseVideo();
    virtual int SetNormalVideo();
    virtual int MoveCursor(int row, int col);
    virtual int ClearToEOL(int row, int col);
    virtual int ClearAll();
    virtual void DisableRefresh();
    virtual void EnableRefresh();

    enum class LineStatus { Complete, InputClosed };

    // Reads one line typed into this window, at the cursor, without ever holding the
    // display lock while waiting for a key, so that other threads can draw meanwhile.
    // The line is edited as in a shell (see LineEditor); lines read before are recalled
    // with Up and Down. A line longer than the rest of the row scrolls within it. At most
    // `maxLength` characters are kept. When the line ends the cursor moves to the start
    // of the next row, as a curses line read leaves it.
    LineStatus ReadLine(std::string& line, std::size_t maxLength);

  private:
    void DrawLine(int row, int col);

    WindowHandle window_ = nullptr;
    [[maybe_unused]] int rows_;
    [[maybe_unused]] int cols_;
    [[maybe_unused]] int startCol_;
    [[maybe_unused]] int startRow_;
    ConsoleDisplay* display_;
    std::atomic<bool> refreshEnabled_{true};
    // Keeps the lines typed into this window for recall; used by the main thread only.
    LineEditor editor_;
};

}  // namespace lineprobe
