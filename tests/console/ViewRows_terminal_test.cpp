// The views and their commands as the operator meets them: against the board emulation that
// lineprobe runs in its own process when no relay host is set, and against vx7sim, whose
// control channel plays the network (error counters and line states, the demo script, a relay
// that dies and comes back, events during the pager and changes of the terminal's size).
// Refused, silent and dropped relays are the fault run's (tests/system).
#include <gtest/gtest.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <fstream>
#include <initializer_list>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

using namespace std::chrono_literals;

const std::string FARM = LINEPROBE_FARMS_DIR "/default.toml";
const std::string DEMO = LINEPROBE_FARMS_DIR "/demo.script";
// The red alarm and the bipolar violation columns of a trunk row.
constexpr int RED_COL = WINDOW_COL0 + 54;
constexpr int BPV_COL = WINDOW_COL0 + 85;

TerminalOptions BuiltinFarm(const std::string& farm = "") {
    TerminalOptions options;
    options.unsetEnv.push_back("REMOTE_TKHOST");
    if (farm.empty()) {
        options.unsetEnv.push_back("VX7_FARM");
    } else {
        options.env.emplace_back("VX7_FARM", farm);
    }
    return options;
}

struct Expect {
    const char* line;
    const char* result;
};

class ViewsTest : public ::testing::Test {
  protected:
    explicit ViewsTest(TerminalOptions options = BuiltinFarm())
        : session(std::move(options)), commands(session) {}
    void SetUp() override { ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)); }

    std::string PhoneRow(int row) { return Trimmed(session, PHONE_ROW0 + row); }
    std::string TrunkRow(int row) { return Trimmed(session, TRUNK_ROW0 + row); }
    ::testing::AssertionResult WaitPhone(int row, int col, const std::string& text) {
        return session.WaitForTextAt(PHONE_ROW0 + row, WINDOW_COL0 + col, text);
    }
    ::testing::AssertionResult WaitTrunk(int row, int col, const std::string& text) {
        return session.WaitForTextAt(TRUNK_ROW0 + row, WINDOW_COL0 + col, text);
    }
    void RunAll(const std::vector<Expect>& cases) {
        for (const Expect& c : cases) {
            EXPECT_EQ(commands.Output(c.line), c.result) << c.line;
        }
    }
    // Lines that all give one and the same result.
    void RunAll(const char* result, std::initializer_list<const char*> lines) {
        for (const char* line : lines) {
            EXPECT_EQ(commands.Output(line), result) << line;
        }
    }

    TerminalSession session;
    CommandRunner commands;
};

// Without a farm set, the emulation plays the default one. How the system view and the
// views' heads are drawn is the system view's test and the view managers'.
TEST_F(ViewsTest, EveryCommandWithoutItsViewAndTheTrunkCommands) {
    EXPECT_EQ(Trimmed(session, 0), std::string(46, ' ') + "SYSTEM VIEW - vx7-demo");

    // The view is looked for before the address is checked.
    RunAll("ERROR - unable to find phone view",
           {"answer 1 1 5", "accept 1 1 5", "drop 1 1 5", "release 1 1 5", "reset 1 1 5",
            "chan_oos 1 1 5", "chan_ins 1 1 5", "makecall 1 1 5", "origaddr 1 1 5 x",
            "destaddr 1 1 5 5551234"});
    RunAll("ERROR - unable to find trunk view",
           {"trunk_ins 1 2", "trunk_oos 1 2", "disablelbk 1 2", "linelbk 1 2", "payloadlbk 1 2",
            "startrai 1 2", "stoprai 1 2"});
    // A command with the wrong number of fields reaches nothing and says nothing.
    RunAll("", {"phone 1 1", "trunk 1 1 1", "origaddr 1 1 5", "answer"});
    // Which keys a view refuses is the view managers' rule.
    RunAll({
        {"phone 7 1 1", "ERROR - unable to create phone view"},
        {"delphone 1 1 5", "ERROR - unable to delete phone view"},
        {"deltrunk 1 2", "ERROR - unable to delete trunk view"},
        {"trunk 1 3", "ERROR - unable to create trunk view"},
    });
    EXPECT_EQ(PhoneRow(1), "");
    EXPECT_EQ(TrunkRow(1), "");

    EXPECT_EQ(commands.Output("trunk 1 1"), "trunk view creaed successfully");
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    EXPECT_EQ(TrunkRow(1).substr(0, 5), "  1.1");
    RunAll({
        {"trunk 1 1", "ERROR - unable to create trunk view"},
        {"linelbk 1 1", "enabling line loopback completed"},
        {"disablelbk 1 1", "Disabling loopback mode completed"},
        {"payloadlbk 1 1", "enabling Payload loopback completed"},
        {"startrai 1 1", "starting of RAI transmission completed"},
        {"stoprai 1 1", "stopping of RAI transmission completed"},
        {"trunk_oos 1 1", ""},
    });
    ASSERT_TRUE(WaitTrunk(1, 48, "X"));
    ASSERT_TRUE(WaitTrunk(1, 8, "Out of Service"));
    EXPECT_EQ(commands.Output("trunk_ins 1 1"), "");
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));

    EXPECT_EQ(commands.Output("deltrunk 1 1"), "successfully deleted trunk view");
    EXPECT_EQ(TrunkRow(1), "");
    ASSERT_TRUE(commands.Run("trunk 3 2"));
    EXPECT_EQ(TrunkRow(1).substr(0, 5), "  3.2");
}

