// The prompt as the operator meets it: lookup, field counts, the result row, the editing
// keys, help and its pager, and the ways a running lineprobe ends, each through the shutdown:
// status 1 and its line in the trace log.
#include <gtest/gtest.h>
#include <sys/types.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

using namespace std::chrono_literals;

const std::string HELP_TITLE = "LINEPROBE - console diagnostics for VX7 telephony boards";

// True when the log ends with this line.
bool EndsWithLine(const std::string& log, const std::string& line) {
    return log.size() > line.size() && log.substr(log.size() - line.size() - 1) == line + "\n";
}

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

TerminalOptions WithOrvaneDir(const std::string& dir) {
    TerminalOptions options;
    // The pager's own settings of whoever runs the tests must not change what it shows.
    options.unsetEnv = {"LESS", "LESSOPEN", "LESSCLOSE"};
    options.env = {{"CORVO_ORVANE_DIR", dir}, {"LESSHISTFILE", "-"}};
    return options;
}

// The layout after a command that draws nothing: the separators, an empty prompt and an
// empty result row.
void ExpectScreenIntact(TerminalSession& session) {
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW));
    EXPECT_TRUE(SeparatorsDrawn(session));
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "", 0ms));
}

class PromptTest : public ::testing::Test {
  protected:
    PromptTest() : session_(Options()), commands_(session_) {}

    static TerminalOptions Options() {
        TerminalOptions options;
        options.unsetEnv = {"CORVO_ORVANE_DIR"};
        return options;
    }
    void SetUp() override { ASSERT_TRUE(session_.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)); }

    // Runs the line and expects `word` to have been looked up `times` times in all.
    void Enter(const std::string& line, const std::string& word, std::size_t times = 1) {
        ASSERT_TRUE(commands_.Run(line));
        EXPECT_EQ(CountOccurrences(*session_.ReadLog(), LOOKUP_TRACE + word + "\n"), times)
            << "lookups of '" << word << "' after '" << line << "'";
    }

    std::string ResultRow() { return session_.Row(RESULT_ROW); }

    TerminalSession session_;
    CommandRunner commands_;
};

// One session through the lookup rules: the first line empty, an unknown word, quit with a field
// count it has no overload for, empty lines, which look the last word up again but call nothing,
// and help without its directory. Quit with four fields ends it.
TEST_F(PromptTest, LookupFieldCountsAndTheResultRowUpToQuit) {
    Enter("", "");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command"));
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: -1"));

    Enter("bogus 1 2 3", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 4"));
    // The next line wipes the result row.
    Enter("quit 7", "quit");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, ""));
    std::size_t quits = 1;
    for (const char* line : {"quit 1 2", "quit 1 2 3 now", "quit 1 1 99999999999"}) {
        Enter(line, "quit", ++quits);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << line;
    }
    Enter("", "quit", ++quits);
    Enter("   ", "quit", ++quits);
    EXPECT_EQ(ResultRow().find_first_not_of(' '), std::string::npos) << session_.Dump();

    // Without the directory of the help file help comes straight back, silently.
    Enter("help", "help");
    ExpectScreenIntact(session_);
    EXPECT_EQ(session_.ReadLog()->find("less "), std::string::npos);
    EXPECT_EQ(session_.ReadLog()->find("terninating"), std::string::npos);

    session_.TypeLine("quit 1 2 3");
    ASSERT_EQ(session_.WaitForExit(), std::optional<int>(1)) << session_.Dump();
    EXPECT_TRUE(EndsWithLine(*session_.ReadLog(), "terninating app due to SIGUSR1"))
        << *session_.ReadLog();
    EXPECT_EQ(session_.ReadErrLog(), std::optional<std::string>(""));
}

// The editing keys as the terminal sends them reach the line editor (whose rules, and the
// control keys, its own unit test holds): each edit shows on the prompt row, with the cursor where
// the next character goes, and the line entered is the one shown. A line longer than the row
// scrolls within it.
TEST_F(PromptTest, EditingKeysAsTheTerminalSendsThem) {
    session_.Type("ogs 1");
    session_.SendKeys({"Home"});
    session_.Type("b");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogs 1"));
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 4)) << session_.Dump();
    session_.SendKeys({"Right", "Right"});
    session_.Type("u");
    session_.SendKeys({"End", "Left", "BSpace"});
    session_.Type("2");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21"));
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 6)) << session_.Dump();

    // Function keys the editor has no use for change nothing.
    session_.SendKeys({"F1", "NPage", "IC"});
    Enter("", "bogus21");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 1"));
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command"));

    // Up recalls the line and Down comes back to the draft.
    session_.Type("draft");
    session_.SendKeys({"Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21"));
    session_.SendKeys({"Down"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> draft"));
    session_.SendKeys({"C-u"});

    std::string line = "bogus 1 2 3 ";
    while (line.size() < 150) {
        line += "abcdefghij";
    }
    // The window's last column lies past the terminal: the line has the 95 columns from
    // the one after the prompt up to the terminal's last but one.
    constexpr std::size_t SHOWN = 95;
    const int firstCol = PROMPT_COL + 3;
    session_.Type(line);
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(line.size() - (SHOWN - 1))));
    EXPECT_EQ(session_.Cursor(),
              std::make_pair(PROMPT_ROW, firstCol + static_cast<int>(SHOWN) - 1));
    // Nothing of it spills onto the result row.
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command"));
    session_.SendKeys({"Home"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(0, SHOWN)));
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, firstCol));
    Enter("", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 5"));
    EXPECT_TRUE(session_.StillRunning());
}

