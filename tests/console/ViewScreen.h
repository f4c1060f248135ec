#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <thread>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {

// Screen rows of the views windows: window row r of the phone views window is screen row
// PHONE_ROW0 + r, of the trunk views window TRUNK_ROW0 + r; window column c is screen
// column c + 1.
inline constexpr int SYSVIEW_ROW0 = 0;
inline constexpr int PHONE_ROW0 = 12;
inline constexpr int TRUNK_ROW0 = 24;
inline constexpr int WINDOW_COL0 = 1;

inline std::size_t CountLinesStartingWith(const std::string& text, const std::string& prefix) {
    std::size_t count = 0;
    std::size_t start = 0;
    while (start < text.size()) {
        if (text.compare(start, prefix.size(), prefix) == 0) {
            ++count;
        }
        const std::size_t end = text.find('\n', start);
        if (end == std::string::npos) {
            break;
        }
        start = end + 1;
    }
    return count;
}

// Types command lines and waits until each has run: its word looked up, and the prompt
// back empty, which the processor draws only once the command has returned.
class CommandRunner {
  public:
    explicit CommandRunner(TerminalSession& session) : session_(session) {}

    ::testing::AssertionResult Run(const std::string& line) {
        session_.TypeLine(line);
        ++lookups_;
        const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        for (;;) {
            const std::optional<std::string> log = session_.ReadLog();
            if (log &&
                CountLinesStartingWith(*log, "Calling CmdProcessor::FindCommand") >= lookups_) {
                break;
            }
            if (std::chrono::steady_clock::now() > deadline) {
                return ::testing::AssertionFailure() << "'" << line << "' was not looked up\n"
                                                     << session_.Dump();
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        if (!session_.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW, std::chrono::seconds(30))) {
            return ::testing::AssertionFailure() << "'" << line << "' did not return\n"
                                                 << session_.Dump();
        }
        return session_.StillRunning();
    }

    // The result row of the command window, without the trailing blanks.
    std::string Result() {
        std::string row = session_.Row(RESULT_ROW);
        row.erase(row.find_last_not_of(' ') + 1);
        return row.size() > static_cast<std::size_t>(RESULT_COL) ? row.substr(RESULT_COL) : "";
    }

  private:
    TerminalSession& session_;
    std::size_t lookups_ = 0;
};

// A whole screen row with its trailing blanks cut.
inline std::string Trimmed(TerminalSession& session, int row) {
    std::string text = session.Row(row);
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

}  // namespace lineprobe::testing
