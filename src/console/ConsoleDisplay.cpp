#include "console/ConsoleDisplay.h"

#include <fcntl.h>
#include <pthread.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <iostream>
#include <string>
#include <thread>

#include "console/Curses.h"
#include "console/DisplayGuard.h"

namespace lineprobe {

namespace {

// Written by the handler of SIGWINCH, read by the thread that redraws: a signal handler
// must not call curses, nor wait for the display lock.
int g_resizePipe[2] = {-1, -1};

void OnWindowChange(int) {
    const int saved = errno;
    const char wake = 'w';
    // A full pipe already holds a wake-up: nothing is lost by dropping this one.
    [[maybe_unused]] const ssize_t written = write(g_resizePipe[1], &wake, 1);
    errno = saved;
}

// Installed before curses starts, which then leaves SIGWINCH to the program: curses'
// own handling would shrink the windows, and what they hold with them, to a terminal
// below the minimum size.
bool CatchWindowChanges() {
    if (pipe2(g_resizePipe, O_CLOEXEC) != 0) {
        return false;
    }
    fcntl(g_resizePipe[1], F_SETFL, fcntl(g_resizePipe[1], F_GETFL) | O_NONBLOCK);
    struct sigaction action {};
    action.sa_handler = OnWindowChange;
    sigemptyset(&action.sa_mask);
    // Other threads read and wait on sockets and pipes; a resize must not cut those short.
    action.sa_flags = SA_RESTART;
    return sigaction(SIGWINCH, &action, nullptr) == 0;
}

// The terminal's clear-screen string without its padding, or nothing if it has none.
std::string ClearScreenSequence() {
    const char* clear = tigetstr("clear");
    if (clear == nullptr || clear == reinterpret_cast<char*>(-1)) {
        return {};
    }
    std::string sequence;
    for (const char* c = clear; *c != '\0'; ++c) {
        if (c[0] == '$' && c[1] == '<') {
            while (*c != '\0' && *c != '>') {
                ++c;
            }
            if (*c == '\0') {
                break;
            }
            continue;
        }
        sequence += *c;
    }
    return sequence;
}

void WriteAll(const std::string& text) {
    std::size_t done = 0;
    while (done < text.size()) {
        const ssize_t written = write(STDOUT_FILENO, text.data() + done, text.size() - done);
        if (written > 0) {
            done += static_cast<std::size_t>(written);
        } else if (written < 0 && errno != EINTR) {
            return;
        }
    }
}

}  // namespace

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

    const bool watchResizes = CatchWindowChanges();
    initscr();
    cbreak();
    noecho();
    keypad(stdscr, TRUE);
    // A lone Escape would otherwise hold the display lock for a whole second while curses
    // waits to see whether a key sequence follows.
    set_escdelay(25);
    inputWindow_ = newwin(1, 1, 0, 0);
    if (inputWindow_ != nullptr) {
        nodelay(inputWindow_, TRUE);
        keypad(inputWindow_, TRUE);
        // Marked as shown, so that reading a key never refreshes it, which would take the
        // cursor to its corner. The corner of the standard screen is blank, as it is.
        wnoutrefresh(inputWindow_);
    }
    refresh();
    started_ = true;
    if (watchResizes) {
        // With every signal blocked, so that the process' signals are taken by the other
        // threads and never run the shutdown on this one while it redraws.
        sigset_t all;
        sigset_t previous;
        sigfillset(&all);
        pthread_sigmask(SIG_SETMASK, &all, &previous);
        std::thread([this] { WatchResizes(); }).detach();
        pthread_sigmask(SIG_SETMASK, &previous, nullptr);
    }
    return 0;
}

void ConsoleDisplay::WatchResizes() {
    char wakes[64];
    for (;;) {
        const ssize_t got = read(g_resizePipe[0], wakes, sizeof wakes);
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            return;
        }
        try {
            Redraw();
        } catch (...) {
            // Out of memory for the notice: the next size change tries again.
        }
    }
}

