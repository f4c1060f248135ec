// The prompt as the operator meets it: lookup, field counts, the result row, the editing
// keys, help and its pager, and the ways a running lineprobe ends, each through the shutdown:
// status 1 and its line in the trace log.
#include <gtest/gtest.h>
#include <sys/types.h>

#include <chrono>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

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
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session.Dump();
    const std::vector<std::string> screen = session.Screen();
    for (int row : SEPARATOR_ROWS) {
        EXPECT_TRUE(IsSeparatorRow(screen[static_cast<std::size_t>(row)])) << "row " << row << "\n"
                                                                           << session.Dump();
    }
    EXPECT_EQ(screen[RESULT_ROW].find_first_not_of(' '), std::string::npos) << session.Dump();
}

class PromptTest : public ::testing::Test {
  protected:
    PromptTest() : session_(Options()), commands_(session_) {}

    static TerminalOptions Options() {
        TerminalOptions options;
        options.unsetEnv = {"CORVO_ORVANE_DIR"};
        return options;
    }
    void SetUp() override {
        ASSERT_TRUE(session_.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session_.Dump();
    }

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

// One session through the lookup rules: the first line empty, unknown and wrongly cased
// words, quit with a field count it has no overload for, empty lines, which look the last
// word up again but call nothing, and help without its directory. Quit with four fields ends
// it.
TEST_F(PromptTest, LookupFieldCountsAndTheResultRowUpToQuit) {
    Enter("", "");
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: -1"));

    Enter("bogus 1 2 3", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 4"));
    // The next line wipes the result row; words are case-sensitive.
    std::size_t quits = 0;
    for (const char* word : {"QUIT", "Quit", "Help"}) {
        Enter("quit 7", "quit", ++quits);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << session_.Dump();
        Enter(word, word);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << word << "\n"
                                                                              << session_.Dump();
    }
    for (const char* line : {"quit 1 2", "quit 1 2 3 now", "quit 1 1 99999999999"}) {
        Enter(line, "quit", ++quits);
        EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "")) << line << "\n" << session_.Dump();
    }
    Enter("", "quit", ++quits);
    Enter("   ", "quit", ++quits);
    EXPECT_EQ(ResultRow().find_first_not_of(' '), std::string::npos) << session_.Dump();

    // The word of a line of a thousand characters is cut safely, and the echo stays on the
    // prompt row: nothing spills onto the rows below.
    Enter(std::string(1000, 'x'), std::string(255, 'x'));
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW + 1, "")) << session_.Dump();

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

