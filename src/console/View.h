#pragma once

#include "console/ConsoleWindow.h"

namespace lineprobe {

// A window with its geometry: whatever draws on the screen is handed a View*.
class View : public ConsoleWindow {
  public:
    View(ConsoleDisplay* display, int rows, int cols, int startRow, int startCol);

    virtual int SetVisible();
    virtual int Hide();
    // Clears rows startRow up to and including the row count, from column 1. Rows past
    // the window's end do not move the cursor, so their clear acts where the cursor
    // stands: the command processor relies on that to wipe its result row.
    virtual int ClearAll(int startRow);
    using ConsoleWindow::ClearAll;

    ConsoleDisplay* GetDisplay() const { return display_; }
    int GetRowCount() const { return rows_; }

  private:
    int rows_;
    [[maybe_unused]] int cols_;
    [[maybe_unused]] int startCol_;
    [[maybe_unused]] int startRow_;
    ConsoleDisplay* display_;
};

}  // namespace lineprobe
