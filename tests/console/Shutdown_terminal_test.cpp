// Every end of a running lineprobe passes through the shutdown: status 1 and its line in
// the trace log.
#include <gtest/gtest.h>

#include <chrono>
#include <csignal>
#include <string>
#include <vector>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

struct EndCase {
    const char* name;
    const char* line;  // typed; empty for a signal
    int sig;
    const char* trace;
};

void PrintTo(const EndCase& c, std::ostream* os) {
    *os << c.name;
}

class ShutdownTerminalTest : public ::testing::TestWithParam<EndCase> {};

TEST_P(ShutdownTerminalTest, EndsWithStatusOneAndLogsWhy) {
    const EndCase& c = GetParam();
    TerminalSession session;
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

    if (c.sig != 0) {
        session.Type("half a li");
        ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> half a li")) << session.Dump();
        session.Signal(c.sig);
    } else {
        session.TypeLine(c.line);
    }

    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1)) << session.Dump();
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log.has_value());
    EXPECT_TRUE(log->size() > std::string(c.trace).size() &&
                log->substr(log->size() - std::string(c.trace).size() - 1) ==
                    std::string(c.trace) + "\n")
        << "the log should end with '" << c.trace << "':\n"
        << *log;
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
}

INSTANTIATE_TEST_SUITE_P(
    Ends, ShutdownTerminalTest,
    ::testing::Values(
        EndCase{"Quit", "quit", 0, "terninating app due to SIGUSR1"},
        EndCase{"QuitWithThreeNumbers", "quit 1 2 3", 0, "terninating app due to SIGUSR1"},
        // A word ends the scan: one field, so quit runs.
        EndCase{"QuitFollowedByAWord", "quit now 1 2", 0, "terninating app due to SIGUSR1"},
        EndCase{"Sigint", "", SIGINT, "terninating app due to SIGINT"},
        EndCase{"Sigterm", "", SIGTERM, "terninating app due to SIGTERM"},
        EndCase{"Sigusr1", "", SIGUSR1, "terninating app due to SIGUSR1"},
        EndCase{"Sighup", "", SIGHUP, "terninating app due to SIGHUP"}),
    [](const ::testing::TestParamInfo<EndCase>& info) { return std::string(info.param.name); });

// True when the log holds these whole lines in this order.
bool LogHasInOrder(const std::string& log, const std::vector<std::string>& lines) {
    const std::string text = "\n" + log;
    std::size_t from = 0;
    for (const std::string& line : lines) {
        const std::size_t at = text.find("\n" + line + "\n", from);
        if (at == std::string::npos) {
            return false;
        }
        from = at + line.size() + 1;
    }
    return true;
}

TEST(ShutdownTerminal, ClosedKeyboardEndsThroughTheShutdown) {
    TerminalSession session;
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_EQ(commands.Result(), "trunk view creaed successfully");

    session.HangUp();
    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1));
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log.has_value());
    EXPECT_TRUE(LogHasInOrder(
        *log, {"terninating app due to SIGHUP", "Stopping Trunk Viev: board=1 line=1"}))
        << *log;
}

// Boards that answer slowly make the views slow to stop, not stuck: the shutdown waits for
// them, however long all of it takes (here six requests of 3 s each), and stops every view.
TEST(ShutdownTerminal, SlowButProgressingShutdownIsNotCut) {
    const std::string farm = LINEPROBE_FARMS_DIR "/default.toml";
    SimServer sim(farm);
    ASSERT_TRUE(sim.Running());
    TerminalOptions options;
    options.env = {{"REMOTE_TKHOST", sim.Address()}, {"VX7_FARM", farm}};
    TerminalSession session(options);
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(commands.Run("trunk 1 2"));
    ASSERT_TRUE(commands.Run("phone 1 1 1"));
    ASSERT_EQ(commands.Result(), "phone view creaed successfully");
    ASSERT_EQ(sim.Control("delay 3000").rfind("ok", 0), 0u);

    session.TypeLine("quit");
    ASSERT_EQ(session.WaitForExit(std::chrono::seconds(90)), std::optional<int>(1));
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log.has_value());
    EXPECT_TRUE(LogHasInOrder(
        *log, {"terninating app due to SIGUSR1", "PhoneView::Stop() called: board=1 line=1 chan=1",
               "Stopping Trunk Viev: board=1 line=1", "Stopping Trunk Viev: board=1 line=2"}))
        << *log;
}

}  // namespace
}  // namespace lineprobe::testing
