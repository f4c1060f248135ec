#pragma once

#include <sys/types.h>

#include <chrono>
#include <filesystem>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace lineprobe::testing {

// Waits are bounded but generous: the suite runs on a loaded two-core machine, and a
// wait that succeeds returns as soon as the screen shows what is looked for.
inline constexpr std::chrono::milliseconds DEFAULT_WAIT{15000};

struct TerminalOptions {
    int rows = 40;
    int cols = 100;
    std::vector<std::string> args;
    std::vector<std::pair<std::string, std::string>> env;
    std::vector<std::string> unsetEnv;
    // Files written into the working directory before the program starts; a name may
    // hold directories, which are made.
    std::vector<std::pair<std::string, std::string>> files;

    TerminalOptions& Size(int r, int c) {
        rows = r;
        cols = c;
        return *this;
    }
    TerminalOptions& Args(std::vector<std::string> a) {
        args = std::move(a);
        return *this;
    }
    TerminalOptions& File(std::string name, std::string content) {
        files.emplace_back(std::move(name), std::move(content));
        return *this;
    }
};

// Runs the real lineprobe in a pseudo-terminal of a private tmux server, in a fresh
// temporary working directory, and reads its screen and logs. The pane stays open after
// the program ends, so its last screen can still be read, and its shell records the exit
// status. The server, the directory and a program still running go with the session.
class TerminalSession {
  public:
    explicit TerminalSession(TerminalOptions options = {});
    ~TerminalSession();

    TerminalSession(const TerminalSession&) = delete;
    TerminalSession& operator=(const TerminalSession&) = delete;

    const std::filesystem::path& WorkDir() const { return workDir_; }

    // Types the text literally; TypeLine ends it with Enter.
    void Type(const std::string& text);
    void TypeLine(const std::string& text);
    // tmux key names: "Enter", "BSpace", "C-a", "Escape", "Left", "q", ...
    void SendKeys(const std::vector<std::string>& keys);

    // Resizes the terminal, as an operator dragging its corner would: the program gets
    // SIGWINCH. Screen() and Row() read the new size from then on.
    void Resize(int rows, int cols);
    // Where the terminal's cursor stands: {row, column}.
    std::pair<int, int> Cursor();

    // The screen, one string per row, each padded with blanks to the full width.
    std::vector<std::string> Screen();
    std::string Row(int row);
    std::string TextAt(int row, int col, std::size_t length);
    // The whole screen with row numbers, for failure messages.
    std::string Dump();

    // The waits fail with what they looked for and the screen as it was.
    ::testing::AssertionResult WaitForTextAt(int row, int col, const std::string& text,
                                             std::chrono::milliseconds timeout = DEFAULT_WAIT);
    ::testing::AssertionResult WaitForText(const std::string& text,
                                           std::chrono::milliseconds timeout = DEFAULT_WAIT);
    // Waits for the row to read exactly `text` followed by blanks only.
    ::testing::AssertionResult WaitForRow(int row, const std::string& text,
                                          std::chrono::milliseconds timeout = DEFAULT_WAIT);

    std::optional<std::string> ReadFile(const std::string& name) const;
    std::optional<std::string> ReadLog() const { return ReadFile("lineprobe.log"); }
    std::optional<std::string> ReadErrLog() const { return ReadFile("lineprobe_err.log"); }
    // Waits until the file holds `text` as a whole line; fails with what the file holds.
    ::testing::AssertionResult WaitForLogLine(const std::string& file, const std::string& text,
                                              std::chrono::milliseconds timeout = DEFAULT_WAIT);

    // Whether the pane shows the alternate screen (a curses program that has not ended
    // curses), and the modes of its terminal as `stty -a` prints them.
    bool AlternateScreen();
    std::string TerminalModes();

    pid_t Pid();
    bool IsAlive();
    // Passes when the program is still running; use after each step of a case.
    ::testing::AssertionResult StillRunning();
    // The exit status once the program has ended on its own, or nothing at the time-out.
    // A death by signal gives 128 + the signal number.
    std::optional<int> WaitForExit(std::chrono::milliseconds timeout = DEFAULT_WAIT);
    // The exit status if the program has ended, without waiting.
    std::optional<int> ExitStatus() const;
    void Signal(int sig);
    // Closes the terminal as a lost connection would: the program's input ends for good.
    // The screen cannot be read afterwards; the logs and the exit status can.
    void HangUp();

  private:
    std::string Tmux(const std::vector<std::string>& args, int* status = nullptr);
    std::string PaneFormat(const std::string& format);
    ::testing::AssertionResult Waited(bool found, const std::string& what);

    std::filesystem::path root_;
    std::filesystem::path workDir_;
    std::string socket_;
    int rows_;
    int cols_;
    pid_t pid_ = -1;
};

// What a shell command prints on its standard output; its exit status in `status`.
std::string ShellOutput(const std::string& command, int* status = nullptr);

// Reads a whole file; nothing if it cannot be opened.
std::optional<std::string> ReadWholeFile(const std::filesystem::path& path);

// True when `text` holds `line` as one of its lines.
bool HasLine(const std::string& text, const std::string& line);

}  // namespace lineprobe::testing
