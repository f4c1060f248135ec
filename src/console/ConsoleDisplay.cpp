#include "console/ConsoleDisplay.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <iostream>

#include "console/Curses.h"
#include "console/DisplayGuard.h"

namespace lineprobe {

ConsoleDisplay* ConsoleDisplay::_instance = nullptr;

ConsoleDisplay* ConsoleDisplay::GetDisplay() {
    if (_instance == nullptr) {
        _instance = new ConsoleDisplay();
    }
    return _instance;
}

int ConsoleDisplay::Start(int minCols, int minRows) {
    DisplayGuard guard;
    if (started_) {
        return 0;
    }
    minCols_ = minCols;
    minRows_ = minRows;

    winsize size{};
    if (ioctl(STDIN_FILENO, TIOCGWINSZ, &size) != 0) {
        std::cerr << "The terminal size cannot be determined." << std::endl;
        return -1;
    }
    if (size.ws_row < minRows_ || size.ws_col < minCols_) {
        std::cerr << "The terminal size must be at least " << minRows_ << " rows and " << minCols_
                  << " columns." << std::endl;
        std::cerr << "current terminal size is: " << size.ws_row << " rows by " << size.ws_col
                  << " cols" << std::endl;
        return -1;
    }

    initscr();
    cbreak();
    noecho();
    keypad(stdscr, TRUE);
    // A lone Escape would otherwise hold the display lock for a whole second while curses
    // waits to see whether a key sequence follows.
    set_escdelay(25);
    refresh();
    started_ = true;
    return 0;
}

int ConsoleDisplay::Stop() {
    DisplayGuard guard;
    if (started_) {
        endwin();
    }
    return 0;
}

WindowHandle ConsoleDisplay::NewWindow(int rows, int cols, int startRow, int startCol) {
    DisplayGuard guard;
    WINDOW* window = newwin(rows, cols, startRow, startCol);
    if (window != nullptr) {
        windows_.push_back(window);
    }
    return window;
}

void ConsoleDisplay::RefreshAllWindows() {
    DisplayGuard guard;
    if (!suspended_) {
        doupdate();
    }
}

int ConsoleDisplay::DrawHorizontalLine(int row, int col, int length) {
    DisplayGuard guard;
    if (wmove(stdscr, row, col) != ERR) {
        whline(stdscr, 0, length);
    }
    if (!suspended_) {
        refresh();
    }
    return 0;
}

void ConsoleDisplay::Refresh() {
    DisplayGuard guard;
    if (!suspended_) {
        refresh();
    }
}

void ConsoleDisplay::Suspend() {
    DisplayGuard guard;
    if (!started_ || suspended_) {
        return;
    }
    def_prog_mode();
    endwin();
    suspended_ = true;
}

void ConsoleDisplay::Resume() {
    DisplayGuard guard;
    if (!suspended_) {
        return;
    }
    reset_prog_mode();
    suspended_ = false;
    // The pager has painted over everything, and rows drawn meanwhile never reached the
    // terminal: repaint from what the windows hold, the standard screen first since the
    // windows lie on top of it.
    clearok(curscr, TRUE);
    touchwin(stdscr);
    wnoutrefresh(stdscr);
    for (WINDOW* window : windows_) {
        touchwin(window);
        wnoutrefresh(window);
    }
    doupdate();
}

}  // namespace lineprobe
