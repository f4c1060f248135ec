// Invocations with arguments print and end at once, without touching the terminal modes
// or the log files.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

struct OptionCase {
    const char* name;
    std::vector<std::string> args;
    std::vector<std::string> rows;
};

void PrintTo(const OptionCase& c, std::ostream* os) {
    *os << c.name;
}

const std::string USAGE = "for help on using lineprobe, look in /usr/orvane/bin/lineprobe_help.txt";

class OptionsTerminalTest : public ::testing::TestWithParam<OptionCase> {};

TEST_P(OptionsTerminalTest, PrintsExitsWithZeroAndLeavesNoLogs) {
    const OptionCase& c = GetParam();
    TerminalSession session(TerminalOptions().Args(c.args));

    ASSERT_EQ(session.WaitForExit(), std::optional<int>(0)) << session.Dump();
    for (std::size_t row = 0; row < c.rows.size(); ++row) {
        EXPECT_TRUE(session.WaitForRow(static_cast<int>(row), c.rows[row]))
            << "row " << row << " should read '" << c.rows[row] << "':\n"
            << session.Dump();
    }
    EXPECT_FALSE(session.ReadLog().has_value());
    EXPECT_FALSE(session.ReadErrLog().has_value());
}

INSTANTIATE_TEST_SUITE_P(
    Arguments, OptionsTerminalTest,
    ::testing::Values(
        OptionCase{"Version", {"-v"}, {"lineprobe version 1.0", ""}},
        OptionCase{"Help", {"-h"}, {USAGE, ""}},
        OptionCase{"VersionAndHelp", {"-v", "-h"}, {"lineprobe version 1.0", USAGE, ""}},
        OptionCase{"BadArgument", {"--version"}, {"invalid argument", USAGE, ""}},
        OptionCase{"VersionThenBad",
                   {"-v", "x"},
                   {"lineprobe version 1.0", "invalid argument", USAGE, ""}},
        OptionCase{"BadThenVersionStops", {"x", "-v"}, {"invalid argument", USAGE, ""}},
        // The tab of the texts reaches the next tab stop, column 8.
        OptionCase{"ThreeArguments",
                   {"-v", "-h", "-v"},
                   {"invalid argument count", "valid arguments are:", "-v      show version",
                    "-h      help info", ""}}),
    [](const ::testing::TestParamInfo<OptionCase>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace lineprobe::testing
