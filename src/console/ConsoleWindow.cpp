#include "console/ConsoleWindow.h"

#include <poll.h>
#include <unistd.h>

#include <chrono>

#include "console/ConsoleDisplay.h"
#include "console/Curses.h"
#include "console/DisplayGuard.h"

namespace lineprobe {

namespace {

// Bounds the wait for a key so that input curses has already taken into its own buffer
// (and so cannot be seen by poll) is picked up soon all the same.
constexpr int KEY_POLL_INTERVAL_MS = 250;

// Wake-ups that report input yet yield no key; this many in a row mean the input is gone.
constexpr int MAX_EMPTY_WAKEUPS = 40;

bool IsEndOfLine(int key) {
    return key == '\n' || key == '\r' || key == KEY_ENTER;
}

bool IsErase(int key) {
    return key == KEY_BACKSPACE || key == 127 || key == '\b';
}

bool IsPrintable(int key) {
    return key >= 0x20 && key < 0x7f;
}

}  // namespace

ConsoleWindow::ConsoleWindow(ConsoleDisplay* display, int rows, int cols, int startRow,
                             int startCol, bool boxed)
    : rows_(rows), cols_(cols), startCol_(startCol), startRow_(startRow), display_(display) {
    DisplayGuard guard;
    window_ = display_->NewWindow(rows, cols, startRow, startCol);
    if (boxed && window_ != nullptr) {
        box(window_, 0, 0);
    }
}

WindowHandle ConsoleWindow::GetWindow() {
    return window_;
}

int ConsoleWindow::SetWindow(WindowHandle window) {
    DisplayGuard guard;
    window_ = window;
    return 0;
}

void ConsoleWindow::Refresh() {
    DisplayGuard guard;
    if (refreshEnabled_ && !display_->IsSuspended()) {
        wrefresh(window_);
    }
}

int ConsoleWindow::PrintString(const char* text, int row, int col) {
    DisplayGuard guard;
    mvwprintw(window_, row, col, "%s", text);
    return 0;
}

int ConsoleWindow::SetAttrib(int attr) {
    DisplayGuard guard;
    wattr_on(window_, static_cast<attr_t>(attr), nullptr);
    return 0;
}

int ConsoleWindow::ClearAttrib(int attr) {
    DisplayGuard guard;
    wattr_off(window_, static_cast<attr_t>(attr), nullptr);
    return 0;
}

int ConsoleWindow::SetReverseVideo() {
    DisplayGuard guard;
    wattr_on(window_, A_REVERSE, nullptr);
    return 0;
}

int ConsoleWindow::SetNormalVideo() {
    DisplayGuard guard;
    wattr_off(window_, A_REVERSE, nullptr);
    return 0;
}

int ConsoleWindow::MoveCursor(int row, int col) {
    DisplayGuard guard;
    return wmove(window_, row, col);
}

int ConsoleWindow::ClearToEOL(int row, int col) {
    DisplayGuard guard;
    wmove(window_, row, col);
    Refresh();
    wclrtoeol(window_);
    Refresh();
    return 0;
}

int ConsoleWindow::ClearAll() {
    DisplayGuard guard;
    wclear(window_);
    Refresh();
    return 0;
}

void ConsoleWindow::DisableRefresh() {
    refreshEnabled_ = false;
}

void ConsoleWindow::EnableRefresh() {
    refreshEnabled_ = true;
}

ConsoleWindow::LineStatus ConsoleWindow::ReadLine(std::string& line, std::size_t maxLength) {
    line.clear();
    {
        DisplayGuard guard;
        if (window_ == nullptr) {
            return LineStatus::InputClosed;
        }
        nodelay(window_, TRUE);
        keypad(window_, TRUE);
        Refresh();
    }

    std::size_t shown = 0;
    int emptyWakeups = 0;
    for (;;) {
        pollfd input{STDIN_FILENO, POLLIN, 0};
        const int ready = poll(&input, 1, KEY_POLL_INTERVAL_MS);
        if (ready > 0 && (input.revents & (POLLHUP | POLLERR | POLLNVAL)) != 0 &&
            (input.revents & POLLIN) == 0) {
            return LineStatus::InputClosed;
        }

        DisplayGuard guard;
        bool gotKey = false;
        for (int key = wgetch(window_); key != ERR; key = wgetch(window_)) {
            gotKey = true;
            if (IsEndOfLine(key)) {
                const int nextRow = getcury(window_) + 1;
                if (nextRow < getmaxy(window_)) {
                    wmove(window_, nextRow, 0);
                }
                Refresh();
                return LineStatus::Complete;
            }
            if (IsErase(key)) {
                if (line.empty()) {
                    continue;
                }
                line.pop_back();
                // Only the characters that fitted on the row were shown; erase one of
                // them only when the line is no longer than what is on screen.
                const int col = getcurx(window_);
                if (display_->IsEchoOn() && col > 0 && line.size() < shown) {
                    mvwaddch(window_, getcury(window_), col - 1, ' ');
                    wmove(window_, getcury(window_), col - 1);
                    --shown;
                }
                continue;
            }
            if (!IsPrintable(key) || line.size() >= maxLength) {
                continue;
            }
            line.push_back(static_cast<char>(key));
            if (display_->IsEchoOn() && getcurx(window_) < getmaxx(window_) - 1) {
                waddch(window_, static_cast<chtype>(key));
                ++shown;
            }
        }
        Refresh();

        if (ready > 0 && !gotKey) {
            if (++emptyWakeups >= MAX_EMPTY_WAKEUPS) {
                return LineStatus::InputClosed;
            }
        } else {
            emptyWakeups = 0;
        }
    }
}

}  // namespace lineprobe