TEST_F(ViewsTest, ACallThePhoneCommandsAndTheRowsOfTheViews) {
    EXPECT_EQ(commands.Output("phone 1 1 1"), "phone view creaed successfully");
    ASSERT_TRUE(commands.Run("phone 1 1 23"));
    EXPECT_EQ(PhoneRow(1).substr(0, 56), "  1.1.1  0x0        Active                      Null");
    EXPECT_EQ(PhoneRow(2).substr(0, 8), "  1.1.23");

    // The default addresses call 1.1.23 from 1.1.1; answer and drop print nothing on success.
    // How a call goes on is the emulation's; how its states are drawn, the observers'.
    EXPECT_EQ(commands.Output("makecall 1 1 1"), "makecall started successfully");
    ASSERT_TRUE(WaitPhone(2, 47, "Offered"));
    EXPECT_EQ(commands.Output("answer 1 1 23"), "");
    ASSERT_TRUE(WaitPhone(1, 47, "Connected"));
    EXPECT_EQ(commands.Output("drop 1 1 1"), "");
    ASSERT_TRUE(WaitPhone(2, 47, "Disconnected"));

    ASSERT_TRUE(commands.Run("phone 1 2 3"));
    RunAll({
        {"phone 1 2 3", "ERROR - unable to create phone view"},
        {"reset 1 2 3", "channel reset completed"},
        {"origaddr 1 2 3 5", "ERROR - invalid origination address"},
        {"destaddr 1 2 3 5", "ERROR - invalid destination address"},
        {"origaddr 1 2 3 5551999", ""},
        {"destaddr 1 2 3 5551234", "destination address set"},
        {"chan_oos 1 2 3", ""},
    });
    ASSERT_TRUE(WaitPhone(3, 19, "OutOfService"));
    EXPECT_EQ(commands.Output("chan_ins 1 2 3"), "");
    // "Active" is followed by two tabs, which carry the blanks past the field's end.
    ASSERT_TRUE(WaitPhone(3, 19, "Active      "));

    // Which row a view takes, and the limit of ten, are the view managers' rules.
    EXPECT_EQ(commands.Output("delphone 1 1 23"), "successfully deleted phone view");
    EXPECT_EQ(PhoneRow(2), "");
}

