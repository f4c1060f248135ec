#pragma once

// Helpers shared by the whole-tool runs: commands typed with their duration measured, the
// resident memory of the lineprobe process, and settings that lengthen a run by hand.
#include <sys/types.h>

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <optional>
#include <string>
#include <thread>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {

using Clock = std::chrono::steady_clock;

// The suite also runs built with AddressSanitizer, lineprobe included: slower, and with a
// quarantine that holds freed memory, so the runs are shorter there and memory is not
// bounded.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr bool UNDER_SANITIZER = true;
#else
inline constexpr bool UNDER_SANITIZER = false;
#endif

// A whole-number setting from the environment, or the fallback when unset or not a number.
inline long EnvNumber(const char* name, long fallback) {
    const char* text = std::getenv(name);
    if (text == nullptr || *text == '\0') {
        return fallback;
    }
    char* end = nullptr;
    const long value = std::strtol(text, &end, 10);
    return *end == '\0' ? value : fallback;
}

// VmRSS of a process in KiB, or nothing once the process is gone.
inline std::optional<long> RssKiB(pid_t pid) {
    std::ifstream status("/proc/" + std::to_string(pid) + "/status");
    for (std::string line; std::getline(status, line);) {
        if (line.rfind("VmRSS:", 0) == 0) {
            return std::atol(line.c_str() + 6);
        }
    }
    return std::nullopt;
}

inline std::string ProcessName(pid_t pid) {
    std::ifstream comm("/proc/" + std::to_string(pid) + "/comm");
    std::string name;
    std::getline(comm, name);
    return name;
}

inline std::size_t CountOccurrences(const std::string& text, const std::string& what) {
    std::size_t count = 0;
    for (std::size_t at = text.find(what); at != std::string::npos;
         at = text.find(what, at + what.size())) {
        ++count;
    }
    return count;
}

inline const char* const LOOKUP_TRACE = "Calling CmdProcessor::FindCommand: cmdStr= ";

// Types one command line and waits until the processor has looked its word up and drawn
// the empty prompt again, which it does only once the command has returned. The time
// taken is what the operator waited for the prompt.
class TimedRunner {
  public:
    explicit TimedRunner(TerminalSession& session) : session_(session) {}

    struct Outcome {
        bool returned = false;
        std::chrono::milliseconds took{0};
    };

    Outcome Run(const std::string& line, std::chrono::milliseconds limit) {
        const auto start = Clock::now();
        session_.TypeLine(line);
        ++lookups_;
        const auto deadline = start + limit;
        Outcome outcome;
        bool lookedUp = false;
        while (Clock::now() < deadline) {
            if (!lookedUp) {
                const std::optional<std::string> log = session_.ReadLog();
                lookedUp = log && CountOccurrences(*log, LOOKUP_TRACE) >= lookups_;
            }
            if (lookedUp && Trimmed(session_.Row(PROMPT_ROW)) == EMPTY_PROMPT_ROW) {
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

    // Types the line and goes on; a later Run waits for this line's lookup too.
    void TypeOnly(const std::string& line) {
        session_.TypeLine(line);
        ++lookups_;
    }

    // The result row of the command window, without the trailing blanks.
    std::string Result() {
        std::string row = Trimmed(session_.Row(RESULT_ROW));
        return row.size() > static_cast<std::size_t>(RESULT_COL) ? row.substr(RESULT_COL) : "";
    }

    static std::string Trimmed(std::string row) {
        row.erase(row.find_last_not_of(' ') + 1);
        return row;
    }

  private:
    TerminalSession& session_;
    std::size_t lookups_ = 0;
};

}  // namespace lineprobe::testing