// The pid and state letter of a process named `name` in the session `sid` (a terminal's), or
// {0, '?'} when there is none.
std::pair<pid_t, char> InSession(pid_t sid, const std::string& name) {
    for (const auto& entry : std::filesystem::directory_iterator("/proc")) {
        std::ifstream stat(entry.path() / "stat");
        std::string text;
        // "pid (comm) state ppid pgrp session ...": the name may hold blanks and parentheses.
        if (!std::getline(stat, text) || text.find(" (" + name + ") ") == std::string::npos) {
            continue;
        }
        std::istringstream fields(text.substr(text.rfind(')') + 2));
        char state = '?';
        pid_t parent = 0;
        pid_t group = 0;
        pid_t session = 0;
        if (fields >> state >> parent >> group >> session && session == sid) {
            return {static_cast<pid_t>(std::stol(entry.path().filename())), state};
        }
    }
    return {0, '?'};
}

// The directory reaches the pager as one path, never as a shell line: the blank would split
// it in two, the semicolons would run a command. Quitting the pager gives the screen back
// whole. A signal that ends the tool while the pager has the terminal ends both: the tool
// through its shutdown, the pager before the tool is gone, so that nothing of it is left
// reading the terminal (which signal it was is the shutdown's unit test).
TEST(HelpTerminal, PagerShowsTheHelpFileFromAnyDirectoryAndEndsWithTheTool) {
    const std::string dir = "in st;touch INJECTED;/";
    TerminalOptions options = WithOrvaneDir(dir);
    options.File(dir + "bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE));
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT));

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText(HELP_TITLE));
    // The trace still shows the command line as the operator would type it.
    EXPECT_TRUE(session.WaitForLogLine("lineprobe.log", "less " + dir + "bin/lineprobe_help.txt"));
    EXPECT_NE(session.TextAt(PROMPT_ROW, PROMPT_COL, 3), PROMPT)
        << "the prompt must not be drawn over the pager\n"
        << session.Dump();

    session.SendKeys({"q"});
    ExpectScreenIntact(session);
    EXPECT_FALSE(session.WaitForText(HELP_TITLE, 0ms));
    EXPECT_FALSE(std::filesystem::exists(session.WorkDir() / "INJECTED"));
    session.TypeLine("bogus");
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "  Unrecgnized Command"));
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText(HELP_TITLE));
    const pid_t sid = getsid(session.Pid());
    ASSERT_NE(InSession(sid, "less").first, 0);
    session.Signal(SIGTERM);
    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1)) << session.Dump();
    EXPECT_TRUE(session.WaitForLogLine("lineprobe.log", "terninating app due to SIGTERM", 0ms));
    const auto [pager, state] = InSession(sid, "less");
    EXPECT_TRUE(pager == 0 || state == 'Z') << "the pager still runs, state " << state;
}

// A pager command line too long is not built and says so in the error log. Then a closed
// keyboard, with a line half typed, ends the program through the shutdown, which stops the
// open view.
TEST(ShutdownTerminal, HangUpAtThePromptEndsThroughTheShutdown) {
    const std::string dir = "/" + std::string(300, 'd') + "/";
    TerminalSession session(WithOrvaneDir(dir));
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT));
    ASSERT_TRUE(commands.Run("help"));
    ASSERT_TRUE(session.WaitForLogLine(
        "lineprobe_err.log", "help not shown: the pager command line for CORVO_ORVANE_DIR=" + dir +
                                 " would be longer than 255 characters"));
    ExpectScreenIntact(session);
    EXPECT_EQ(session.ReadLog()->find("less "), std::string::npos);

    ASSERT_EQ(commands.Output("trunk 1 1"), "trunk view creaed successfully");
    session.Type("half a li");
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> half a li"));
    session.HangUp();
    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1));
    const std::string log = session.ReadLog().value_or("(no log)");
    EXPECT_TRUE(LogHasInOrder(
        log, {"terninating app due to SIGHUP", "Stopping Trunk Viev: board=1 line=1"}))
        << log;
}

// Boards that answer slowly make the views slow to stop, not stuck: the shutdown waits for
// them, however long all of it takes (here four requests of 3 s each, past the stall limit
// of 10 s), and stops every view.
TEST(ShutdownTerminal, SlowButProgressingShutdownIsNotCut) {
    const std::string farm = LINEPROBE_FARMS_DIR "/default.toml";
    SimServer sim(farm);
    ASSERT_TRUE(sim.Running());
    TerminalOptions options;
    options.env = {{"REMOTE_TKHOST", sim.Address()}, {"VX7_FARM", farm}};
    TerminalSession session(options);
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT));
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_EQ(commands.Output("phone 1 1 1"), "phone view creaed successfully");
    ASSERT_EQ(sim.Control("delay 3000").rfind("ok", 0), 0u);

    session.TypeLine("quit");
    ASSERT_EQ(session.WaitForExit(90s), std::optional<int>(1));
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    const std::string log = session.ReadLog().value_or("(no log)");
    EXPECT_TRUE(LogHasInOrder(
        log, {"terninating app due to SIGUSR1", "PhoneView::Stop() called: board=1 line=1 chan=1",
              "Stopping Trunk Viev: board=1 line=1"}))
        << log;
}

}  // namespace
}  // namespace lineprobe::testing
