#include "console/Lifecycle.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LogCapture.h"

namespace {

using testsupport::LogCapture;

struct OptionCase {
    const char* name;
    std::vector<std::string> args;
    std::string output;
    int stoppedAt;
};

void PrintTo(const OptionCase& c, std::ostream* os) {
    *os << c.name;
}

const std::string USAGE =
    "for help on using lineprobe, look in /usr/orvane/bin/lineprobe_help.txt\n";
const std::string VERSION = "lineprobe version 1.0\n";
const std::string INVALID = "invalid argument\n" + USAGE;
const std::string COUNT =
    "invalid argument count\nvalid arguments are:\n-v\tshow version\n-h\thelp info \n";

class ProcessCmdLineArgsTest : public ::testing::TestWithParam<OptionCase> {};

TEST_P(ProcessCmdLineArgsTest, PrintsAndStops) {
    const OptionCase& c = GetParam();
    std::vector<std::string> args = c.args;
    std::vector<char*> argv;
    for (std::string& arg : args) {
        argv.push_back(arg.data());
    }
    argv.push_back(nullptr);
    LogCapture out;

    const int stoppedAt = ProcessCmdLineArgs(static_cast<int>(args.size()), argv.data());

    EXPECT_EQ(out.Text(), c.output);
    EXPECT_EQ(stoppedAt, c.stoppedAt);
}

INSTANTIATE_TEST_SUITE_P(
    Options, ProcessCmdLineArgsTest,
    ::testing::Values(OptionCase{"Version", {"-v"}, VERSION, 1},
                      OptionCase{"Help", {"-h"}, USAGE, 1},
                      OptionCase{"VersionThenHelp", {"-v", "-h"}, VERSION + USAGE, 2},
                      OptionCase{"HelpThenVersion", {"-h", "-v"}, USAGE + VERSION, 2},
                      OptionCase{"Unknown", {"-x"}, INVALID, 0},
                      OptionCase{"VersionThenUnknown", {"-v", "bogus"}, VERSION + INVALID, 1},
                      OptionCase{"UnknownStopsTheWalk", {"bogus", "-v"}, INVALID, 0},
                      OptionCase{"CaseMatters", {"-V"}, INVALID, 0},
                      OptionCase{"ThreeValid", {"-v", "-h", "-v"}, COUNT, 0},
                      OptionCase{"ThreeInvalid", {"a", "b", "c"}, COUNT, 0},
                      OptionCase{"Four", {"-v", "-v", "-v", "-v"}, COUNT, 0}),
    [](const ::testing::TestParamInfo<OptionCase>& info) { return std::string(info.param.name); });

}  // namespace
