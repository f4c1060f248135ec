#include "TerminalSession.h"

#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <thread>

namespace lineprobe::testing {

namespace {

constexpr std::chrono::milliseconds POLL_STEP{20};
constexpr const char* SESSION = "lp";

std::string ShellQuote(const std::string& text) {
    std::string quoted = "'";
    for (char c : text) {
        if (c == '\'') {
            quoted += "'\\''";
        } else {
            quoted += c;
        }
    }
    return quoted + "'";
}

// Runs the command without a shell's reading of its words. The tmux client, and so its server
// and panes, gets a plain C locale, so that line-drawing characters are read back one byte per
// column, and no trace of a tmux the tests themselves may run in. A command that succeeds
// writes nothing on its standard error, so the two are read together: a redirection of the
// shell to a file would create that file if it were missing.
std::string RunCapture(const std::vector<std::string>& argv, int* status) {
    std::string command = "env -u TMUX -u TMUX_PANE LC_ALL=C";
    for (const std::string& arg : argv) {
        command += " " + ShellQuote(arg);
    }
    return ShellOutput(command + " 2>&1 </dev/null", status);
}

template <typename Predicate>
bool PollUntil(std::chrono::milliseconds timeout, Predicate done) {
    const auto deadline = std::chrono::steady_clock::now() + timeout;
    while (!done()) {
        if (std::chrono::steady_clock::now() >= deadline) {
            return false;
        }
        std::this_thread::sleep_for(POLL_STEP);
    }
    return true;
}

std::string Trimmed(std::string text) {
    text.erase(text.find_last_not_of(" \n") + 1);
    return text;
}

}  // namespace

std::string ShellOutput(const std::string& command, int* status) {
    std::string output;
    FILE* pipe = popen(command.c_str(), "r");
    if (pipe == nullptr) {
        throw std::runtime_error("cannot run " + command);
    }
    char buffer[4096];
    for (std::size_t got; (got = fread(buffer, 1, sizeof buffer, pipe)) > 0;) {
        output.append(buffer, got);
    }
    const int waitStatus = pclose(pipe);
    if (status != nullptr) {
        *status = WIFEXITED(waitStatus) ? WEXITSTATUS(waitStatus) : -1;
    }
    return output;
}

std::optional<std::string> ReadWholeFile(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        return std::nullopt;
    }
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

bool HasLine(const std::string& text, const std::string& line) {
    std::istringstream lines(text);
    for (std::string each; std::getline(lines, each);) {
        if (each == line) {
            return true;
        }
    }
    return false;
}

TerminalSession::TerminalSession(TerminalOptions options)
    : rows_(options.rows), cols_(options.cols) {
    static std::atomic<int> counter{0};
    std::string pattern = (std::filesystem::temp_directory_path() / "lp-term-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) {
        throw std::runtime_error("cannot make a temporary directory");
    }
    root_ = pattern;
    workDir_ = root_ / "work";
    std::filesystem::create_directory(workDir_);
    for (const auto& [name, content] : options.files) {
        std::filesystem::create_directories((workDir_ / name).parent_path());
        std::ofstream(workDir_ / name, std::ios::binary) << content;
    }
    {
        std::ofstream conf(root_ / "tmux.conf");
        conf << "set -g status off\n"
                "set -g default-terminal screen\n"
                "set -g escape-time 0\n";
    }
    socket_ = "lp-test-" + std::to_string(getpid()) + "-" + std::to_string(counter++) + "-" +
              root_.filename().string();

    // The program runs in the foreground of the pane's shell, which records its exit
    // status and then keeps the pane open, so the last screen stays readable. The inner
    // shell writes its pid and becomes the program, so that signals reach the program.
    // When the terminal is hung up (HangUp) the pane's shell gets SIGHUP: its trap waits
    // for the program and records its status all the same, then leaves.
    const std::string statusFile = (root_ / "status").string();
    const std::string recordStatus = "echo $? > " + ShellQuote(statusFile + ".new") + " && mv " +
                                     ShellQuote(statusFile + ".new") + " " + ShellQuote(statusFile);
    std::string command = "trap " + ShellQuote(recordStatus + "; exit") + " HUP; env";
    for (const std::string& name : options.unsetEnv) {
        command += " -u " + ShellQuote(name);
    }
    for (const auto& [name, value] : options.env) {
        command += " " + ShellQuote(name + "=" + value);
    }
    command += " sh -c 'echo $$ > \"$0\"; exec \"$@\"' " + ShellQuote((root_ / "pid").string());
    command += " " + ShellQuote(LINEPROBE_BINARY);
    for (const std::string& arg : options.args) {
        command += " " + ShellQuote(arg);
    }
    command += "; " + recordStatus + "; exec sleep infinity";

    int status = 0;
    RunCapture({"tmux", "-L", socket_, "-f", (root_ / "tmux.conf").string(), "new-session", "-d",
                "-s", SESSION, "-x", std::to_string(cols_), "-y", std::to_string(rows_), "-c",
                workDir_.string(), command},
               &status);
    if (status != 0) {
        throw std::runtime_error("tmux could not start the session");
    }
    std::optional<std::string> pid;
    PollUntil(DEFAULT_WAIT, [&] {
        pid = ReadWholeFile(root_ / "pid");
        return pid && !pid->empty() && pid->back() == '\n';
    });
    if (!pid || pid->empty()) {
        throw std::runtime_error("the program did not start in the terminal");
    }
    pid_ = static_cast<pid_t>(std::stol(*pid));
}

TerminalSession::~TerminalSession() {
    // A program still running would take the closing terminal for a hang-up and stop its
    // views, which against a relay already gone means waiting out every request.
    if (pid_ > 0 && !ExitStatus()) {
        kill(pid_, SIGKILL);
    }
    try {
        Tmux({"kill-server"});
    } catch (...) {
    }
    std::error_code ignored;
    std::filesystem::remove_all(root_, ignored);
}

std::string TerminalSession::Tmux(const std::vector<std::string>& args, int* status) {
    std::vector<std::string> argv = {"tmux", "-L", socket_};
    argv.insert(argv.end(), args.begin(), args.end());
    return RunCapture(argv, status);
}

std::string TerminalSession::PaneFormat(const std::string& format) {
    return Trimmed(Tmux({"display-message", "-p", "-t", SESSION, format}));
}

void TerminalSession::Type(const std::string& text) {
    if (!text.empty()) {
        Tmux({"send-keys", "-t", SESSION, "-l", text});
    }
}

void TerminalSession::TypeLine(const std::string& text) {
    Type(text);
    SendKeys({"Enter"});
}

void TerminalSession::SendKeys(const std::vector<std::string>& keys) {
    std::vector<std::string> args = {"send-keys", "-t", SESSION};
    args.insert(args.end(), keys.begin(), keys.end());
    Tmux(args);
}

void TerminalSession::Resize(int rows, int cols) {
    int status = 0;
    Tmux({"resize-window", "-t", SESSION, "-x", std::to_string(cols), "-y", std::to_string(rows)},
         &status);
    if (status != 0) {
        throw std::runtime_error("tmux could not resize the window");
    }
    rows_ = rows;
    cols_ = cols;
}

std::pair<int, int> TerminalSession::Cursor() {
    const std::string position = PaneFormat("#{cursor_y} #{cursor_x}");
    std::istringstream fields(position);
    int row = -1;
    int col = -1;
    fields >> row >> col;
    return {row, col};
}

std::vector<std::string> TerminalSession::Screen() {
    const std::vector<std::string> capture = {"capture-pane", "-p", "-t", SESSION};
    std::istringstream lines(Tmux(capture));
    std::vector<std::string> screen;
    for (std::string line; std::getline(lines, line) && static_cast<int>(screen.size()) < rows_;) {
        line.resize(static_cast<std::size_t>(cols_), ' ');
        screen.push_back(line);
    }
    while (static_cast<int>(screen.size()) < rows_) {
        screen.emplace_back(static_cast<std::size_t>(cols_), ' ');
    }
    return screen;
}

std::string TerminalSession::Row(int row) {
    const std::vector<std::string> screen = Screen();
    return row >= 0 && row < rows_ ? screen[static_cast<std::size_t>(row)] : std::string();
}

std::string TerminalSession::TextAt(int row, int col, std::size_t length) {
    const std::string line = Row(row);
    if (col < 0 || static_cast<std::size_t>(col) >= line.size()) {
        return {};
    }
    return line.substr(static_cast<std::size_t>(col), length);
}

std::string TerminalSession::Dump() {
    std::ostringstream out;
    const std::vector<std::string> screen = Screen();
    for (std::size_t row = 0; row < screen.size(); ++row) {
        out << (row < 10 ? " " : "") << row << "|" << Trimmed(screen[row]) << "\n";
    }
    return out.str();
}

::testing::AssertionResult TerminalSession::Waited(bool found, const std::string& what) {
    if (found) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "no " << what << " on the screen:\n" << Dump();
}

::testing::AssertionResult TerminalSession::WaitForTextAt(int row, int col, const std::string& text,
                                                          std::chrono::milliseconds timeout) {
    const bool found = PollUntil(timeout, [&] { return TextAt(row, col, text.size()) == text; });
    return Waited(found, "'" + text + "' at " + std::to_string(row) + "," + std::to_string(col));
}

::testing::AssertionResult TerminalSession::WaitForText(const std::string& text,
                                                        std::chrono::milliseconds timeout) {
    const bool found = PollUntil(timeout, [&] {
        for (const std::string& line : Screen()) {
            if (line.find(text) != std::string::npos) {
                return true;
            }
        }
        return false;
    });
    return Waited(found, "'" + text + "'");
}

::testing::AssertionResult TerminalSession::WaitForRow(int row, const std::string& text,
                                                       std::chrono::milliseconds timeout) {
    const bool found = PollUntil(timeout, [&] { return Trimmed(Row(row)) == text; });
    return Waited(found, "row " + std::to_string(row) + " reading '" + text + "'");
}

std::optional<std::string> TerminalSession::ReadFile(const std::string& name) const {
    return ReadWholeFile(workDir_ / name);
}

::testing::AssertionResult TerminalSession::WaitForLogLine(const std::string& file,
                                                           const std::string& text,
                                                           std::chrono::milliseconds timeout) {
    std::optional<std::string> content;
    if (PollUntil(timeout, [&] { return (content = ReadFile(file)) && HasLine(*content, text); })) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "no line '" << text << "' in " << file << ":\n"
                                         << content.value_or("(no file)");
}

bool TerminalSession::AlternateScreen() {
    return PaneFormat("#{alternate_on}") == "1";
}

std::string TerminalSession::TerminalModes() {
    return RunCapture({"stty", "-a", "-F", PaneFormat("#{pane_tty}")}, nullptr);
}

pid_t TerminalSession::Pid() {
    return pid_;
}

std::optional<int> TerminalSession::ExitStatus() const {
    const std::optional<std::string> status = ReadWholeFile(root_ / "status");
    if (!status || status->empty() || status->back() != '\n') {
        return std::nullopt;
    }
    return std::stoi(*status);
}

bool TerminalSession::IsAlive() {
    return !ExitStatus() && kill(pid_, 0) == 0;
}

::testing::AssertionResult TerminalSession::StillRunning() {
    if (IsAlive()) {
        return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure() << "lineprobe is no longer running (status "
                                         << ExitStatus().value_or(-1) << "); screen:\n"
                                         << Dump();
}

std::optional<int> TerminalSession::WaitForExit(std::chrono::milliseconds timeout) {
    std::optional<int> status;
    PollUntil(timeout, [&] { return (status = ExitStatus()).has_value(); });
    return status;
}

void TerminalSession::Signal(int sig) {
    kill(pid_, sig);
}

void TerminalSession::HangUp() {
    Tmux({"kill-pane", "-t", SESSION});
}

}  // namespace lineprobe::testing
