// Start-up as the operator meets it: arguments that print and end, the terminal size check,
// the screen and the logs of a good start, and a relay that cannot be used.
#include <gtest/gtest.h>

#include <chrono>
#include <string>
#include <vector>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

using namespace std::chrono_literals;

const std::string USAGE = "for help on using lineprobe, look in /usr/orvane/bin/lineprobe_help.txt";
const std::string EARLIER_RUN = "trace of an earlier run\n";

struct EarlyEndCase {
    std::vector<std::string> args;
    int rows;
    int cols;
    int status;
    std::vector<std::string> screen;
};

// Arguments print and end with status 0 (which texts, in which order, is the unit test's);
// a terminal below 40x100 is refused with status 1. Neither touches the logs of an earlier
// run.
TEST(Startup, EarlyEndsShowTheirTextAndLeaveTheLogsAlone) {
    const std::string minimum = "The terminal size must be at least 40 rows and 100 columns.";
    const EarlyEndCase cases[] = {
        {{"-v", "x"}, 40, 100, 0, {"lineprobe version 1.0", "invalid argument", USAGE, ""}},
        {{}, 39, 100, 1, {minimum, "current terminal size is: 39 rows by 100 cols"}},
        {{}, 40, 99, 1, {minimum, "current terminal size is: 40 rows by 99 cols"}},
    };
    for (const EarlyEndCase& c : cases) {
        SCOPED_TRACE(c.screen[1]);
        TerminalSession session(
            TerminalOptions().Size(c.rows, c.cols).Args(c.args).File("lineprobe.log", EARLIER_RUN));
        ASSERT_EQ(session.WaitForExit(), std::optional<int>(c.status)) << session.Dump();
        for (std::size_t row = 0; row < c.screen.size(); ++row) {
            EXPECT_TRUE(session.WaitForRow(static_cast<int>(row), c.screen[row]));
        }
        EXPECT_EQ(session.ReadLog(), std::optional<std::string>(EARLIER_RUN));
        EXPECT_FALSE(session.ReadErrLog().has_value());
    }
}

// Both logs start empty on each run, and the analog board of the default farm ends its line
// walk on the board's refusal, which is no failure, so the trace reports none. The layout
// that a terminal of exactly the minimum shows is the prompt fuzz's baseline.
TEST(Startup, StartsIntoFreshLogs) {
    TerminalSession session(TerminalOptions()
                                .File("lineprobe.log", "stale trace line\n")
                                .File("lineprobe_err.log", "stale error line\n"));
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT));
    ASSERT_TRUE(session.WaitForLogLine("lineprobe.log", "command name: stoprai"));
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log);
    EXPECT_EQ(CountOccurrences(*log, "Calling CmdProcessor::RegisterCommand\n"), 23u);
    EXPECT_EQ(log->find("stale"), std::string::npos);
    EXPECT_EQ(log->find("UnexpectedMsg"), std::string::npos) << *log;
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    EXPECT_TRUE(session.StillRunning());
}

// A relay that cannot be used still ends the program by abort, but with the normal screen and
// the terminal's modes back, and the cause on the screen and in the error log. Every way of
// failing the open reaches this one report: how the transport judges each is its own test.
TEST(Startup, UnusableRelayIsReportedOnARestoredTerminal) {
    // Port 1 of the loopback: nobody serves it.
    const std::string address = "127.0.0.1:1";
    TerminalOptions options;
    options.env = {{"REMOTE_TKHOST", address}, {"VX7_FARM", LINEPROBE_FARMS_DIR "/default.toml"}};
    TerminalSession session(options);

    const std::string cause = "cannot reach the relay at " + address + ": ";
    EXPECT_EQ(session.WaitForExit(30s), 128 + 6) << session.Dump();
    EXPECT_FALSE(session.AlternateScreen()) << session.Dump();
    const std::string modes = session.TerminalModes();
    EXPECT_NE(modes.find(" icanon"), std::string::npos) << modes;
    EXPECT_NE(modes.find(" echo "), std::string::npos) << modes;
    EXPECT_TRUE(session.WaitForText("lineprobe: " + cause + "Connection refused", 2s));
    EXPECT_FALSE(session.WaitForText("terminate called", 0ms)) << session.Dump();
    const auto errors = session.ReadErrLog();
    ASSERT_TRUE(errors);
    EXPECT_EQ(errors->rfind(cause, 0), 0u) << *errors;
}

}  // namespace
}  // namespace lineprobe::testing
