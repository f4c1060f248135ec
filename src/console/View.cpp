#include "console/View.h"

namespace lineprobe {

View::View(ConsoleDisplay* display, int rows, int cols, int startRow, int startCol)
    : ConsoleWindow(display, rows, cols, startRow, startCol, false),
      rows_(rows),
      cols_(cols),
      startCol_(startCol),
      startRow_(startRow),
      display_(display) {}

int View::SetVisible() {
    Refresh();
    return 0;
}

int View::Hide() {
    return 0;
}

int View::ClearAll(int startRow) {
    if (startRow < 0) {
        return 1;
    }
    for (int row = startRow; row <= rows_; ++row) {
        ClearToEOL(row, 1);
    }
    return 0;
}

}  // namespace lineprobe
