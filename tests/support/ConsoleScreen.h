#pragma once

// The console layout as the operator sees it, and the typing of commands, for terminal tests.

#include <chrono>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "TerminalSession.h"

namespace lineprobe::testing {

// The command window starts at screen row 36, column 1; its row 1 holds the prompt and
// its row 2, column 1 the result of the last command.
inline constexpr int PROMPT_ROW = 37;
inline constexpr int PROMPT_COL = 2;
inline constexpr int RESULT_ROW = 38;
inline constexpr int RESULT_COL = 2;
inline constexpr const char* PROMPT = "-> ";
// The prompt row with nothing typed, as a trimmed row reads.
inline constexpr const char* EMPTY_PROMPT_ROW = "  ->";

// Separator lines across the full width, on the standard screen.
inline constexpr int SEPARATOR_ROWS[] = {11, 23, 35};

// Screen rows of the views windows: window row r of the phone views window is screen row
// PHONE_ROW0 + r, of the trunk views window TRUNK_ROW0 + r; window column c is screen
// column c + 1.
inline constexpr int PHONE_ROW0 = 12;
inline constexpr int TRUNK_ROW0 = 24;
inline constexpr int WINDOW_COL0 = 1;

inline constexpr const char* LOOKUP_TRACE = "Calling CmdProcessor::FindCommand: cmdStr= ";

// A separator line: the first 100 columns all hold one and the same line character
// (how a line-drawing character reads back depends on the terminal type).
inline bool IsSeparatorRow(const std::string& row) {
    return row.size() >= 100 && row[0] != ' ' && row.find_first_not_of(row[0]) >= 100;
}

// Passes when the separator rows of the layout are whole.
inline ::testing::AssertionResult SeparatorsDrawn(TerminalSession& session) {
    const std::vector<std::string> screen = session.Screen();
    for (int row : SEPARATOR_ROWS) {
        if (!IsSeparatorRow(screen[static_cast<std::size_t>(row)])) {
            return ::testing::AssertionFailure() << "no separator on row " << row << ":\n"
                                                 << session.Dump();
        }
    }
    return ::testing::AssertionSuccess();
}

inline std::size_t CountOccurrences(const std::string& text, const std::string& what) {
    std::size_t count = 0;
    for (std::size_t at = text.find(what); at != std::string::npos;
         at = text.find(what, at + what.size())) {
        ++count;
    }
    return count;
}

inline std::string Trimmed(std::string row) {
    row.erase(row.find_last_not_of(' ') + 1);
    return row;
}

// A whole screen row with its trailing blanks cut.
inline std::string Trimmed(TerminalSession& session, int row) {
    return Trimmed(session.Row(row));
}

// Types command lines and waits until each has run: its word looked up, and the prompt
// back empty, which the processor draws only once the command has returned. The time taken
// is what the operator waited for the prompt.
class CommandRunner {
  public:
    using Clock = std::chrono::steady_clock;

    explicit CommandRunner(TerminalSession& session) : session_(session) {}

    struct Outcome {
        bool returned = false;
        std::chrono::milliseconds took{0};
    };

    Outcome Run(const std::string& line, std::chrono::milliseconds limit) {
        const auto start = Clock::now();
        TypeOnly(line);
        Outcome outcome;
        bool lookedUp = false;
        while (Clock::now() < start + limit) {
            if (!lookedUp) {
                const std::optional<std::string> log = session_.ReadLog();
                lookedUp = log && CountOccurrences(*log, LOOKUP_TRACE) >= lookups_;
            }
            if (lookedUp && Trimmed(session_, PROMPT_ROW) == EMPTY_PROMPT_ROW) {
                outcome.returned = true;
                break;
            }
            if (!session_.IsAlive()) {
                break;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        outcome.took = std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - start);
        return outcome;
    }

    ::testing::AssertionResult Run(const std::string& line) {
        if (!Run(line, std::chrono::seconds(30)).returned) {
            return ::testing::AssertionFailure() << "'" << line << "' did not return\n"
                                                 << session_.Dump();
        }
        return session_.StillRunning();
    }

    // Types the line and goes on; a later Run waits for this line's lookup too.
    void TypeOnly(const std::string& line) {
        session_.TypeLine(line);
        ++lookups_;
    }

    // Runs the line and gives its result row; why it did not run, when it did not.
    std::string Output(const std::string& line) {
        const ::testing::AssertionResult ran = Run(line);
        return ran ? Result() : std::string("(did not run) ") + ran.message();
    }

    // The result row of the command window, without the trailing blanks.
    std::string Result() {
        std::string row = Trimmed(session_, RESULT_ROW);
        return row.size() > static_cast<std::size_t>(RESULT_COL) ? row.substr(RESULT_COL) : "";
    }

  private:
    TerminalSession& session_;
    std::size_t lookups_ = 0;
};

}  // namespace lineprobe::testing
