#include "console/ConsoleWindow.h"

#include <poll.h>
#include <unistd.h>

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

// The editor's code for a key as curses reports it; 0, which the editor ignores, for the
// function keys it has no use for.
int EditorKey(int key) {
    switch (key) {
        case KEY_ENTER:
            return '\n';
        case KEY_LEFT:
            return LineEditor::Left;
        case KEY_RIGHT:
            return LineEditor::Right;
        case KEY_HOME:
            return LineEditor::Home;
        case KEY_END:
            return LineEditor::End;
        case KEY_UP:
            return LineEditor::Up;
        case KEY_DOWN:
            return LineEditor::Down;
        case KEY_BACKSPACE:
            return LineEditor::Backspace;
        case KEY_DC:
            return LineEditor::Delete;
        default:
            return key >= 0 && key <= 0xff ? key : 0;
    }
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
    if (refreshEnabled_) {
        display_->RefreshWindow(window_);
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
    int row = 0;
    int col = 0;
    {
        DisplayGuard guard;
        if (window_ == nullptr) {
            return LineStatus::InputClosed;
        }
        row = getcury(window_);
        col = getcurx(window_);
        editor_.Start(maxLength);
        display_->SetCursorWindow(window_);
        Refresh();
    }

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
        for (int key = display_->ReadKey(); key != ERR; key = display_->ReadKey()) {
            gotKey = true;
            if (editor_.Feed(EditorKey(key)) == LineEditor::Result::Entered) {
                line = editor_.Line();
                const int nextRow = row + 1;
                if (nextRow < getmaxy(window_)) {
                    wmove(window_, nextRow, 0);
                }
                Refresh();
                return LineStatus::Complete;
            }
        }
        if (gotKey) {
            DrawLine(row, col);
            Refresh();
        }

        if (ready > 0 && !gotKey) {
            if (++emptyWakeups >= MAX_EMPTY_WAKEUPS) {
                return LineStatus::InputClosed;
            }
        } else {
            emptyWakeups = 0;
        }
    }
}

void ConsoleWindow::DrawLine(int row, int col) {
    if (!display_->IsEchoOn()) {
        return;
    }
    // The window's last column lies one past a terminal of the smallest width: the line
    // ends one column short of it.
    const int width = getmaxx(window_) - 1 - col;
    const LineEditor::Visible shown = editor_.Show(width > 0 ? static_cast<std::size_t>(width) : 0);
    mvwaddnstr(window_, row, col, shown.text.c_str(), static_cast<int>(shown.text.size()));
    wclrtoeol(window_);
    wmove(window_, row, col + static_cast<int>(shown.cursor));
}

}  // namespace lineprobe