// Boards in ascending order of their numbers, 32 included, whatever the farm's order; a board
// without trunks shows its "brd" text alone; past column 89 the lines of a board go on at
// column 9 of the next row. A farm that cannot be read gives no board service, an empty name
// and no boards.
TEST(SystemView, BoardsAndLinesAsTheFarmHasThem) {
    const std::string line = "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = ";
    std::string wide;
    for (int i = 0; i < 7; ++i) {
        wide += line + "\"CAS\"\n";
    }
    const std::string title = std::string(46, ' ') + "SYSTEM VIEW -";
    const std::pair<std::string, std::vector<std::string>> farms[] = {
        {"system_name = \"gaps\"\n"
         "[[board]]\nlogical_id = 32\nname = \"VX7/T1-\"\nserial = \"s32\"\n" +
             wide + "[[board]]\nlogical_id = 0\nname = \"Z\"\nserial = \"s0\"\n" + line +
             "\"CLEAR\"\n"
             "[[board]]\nlogical_id = 4\nname = \"B\"\nserial = \"s4\"\n"
             "[[board]]\nlogical_id = 3\nname = \"T\"\nserial = \"s3\"\n" +
             line + "\"CCS\"\n",
         {title + " gaps", "", "  brd 0: (Z):  (L1 c=24 CLEAR)", "  brd 3: (T):  (L1 c=24 CCS)",
          "  brd 4: (B):",
          "  brd 32: (VX7/T1-):  (L1 c=24 CAS) (L2 c=24 CAS) (L3 c=24 CAS) (L4 c=24 CAS) "
          "(L5 c=24 CAS)",
          "          (L6 c=24 CAS) (L7 c=24 CAS)", ""}},
        {"this is = = not toml\n", {title, "", "", ""}},
    };
    for (const auto& [farm, rows] : farms) {
        SCOPED_TRACE(rows[0]);
        TerminalOptions options = BuiltinFarm("farm.toml");
        options.File("farm.toml", farm);
        TerminalSession session(options);
        ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT));
        for (std::size_t row = 0; row < rows.size(); ++row) {
            EXPECT_EQ(Trimmed(session, static_cast<int>(row)), rows[row]) << row;
        }
        EXPECT_TRUE(session.StillRunning());
    }
}

// The relay comes first, so that the session of the views is given its address.
struct Relay {
    explicit Relay(const std::vector<std::string>& args) : sim(FARM, args) {}
    SimServer sim;
};

class RelayTest : protected Relay, public ViewsTest {
  protected:
    explicit RelayTest(std::vector<std::string> simArgs = {})
        : Relay(simArgs), ViewsTest(WithPager(sim)) {}

    static TerminalOptions WithPager(const SimServer& sim) {
        TerminalOptions options;
        // The device map reads the farm in lineprobe's own process.
        options.env = {{"REMOTE_TKHOST", sim.Address()},
                       {"VX7_FARM", FARM},
                       {"CORVO_ORVANE_DIR", "inst/"},
                       {"LESSHISTFILE", "-"}};
        options.File("inst/bin/lineprobe_help.txt", "HELP PAGE\n");
        return options;
    }
    void SetUp() override {
        ASSERT_TRUE(sim.Running());
        ViewsTest::SetUp();
    }
    void Control(const std::string& line) {
        const std::string answer = sim.Control(line);
        ASSERT_EQ(answer.rfind("ok", 0), 0u) << line << ": " << answer;
    }
    // The screen as it must come back: rows of the full layout, with the cursor.
    void ExpectLayout(const std::vector<std::string>& before, std::pair<int, int> cursor) {
        const std::vector<std::string> after = session.Screen();
        for (std::size_t row = 0; row < before.size(); ++row) {
            EXPECT_EQ(after[row].substr(0, 100), before[row].substr(0, 100))
                << "row " << row << "\n"
                << session.Dump();
        }
        EXPECT_EQ(session.Cursor(), cursor);
    }
};