// The editing keys as the terminal sends them reach the line editor (whose rules its own
// unit test holds): each edit shows on the prompt row, with the cursor where the next
// character goes, and the line entered is the one shown. A line longer than the row scrolls
// within it.
TEST_F(PromptTest, EditingKeysAsTheTerminalSendsThem) {
    session_.Type("ogs 1");
    session_.SendKeys({"Home"});
    session_.Type("b");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogs 1")) << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 4)) << session_.Dump();
    session_.SendKeys({"Right", "Right"});
    session_.Type("u");
    session_.SendKeys({"End", "Left", "BSpace"});
    session_.Type("2");
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21")) << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 6)) << session_.Dump();

    // Keys that are no text change nothing; Tab separates fields like a blank.
    session_.SendKeys({"End", "Escape", "F1", "C-l", "C-g", "NPage", "IC", "Tab"});
    session_.Type("1 2 oops");
    session_.SendKeys({"C-w", "C-w"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21 1")) << session_.Dump();
    Enter("", "bogus21");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 2"));

    // Up recalls the line, Down comes back to the draft, Ctrl-U kills it; a recalled line
    // runs again as it was entered.
    session_.Type("draft");
    session_.SendKeys({"Up"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> bogus21 1")) << session_.Dump();
    session_.SendKeys({"Down"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> draft")) << session_.Dump();
    session_.SendKeys({"C-u"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session_.Dump();
    session_.SendKeys({"Up"});
    Enter("", "bogus21", 2);
    EXPECT_EQ(CountOccurrences(*session_.ReadLog(), "\nvalidArgs: 2\n"), 2u);
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();

    std::string line = "bogus 1 2 3 ";
    while (line.size() < 150) {
        line += "abcdefghij";
    }
    // The window's last column lies past the terminal: the line has the 95 columns from
    // the one after the prompt up to the terminal's last but one.
    constexpr std::size_t SHOWN = 95;
    const int firstCol = PROMPT_COL + 3;
    session_.Type(line);
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(line.size() - (SHOWN - 1))))
        << session_.Dump();
    EXPECT_EQ(session_.Cursor(),
              std::make_pair(PROMPT_ROW, firstCol + static_cast<int>(SHOWN) - 1));
    // Nothing of it spills onto the result row.
    EXPECT_TRUE(session_.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session_.Dump();
    session_.SendKeys({"Home"});
    EXPECT_TRUE(session_.WaitForRow(PROMPT_ROW, "  -> " + line.substr(0, SHOWN)))
        << session_.Dump();
    EXPECT_EQ(session_.Cursor(), std::make_pair(PROMPT_ROW, firstCol));
    Enter("", "bogus");
    EXPECT_TRUE(HasLine(*session_.ReadLog(), "validArgs: 5"));
    EXPECT_TRUE(session_.StillRunning());
}

// The directory reaches the pager as one path, never as a shell line: the blank would split
// it in two, the semicolons would run a command. Quitting the pager gives the screen back
// whole.
TEST(HelpTerminal, PagerShowsTheHelpFileFromAnyDirectoryAndGivesTheScreenBack) {
    const std::string dir = "in st;touch INJECTED;/";
    TerminalOptions options = WithOrvaneDir(dir);
    options.File(dir + "bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE));
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText(HELP_TITLE)) << session.Dump();
    // The trace still shows the command line as the operator would type it.
    EXPECT_TRUE(session.WaitForLogLine("lineprobe.log", "less " + dir + "bin/lineprobe_help.txt"));
    EXPECT_NE(session.TextAt(PROMPT_ROW, PROMPT_COL, 3), PROMPT)
        << "the prompt must not be drawn over the pager\n"
        << session.Dump();

    session.SendKeys({"q"});
    ExpectScreenIntact(session);
    EXPECT_FALSE(session.WaitForText(HELP_TITLE, std::chrono::milliseconds(0)));
    EXPECT_FALSE(std::filesystem::exists(session.WorkDir() / "INJECTED"));
    session.TypeLine("bogus");
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session.Dump();
    EXPECT_EQ(session.ReadErrLog(), std::optional<std::string>(""));
    EXPECT_TRUE(session.StillRunning());
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
TEST(HelpTerminal, SignalDuringThePagerEndsTheToolAndThePager) {
    for (const auto& [sig, trace] : {std::pair{SIGINT, "terninating app due to SIGINT"},
                                     std::pair{SIGTERM, "terninating app due to SIGTERM"}}) {
        SCOPED_TRACE(trace);
        TerminalOptions options = WithOrvaneDir("inst/");
        options.File("inst/bin/lineprobe_help.txt", *ReadWholeFile(LINEPROBE_HELP_FILE));
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
        EXPECT_TRUE(!left.alive || left.state == 'Z')
            << "the pager still runs, state " << left.state;
    }
}

// A pager command line too long is not built and says so in the error log. Then a closed
// keyboard, with a line half typed, ends the program through the shutdown, which stops the
// open view.
TEST(ShutdownTerminal, HangUpAtThePromptEndsThroughTheShutdown) {
    const std::string dir = "/" + std::string(300, 'd') + "/";
    TerminalSession session(WithOrvaneDir(dir));
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(commands.Run("help"));
    ASSERT_TRUE(session.WaitForLogLine(
        "lineprobe_err.log", "help not shown: the pager command line for CORVO_ORVANE_DIR=" + dir +
                                 " would be longer than 255 characters"))
        << session.ReadErrLog().value_or("(no error log)");
    ExpectScreenIntact(session);
    EXPECT_EQ(session.ReadLog()->find("less "), std::string::npos);

    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_EQ(commands.Result(), "trunk view creaed successfully");
    session.Type("half a li");
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> half a li")) << session.Dump();
    session.HangUp();
    ASSERT_EQ(session.WaitForExit(), std::optional<int>(1));
    const std::optional<std::string> log = session.ReadLog();
    ASSERT_TRUE(log.has_value());
    EXPECT_TRUE(LogHasInOrder(
        *log, {"terninating app due to SIGHUP", "Stopping Trunk Viev: board=1 line=1"}))
        << *log;
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
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(commands.Run("trunk 1 1"));
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
               "Stopping Trunk Viev: board=1 line=1"}))
        << *log;
}

}  // namespace
}  // namespace lineprobe::testing
