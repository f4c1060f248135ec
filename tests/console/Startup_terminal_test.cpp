// Start-up: the terminal size check, the screen it draws, and the two logs.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

struct SizeCase {
    const char* name;
    int rows;
    int cols;
    const char* current;
};

void PrintTo(const SizeCase& c, std::ostream* os) {
    *os << c.name;
}

class TooSmallTerminalTest : public ::testing::TestWithParam<SizeCase> {};

TEST_P(TooSmallTerminalTest, RefusesWithStatusOneAndLeavesTheLogsAlone) {
    const SizeCase& c = GetParam();
    TerminalSession session(
        TerminalOptions().Size(c.rows, c.cols).File("lineprobe.log", "trace of an earlier run\n"));

    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1)) << session.Dump();
    EXPECT_TRUE(
        session.WaitForRow(0, "The terminal size must be at least 40 rows and 100 columns."))
        << session.Dump();
    EXPECT_TRUE(session.WaitForRow(1, c.current)) << session.Dump();
    EXPECT_EQ(session.ReadLog(), std::optional<std::string>("trace of an earlier run\n"));
    EXPECT_FALSE(session.ReadErrLog().has_value());
}

INSTANTIATE_TEST_SUITE_P(
    Sizes, TooSmallTerminalTest,
    ::testing::Values(
        SizeCase{"OneRowShort", 39, 100, "current terminal size is: 39 rows by 100 cols"},
        SizeCase{"OneColumnShort", 40, 99, "current terminal size is: 40 rows by 99 cols"},
        SizeCase{"BothShort", 24, 80, "current terminal size is: 24 rows by 80 cols"}),
    [](const ::testing::TestParamInfo<SizeCase>& info) { return std::string(info.param.name); });

struct FitCase {
    const char* name;
    int rows;
    int cols;
};

void PrintTo(const FitCase& c, std::ostream* os) {
    *os << c.name;
}

class FittingTerminalTest : public ::testing::TestWithParam<FitCase> {};

TEST_P(FittingTerminalTest, DrawsSeparatorsAndPromptAtFixedPlaces) {
    const FitCase& c = GetParam();
    TerminalSession session(TerminalOptions().Size(c.rows, c.cols));

    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    const std::vector<std::string> screen = session.Screen();
    for (int row : SEPARATOR_ROWS) {
        EXPECT_TRUE(IsSeparatorRow(screen[static_cast<std::size_t>(row)])) << "row " << row << "\n"
                                                                           << session.Dump();
    }
    // The layout does not follow a larger terminal: the separators stop at column 100.
    if (c.cols > 100) {
        EXPECT_EQ(screen[11][100], ' ');
    }
    EXPECT_EQ(screen[PROMPT_ROW].substr(0, 5), "  -> ");
    EXPECT_TRUE(session.StillRunning());
}

INSTANTIATE_TEST_SUITE_P(Sizes, FittingTerminalTest,
                         ::testing::Values(FitCase{"ExactlyFortyByHundred", 40, 100},
                                           FitCase{"Larger", 50, 132}),
                         [](const ::testing::TestParamInfo<FitCase>& info) {
                             return std::string(info.param.name);
                         });

// Both logs start empty on each run; the commands of the table are registered in order; and
// the analog board of the default farm ends its line walk on the board's refusal, which is no
// failure, so the trace reports none.
TEST(Startup, RegistersTheCommandsInOrderIntoFreshLogs) {
    TerminalSession session(TerminalOptions()
                                .File("lineprobe.log", "stale trace line\n")
                                .File("lineprobe_err.log", "stale error line\n"));
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(session.WaitForLogLine("lineprobe.log", "command name: stoprai"));
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log);
    std::string registered;
    std::size_t calls = 0;
    std::istringstream lines(*log);
    for (std::string line; std::getline(lines, line);) {
        if (line == "Calling CmdProcessor::RegisterCommand") {
            ++calls;
        } else if (line.rfind("command name: ", 0) == 0) {
            registered += line.substr(14) + " ";
        }
    }
    // delphone is registered before trunk, though made after it.
    EXPECT_EQ(registered,
              "quit help phone delphone trunk makecall answer accept drop release chan_oos "
              "chan_ins trunk_ins trunk_oos origaddr destaddr deltrunk reset disablelbk linelbk "
              "payloadlbk startrai stoprai ");
    EXPECT_EQ(calls, 23u);
    EXPECT_EQ(log->find("stale"), std::string::npos);
    EXPECT_EQ(log->find("UnexpectedMsg"), std::string::npos) << *log;
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    EXPECT_TRUE(session.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