// How the events of the board reach the rows is the soak's (tests/system) and the observers'
// test's; here, what the terminal does to them.
TEST_F(RelayTest, RowsFollowTheLineThroughThePagerAndTheTerminalsSizes) {
    // A deleted view draws no more: the alarm of its line does not reach the row of the next.
    ASSERT_TRUE(commands.Run("trunk 1 2"));
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    ASSERT_TRUE(commands.Run("deltrunk 1 2"));
    Control("alarm 1 2 red on");
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(WaitTrunk(1, 0, " 1.1 "));
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    EXPECT_EQ(session.TextAt(TRUNK_ROW0 + 1, RED_COL, 1), " ");

    // Events that arrive while the pager has the terminal draw only once it is given back.
    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText("HELP PAGE"));
    Control("alarm 1 1 red on");
    Control("bpv 1 1 5");
    std::this_thread::sleep_for(500ms);
    EXPECT_FALSE(session.WaitForText("InService", 0ms)) << session.Dump();
    EXPECT_TRUE(session.WaitForText("HELP PAGE", 0ms));
    session.SendKeys({"q"});
    EXPECT_TRUE(WaitTrunk(1, 54, "X"));
    EXPECT_TRUE(WaitTrunk(1, 85, "5 "));
    EXPECT_TRUE(WaitTrunk(1, 8, "InService"));

    // A line half typed, with the cursor inside it, through a terminal below the minimum:
    // a notice instead of the layout, and the layout back whole once the terminal is large
    // enough, with what happened meanwhile.
    session.Type("bogus 17");
    session.SendKeys({"Left"});
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> bogus 17"));
    std::vector<std::string> before = session.Screen();
    const std::pair<int, int> cursor = session.Cursor();
    ASSERT_EQ(cursor, std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 7));
    const std::string notice = "terminal too small: 40x100 needed";
    session.Resize(30, 80);
    ASSERT_TRUE(session.WaitForTextAt(0, 0, notice));
    // An event while the layout cannot be shown: it must not be drawn over the notice.
    Control("alarm 1 1 red off");
    session.Resize(39, 100);
    ASSERT_TRUE(session.WaitForTextAt(0, 0, notice + " (now 39x100)"));
    // Time for the event to reach the row that cannot be shown.
    std::this_thread::sleep_for(500ms);
    const std::vector<std::string> small = session.Screen();
    for (std::size_t row = 1; row < small.size(); ++row) {
        EXPECT_EQ(small[row].find_first_not_of(' '), std::string::npos) << "row " << row << "\n"
                                                                        << session.Dump();
    }
    session.Resize(40, 100);
    ASSERT_TRUE(WaitTrunk(1, 54, " "));
    before[static_cast<std::size_t>(TRUNK_ROW0 + 1)][RED_COL] = ' ';
    ExpectLayout(before, cursor);
    // The line typed before the resize goes on being edited and is entered whole.
    session.Type("8");
    session.SendKeys({"Enter"});
    ASSERT_TRUE(session.WaitForLogLine("lineprobe.log", LOOKUP_TRACE + std::string("bogus")));
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "  Unrecgnized Command"));
    EXPECT_TRUE(HasLine(*session.ReadLog(), "validArgs: 2"));

    // A larger terminal shows the layout unchanged in its corner: the separators stay 100
    // long and nothing is drawn beside or below it.
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW));
    before = session.Screen();
    const std::pair<int, int> home = session.Cursor();
    session.Resize(50, 130);
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    Control("alarm 1 1 red on");
    ASSERT_TRUE(WaitTrunk(1, 54, "X"));
    const std::vector<std::string> wide = session.Screen();
    for (std::size_t row = 0; row < wide.size(); ++row) {
        const std::string beyond = row < 40 ? wide[row].substr(101) : wide[row];
        EXPECT_EQ(beyond.find_first_not_of(' '), std::string::npos) << "row " << row << "\n"
                                                                    << session.Dump();
    }
    EXPECT_EQ(session.Cursor(), home);
    session.Resize(40, 100);
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW));
    Control("alarm 1 1 red off");
    ASSERT_TRUE(WaitTrunk(1, 54, " "));
    ExpectLayout(before, home);
    EXPECT_TRUE(session.StillRunning());
}