void ConsoleDisplay::Redraw() {
    DisplayGuard guard;
    if (!started_ || stopped_ || suspended_) {
        return;
    }
    winsize size{};
    const bool sizeKnown = ioctl(STDIN_FILENO, TIOCGWINSZ, &size) == 0;
    if (sizeKnown && (size.ws_row < minRows_ || size.ws_col < minCols_)) {
        tooSmall_ = true;
        ShowTooSmall(size.ws_row, size.ws_col);
        return;
    }
    tooSmall_ = false;

    // Curses is only ever told of sizes that hold the whole layout. It widens windows that
    // span the old width to the new one; put every window back to its own size and place.
    if (sizeKnown) {
        resizeterm(size.ws_row, size.ws_col);
    }
    if (inputWindow_ != nullptr) {
        wnoutrefresh(inputWindow_);
    }
    for (const Placed& placed : windows_) {
        if (getmaxy(placed.window) != placed.rows || getmaxx(placed.window) != placed.cols) {
            wresize(placed.window, placed.rows, placed.cols);
        }
        if (getbegy(placed.window) != placed.startRow ||
            getbegx(placed.window) != placed.startCol) {
            mvwin(placed.window, placed.startRow, placed.startCol);
        }
    }

    // The terminal shows something else (the notice, the pager, a garbled resize): paint
    // everything the windows hold, the standard screen with its separator lines first
    // since the windows lie on top of it, and the cursor where the prompt has it.
    clearok(curscr, TRUE);
    touchwin(stdscr);
    wnoutrefresh(stdscr);
    for (const Placed& placed : windows_) {
        touchwin(placed.window);
        wnoutrefresh(placed.window);
    }
    if (cursorWindow_ != nullptr) {
        wnoutrefresh(cursorWindow_);
    }
    doupdate();
}

void ConsoleDisplay::ShowTooSmall(int rows, int cols) {
    // Written past curses, whose picture of the screen stays that of the full layout; the
    // repaint once the terminal has grown starts from a cleared screen.
    WriteAll(ClearScreenSequence() + "terminal too small: " + std::to_string(minRows_) + "x" +
             std::to_string(minCols_) + " needed (now " + std::to_string(rows) + "x" +
             std::to_string(cols) + ")");
}

int ConsoleDisplay::Stop() {
    DisplayGuard guard;
    if (started_) {
        endwin();
        stopped_ = true;
    }
    return 0;
}

WindowHandle ConsoleDisplay::NewWindow(int rows, int cols, int startRow, int startCol) {
    DisplayGuard guard;
    WINDOW* window = newwin(rows, cols, startRow, startCol);
    if (window != nullptr) {
        windows_.push_back({window, rows, cols, startRow, startCol});
    }
    return window;
}

void ConsoleDisplay::RefreshAllWindows() {
    DisplayGuard guard;
    if (!IsOutputHeld()) {
        doupdate();
    }
}

void ConsoleDisplay::RefreshWindow(WindowHandle window) {
    DisplayGuard guard;
    if (window == nullptr || IsOutputHeld()) {
        return;
    }
    wnoutrefresh(window);
    if (cursorWindow_ != nullptr && cursorWindow_ != window) {
        wnoutrefresh(cursorWindow_);
    }
    doupdate();
}

void ConsoleDisplay::SetCursorWindow(WindowHandle window) {
    DisplayGuard guard;
    cursorWindow_ = window;
}

int ConsoleDisplay::ReadKey() {
    DisplayGuard guard;
    if (inputWindow_ == nullptr || suspended_) {
        return ERR;
    }
    return wgetch(inputWindow_);
}

int ConsoleDisplay::DrawHorizontalLine(int row, int col, int length) {
    DisplayGuard guard;
    if (wmove(stdscr, row, col) != ERR) {
        whline(stdscr, 0, length);
    }
    if (!IsOutputHeld()) {
        refresh();
    }
    return 0;
}

void ConsoleDisplay::Refresh() {
    DisplayGuard guard;
    if (!IsOutputHeld()) {
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
    // The pager has painted over everything, rows drawn meanwhile never reached the
    // terminal, and the terminal may have changed its size.
    Redraw();
}

}  // namespace lineprobe
