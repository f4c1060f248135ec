// `help` hands the terminal to the pager and gets the screen back whole.
#include <gtest/gtest.h>
#include <sys/types.h>

#include <csignal>
#include <filesystem>
#include <fstream>
#include <string>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

const std::string HELP_TITLE = "LINEPROBE - console diagnostics for VX7 telephony boards";

TerminalOptions WithOrvaneDir(const std::string& dir) {
    TerminalOptions options;
    // The pager's own settings of whoever runs the tests must not change what it shows.
    options.unsetEnv = {"LESS", "LESSOPEN", "LESSCLOSE"};
    options.env = {{"CORVO_ORVANE_DIR", dir}, {"LESSHISTFILE", "-"}};
    return options;
}

void ExpectScreenIntact(TerminalSession& session) {
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session.Dump();
    const std::vector<std::string> screen = session.Screen();
    for (int row : SEPARATOR_ROWS) {
        EXPECT_TRUE(IsSeparatorRow(screen[static_cast<std::size_t>(row)])) << "row " << row << "\n"
                                                                           << session.Dump();
    }
    EXPECT_EQ(screen[RESULT_ROW].find_first_not_of(' '), std::string::npos) << session.Dump();
}

TEST(HelpTerminal, PagerShowsTheHelpFileAndQuitReturnsToAnIntactScreen) {
    TerminalOptions options = WithOrvaneDir("inst/");
    options.files = {{"inst/bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE)}};
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText(HELP_TITLE)) << session.Dump();
    EXPECT_TRUE(session.WaitForLogLine("lineprobe.log", "less inst/bin/lineprobe_help.txt"));
    EXPECT_NE(session.TextAt(PROMPT_ROW, PROMPT_COL, 3), PROMPT)
        << "the prompt must not be drawn over the pager\n"
        << session.Dump();

    session.SendKeys({"q"});
    ExpectScreenIntact(session);
    EXPECT_FALSE(session.WaitForText(HELP_TITLE, std::chrono::milliseconds(0)));
    EXPECT_TRUE(session.StillRunning());

    session.TypeLine("bogus");
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session.Dump();
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    EXPECT_TRUE(session.StillRunning());
}

TEST(HelpTerminal, DirectoryReachesThePagerAsOnePathNeverAsAShellLine) {
    // A blank would split the path in two; the semicolons would run a command.
    for (const std::string dir : {"in st/", "x;touch INJECTED;/"}) {
        SCOPED_TRACE(dir);
        TerminalOptions options = WithOrvaneDir(dir);
        options.files = {{dir + "bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE)}};
        TerminalSession session(options);
        ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

        session.TypeLine("help");
        EXPECT_TRUE(session.WaitForText(HELP_TITLE)) << session.Dump();
        // The trace still shows the command line as the operator would type it.
        EXPECT_TRUE(
            session.WaitForLogLine("lineprobe.log", "less " + dir + "bin/lineprobe_help.txt"));
        session.SendKeys({"q"});
        ExpectScreenIntact(session);
        EXPECT_FALSE(std::filesystem::exists(session.WorkDir() / "INJECTED"));
        EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
        EXPECT_TRUE(session.StillRunning());
    }
}

// State letter and parent of a process from /proc; `alive` is false when it is gone. (A plain
// struct: GCC 12 at -Os warns maybe-uninitialized on an optional pair walked in a loop.)
struct ProcStat {
    bool alive = false;
    char state = '?';
    pid_t parent = 0;
};

ProcStat ProcState(pid_t pid) {
    std::ifstream stat("/proc/" + std::to_string(pid) + "/stat");
    std::string text;
    if (!std::getline(stat, text)) {
        return {};
    }
    // "pid (comm) S ppid ...": the name may hold blanks and parentheses.
    const std::size_t close = text.rfind(')');
    if (close == std::string::npos || close + 2 >= text.size()) {
        return {};
    }
    char state = text[close + 2];
    pid_t parent = static_cast<pid_t>(std::stol(text.substr(close + 4)));
    return {true, state, parent};
}

// A process named `name` that descends from `ancestor`.
std::optional<pid_t> DescendantRunning(pid_t ancestor, const std::string& name) {
    for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
        const std::string pid = entry.path().filename().string();
        if (pid.find_first_not_of("0123456789") != std::string::npos) {
            continue;
        }
        std::ifstream comm(entry.path() / "comm");
        std::string command;
        if (!std::getline(comm, command) || command != name) {
            continue;
        }
        for (ProcStat state = ProcState(static_cast<pid_t>(std::stol(pid)));
             state.alive && state.parent > 1; state = ProcState(state.parent)) {
            if (state.parent == ancestor) {
                return static_cast<pid_t>(std::stol(pid));
            }
        }
    }
    return std::nullopt;
}

// A signal that ends the tool while the pager has the terminal ends both: the tool through
// its shutdown, the pager before the tool is gone, so that nothing of it is left reading
// the terminal.
void ExpectSignalEndsToolAndPager(int sig, const std::string& trace) {
    TerminalOptions options = WithOrvaneDir("inst/");
    options.files = {{"inst/bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE)}};
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText(HELP_TITLE)) << session.Dump();
    const std::optional<pid_t> pager = DescendantRunning(session.Pid(), "less");
    ASSERT_TRUE(pager.has_value());

    session.Signal(sig);
    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1)) << session.Dump();
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log.has_value());
    EXPECT_TRUE(HasLine(*log, trace)) << *log;
    const auto left = ProcState(*pager);
    EXPECT_TRUE(!left.alive || left.state == 'Z') << "the pager still runs, state " << left.state;
}

TEST(HelpTerminal, SigintDuringThePagerEndsTheToolAndThePager) {
    ExpectSignalEndsToolAndPager(SIGINT, "terninating app due to SIGINT");
}

TEST(HelpTerminal, SigtermDuringThePagerLeavesNoPagerBehind) {
    ExpectSignalEndsToolAndPager(SIGTERM, "terninating app due to SIGTERM");
}

TEST(HelpTerminal, WithoutTheVariableComesStraightBackSilently) {
    TerminalOptions options = WithOrvaneDir("unused/");
    options.env.clear();
    options.unsetEnv.push_back("CORVO_ORVANE_DIR");
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

    session.TypeLine("help");
    ASSERT_TRUE(
        session.WaitForLogLine("lineprobe.log", "Calling CmdProcessor::FindCommand: cmdStr= help"));
    ExpectScreenIntact(session);
    EXPECT_EQ(session.ReadLog()->find("less "), std::string::npos);
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    EXPECT_TRUE(session.StillRunning());
}

TEST(HelpTerminal, TooLongCommandLineIsNotBuiltAndSaysSoInTheErrorLog) {
    const std::string dir = "/" + std::string(300, 'd') + "/";
    TerminalSession session(WithOrvaneDir(dir));
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForLogLine(
        "lineprobe_err.log", "help not shown: the pager command line for CORVO_ORVANE_DIR=" + dir +
                                 " would be longer than 255 characters"))
        << session.ReadErrLog().value_or("(no error log)");
    ExpectScreenIntact(session);
    EXPECT_EQ(session.ReadLog()->find("less "), std::string::npos);
    EXPECT_TRUE(session.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