// A relay that dies and comes back on the same port costs the operator only the outage: the
// rows follow the board again without a command.
TEST_F(RelayTest, RelayKilledAndStartedAgainOnItsPort) {
    ASSERT_TRUE(commands.Run("phone 1 1 2"));
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    auto count = [](const std::optional<std::string>& log, const std::string& text) {
        return log ? CountOccurrences(*log, text) : 0;
    };
    // Polls until `done`, for at most `limit`; the time that took, or nothing.
    auto waitFor = [](auto done, std::chrono::milliseconds limit = DEFAULT_WAIT) {
        const auto t0 = std::chrono::steady_clock::now();
        while (!done()) {
            if (std::chrono::steady_clock::now() - t0 > limit) {
                return std::optional<std::chrono::milliseconds>();
            }
            std::this_thread::sleep_for(2ms);
        }
        return std::optional(std::chrono::duration_cast<std::chrono::milliseconds>(
            std::chrono::steady_clock::now() - t0));
    };
    auto inBothLogs = [&](const std::string& text) {
        return waitFor([&] {
            return count(session.ReadLog(), text) > 0 && count(session.ReadErrLog(), text) > 0;
        });
    };

    sim.Kill();
    ASSERT_TRUE(inBothLogs("relay connection to " + sim.Address() + " lost at "));
    EXPECT_TRUE(session.WaitForText("relay cut off"));
    // Neither a request's 5 s nor a one-way command's 1 s wait for a relay known to be gone;
    // what the terminal and the log add to the program's own time is well under either. The
    // time runs until the error log says why the line was not sent.
    const std::string notSent = " not sent: the relay connection";
    for (const char* line : {"makecall 1 1 2", "stoprai 1 1"}) {
        const std::size_t before = count(session.ReadErrLog(), notSent);
        session.TypeLine(line);
        const auto took = waitFor([&] { return count(session.ReadErrLog(), notSent) > before; });
        ASSERT_TRUE(took) << line << "\n" << *session.ReadErrLog();
        EXPECT_LT(took->count(), 500) << line;
        ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW));
    }
    EXPECT_TRUE(session.StillRunning());

    ASSERT_TRUE(sim.Restart());
    ASSERT_TRUE(inBothLogs("relay connection to " + sim.Address() + " back at "));
    // Both views subscribed again: from here on the board's events reach them.
    ASSERT_TRUE(waitFor([&] { return count(session.ReadLog(), ": subscribed again") >= 2; }))
        << *session.ReadLog();
    EXPECT_FALSE(session.WaitForText("relay cut off", 0ms)) << session.Dump();
    Control("alarm 1 1 red on");
    EXPECT_TRUE(WaitTrunk(1, 54, "X"));
    Control("call 1 1 2 5550000");
    EXPECT_TRUE(WaitPhone(1, 47, "Offered"));
    EXPECT_TRUE(session.StillRunning());
}

// The README's demo scenario, played by vx7sim itself: each step shows on the rows before the
// next one does.
class DemoTest : public RelayTest {
  protected:
    DemoTest() : RelayTest({"--script", DEMO}) {}
};

TEST_F(DemoTest, DemoScenarioReachesTheRowsInItsOrder) {
    ASSERT_TRUE(commands.Run("phone 1 1 2"));
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(WaitTrunk(1, 8, "InService"));
    auto call = [&] { return session.TextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, 12); };
    auto red = [&] { return session.TextAt(TRUNK_ROW0 + 1, RED_COL, 1); };
    // The scenario waits 5 s before its first step; the views are open well before that.
    ASSERT_EQ(call().rfind("Offered", 0), std::string::npos) << session.Dump();
    ASSERT_EQ(red(), " ");

    const auto step = 15000ms;
    ASSERT_TRUE(session.WaitForTextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, "Offered", step));
    EXPECT_EQ(red(), " ") << session.Dump();
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, "X", step));
    EXPECT_EQ(session.TextAt(TRUNK_ROW0 + 1, BPV_COL, 2), "0 ") << session.Dump();
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, " ", step));
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, BPV_COL, "25", step));
    EXPECT_EQ(call().rfind("Offered", 0), 0u) << session.Dump();
    EXPECT_TRUE(session.WaitForTextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, "Disconnected", step));
    EXPECT_TRUE(session.StillRunning());
}

// Neither served nor played: the one line says which line is wrong, and why.
TEST(RelayScript, ABadLineIsRefusedWithItsNumberAndNothingPlays) {
    const std::string path = ::testing::TempDir() + "vx7sim_" + std::to_string(getpid());
    std::ofstream(path) << "# a good line first\ncall 1 1 2 5550000\nsleep 100\n\n"
                           "alarm 1 1 purple on\nhangup 1 1 2\n";
    int status = -1;
    const std::string text =
        ShellOutput(std::string(VX7SIM_BINARY) + " --port 0 --bind 127.0.0.1 --script " + path +
                        " 2>&1 </dev/null",
                    &status);
    std::remove(path.c_str());
    EXPECT_EQ(status, 2);
    EXPECT_EQ(text, "vx7sim: " + path +
                        ": line 5: unknown alarm \"purple\" (red, yellow, ais, los, loopback, "
                        "raicrc, dchan); nothing played\n");
}

}  // namespace
}  // namespace lineprobe::testing
