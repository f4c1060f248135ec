// The views against vx7sim, whose control channel plays the network: error counters and line
// states, the demo script, a relay that dies and comes back, and events during the pager.
// Refused, silent and dropped relays are the fault run's (tests/system).
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <optional>
#include <string>
#include <thread>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

const std::string FARM = LINEPROBE_FARMS_DIR "/default.toml";
const std::string DEMO = LINEPROBE_FARMS_DIR "/demo.script";

TerminalOptions ThroughRelay(const SimServer& sim) {
    TerminalOptions options;
    options.env.emplace_back("REMOTE_TKHOST", sim.Address());
    // The device map reads the farm in lineprobe's own process.
    options.env.emplace_back("VX7_FARM", FARM);
    return options;
}

class RelayTest : public ::testing::Test {
  protected:
    RelayTest() : sim(FARM), session(ThroughRelay(sim)), commands(session) {}
    void SetUp() override {
        ASSERT_TRUE(sim.Running());
        ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    }

    std::string Cell(int row, int col, std::size_t length) {
        return session.TextAt(TRUNK_ROW0 + row, WINDOW_COL0 + col, length);
    }
    bool WaitTrunk(int row, int col, const std::string& text) {
        return session.WaitForTextAt(TRUNK_ROW0 + row, WINDOW_COL0 + col, text);
    }
    void Control(const std::string& line) {
        const std::string answer = sim.Control(line);
        ASSERT_EQ(answer.rfind("ok", 0), 0u) << line << ": " << answer;
    }

    SimServer sim;
    TerminalSession session;
    CommandRunner commands;
};

TEST_F(RelayTest, CountersAndLineStatesFollowTheLine) {
    ASSERT_TRUE(commands.Run("trunk 1 2"));
    ASSERT_TRUE(WaitTrunk(1, 8, "InService")) << session.Dump();
    Control("bpv 1 2 12");
    Control("ferr 1 2 3");
    EXPECT_TRUE(WaitTrunk(1, 85, "12")) << session.Dump();
    EXPECT_TRUE(WaitTrunk(1, 92, "3 ")) << session.Dump();
    Control("line 1 2 out 3");
    EXPECT_TRUE(WaitTrunk(1, 8, "Out of Service    Maintenance")) << session.Dump();
    Control("line 1 2 in 0");
    EXPECT_TRUE(WaitTrunk(1, 8, "InService         Null          ")) << session.Dump();

    // A new view of the line counts from 0 again, and the deleted one draws no more.
    ASSERT_TRUE(commands.Run("deltrunk 1 2"));
    Control("alarm 1 2 red on");
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(WaitTrunk(1, 0, " 1.1 ")) << session.Dump();
    EXPECT_EQ(Cell(1, 85, 8), "0      0");
    EXPECT_EQ(Cell(1, 54, 1), " ");
}

// The README's demo scenario, played by vx7sim itself: each step shows on the rows before the
// next one does.
TEST(RelayScript, DemoScenarioReachesTheRowsInItsOrder) {
    SimServer sim(FARM, {"--script", DEMO});
    ASSERT_TRUE(sim.Running());
    TerminalSession session(ThroughRelay(sim));
    CommandRunner commands(session);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    ASSERT_TRUE(commands.Run("phone 1 1 2"));
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 8, "InService"))
        << session.Dump();
    auto call = [&] { return session.TextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, 12); };
    auto red = [&] { return session.TextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 54, 1); };
    auto bpv = [&] { return session.TextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 85, 2); };
    // The scenario waits 5 s before its first step; the views are open well before that.
    ASSERT_EQ(call().rfind("Offered", 0), std::string::npos) << session.Dump();
    ASSERT_EQ(red(), " ");

    const auto step = std::chrono::milliseconds(15000);
    ASSERT_TRUE(session.WaitForTextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, "Offered", step))
        << session.Dump();
    EXPECT_EQ(red(), " ") << session.Dump();
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 54, "X", step))
        << session.Dump();
    EXPECT_EQ(bpv(), "0 ") << session.Dump();
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 54, " ", step))
        << session.Dump();
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 85, "25", step))
        << session.Dump();
    EXPECT_EQ(call().rfind("Offered", 0), 0u) << session.Dump();
    EXPECT_TRUE(session.WaitForTextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, "Disconnected", step))
        << session.Dump();
    EXPECT_TRUE(session.StillRunning());
}

TEST(RelayScript, ABadLineIsRefusedWithItsNumberAndNothingPlays) {
    char path[] = "/tmp/vx7sim_scriptXXXXXX";
    const int fd = mkstemp(path);
    ASSERT_GE(fd, 0);
    const std::string script =
        "# a good line first\ncall 1 1 2 5550000\nsleep 100\n\n"
        "alarm 1 1 purple on\nhangup 1 1 2\n";
    ASSERT_EQ(write(fd, script.data(), script.size()), static_cast<ssize_t>(script.size()));
    close(fd);
    const std::string command = std::string(VX7SIM_BINARY) +
                                " --port 0 --bind 127.0.0.1 --script " + path + " 2>&1 </dev/null";
    FILE* out = popen(command.c_str(), "r");
    ASSERT_NE(out, nullptr);
    std::string text;
    char buf[512];
    for (std::size_t n; (n = fread(buf, 1, sizeof buf, out)) > 0;) {
        text.append(buf, n);
    }
    const int status = pclose(out);
    unlink(path);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 2) << status;
    // Neither served nor played: the one line says which line is wrong, and why.
    EXPECT_EQ(text, std::string("vx7sim: ") + path +
                        ": line 5: unknown alarm \"purple\" (red, yellow, ais, los, loopback, "
                        "raicrc, dchan); nothing played\n");
}

// A relay that drops its connections or dies and comes back on the same port costs the
// operator only the outage: the rows follow the board again without a command.
class RelayOutageTest : public RelayTest {
  protected:
    void SetUp() override {
        RelayTest::SetUp();
        ASSERT_TRUE(commands.Run("phone 1 1 2"));
        ASSERT_TRUE(commands.Run("trunk 1 1"));
        ASSERT_TRUE(WaitTrunk(1, 8, "InService")) << session.Dump();
    }

    std::size_t Count(const std::optional<std::string>& log, const std::string& text) {
        std::size_t n = 0;
        for (std::size_t at = log ? log->find(text) : std::string::npos; at != std::string::npos;
             at = log->find(text, at + 1)) {
            ++n;
        }
        return n;
    }
    // Until both logs hold `text` `n` times.
    bool WaitInBothLogs(const std::string& text, std::size_t n = 1) {
        const auto deadline = std::chrono::steady_clock::now() + DEFAULT_WAIT;
        while (Count(session.ReadLog(), text) < n || Count(session.ReadErrLog(), text) < n) {
            if (std::chrono::steady_clock::now() > deadline) {
                return false;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return true;
    }
    // Both views subscribed again: from here on the board's events reach them.
    bool WaitRestored(std::size_t times) {
        const auto deadline = std::chrono::steady_clock::now() + DEFAULT_WAIT;
        while (Count(session.ReadLog(), ": subscribed again") < 2 * times) {
            if (std::chrono::steady_clock::now() > deadline) {
                return false;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return true;
    }
    void ExpectRowsFollowTheBoard() {
        Control("alarm 1 1 red on");
        EXPECT_TRUE(WaitTrunk(1, 54, "X")) << session.Dump();
        Control("call 1 1 2 5550000");
        EXPECT_TRUE(session.WaitForTextAt(PHONE_ROW0 + 1, WINDOW_COL0 + 47, "Offered"))
            << session.Dump();
        EXPECT_TRUE(session.StillRunning());
    }
    // Types the line and waits for the error log to say why it was not sent: the time that
    // took, or nothing when it never said so.
    std::optional<std::chrono::milliseconds> FailsAtOnce(const std::string& line) {
        const std::size_t before = Count(session.ReadErrLog(), " not sent: the relay connection");
        const auto t0 = std::chrono::steady_clock::now();
        session.TypeLine(line);
        while (Count(session.ReadErrLog(), " not sent: the relay connection") == before) {
            if (std::chrono::steady_clock::now() - t0 > std::chrono::seconds(10)) {
                return std::nullopt;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
        }
        return std::chrono::duration_cast<std::chrono::milliseconds>(
            std::chrono::steady_clock::now() - t0);
    }
};

TEST_F(RelayOutageTest, RelayKilledAndStartedAgainOnItsPort) {
    sim.Kill();
    ASSERT_TRUE(WaitInBothLogs("relay connection to " + sim.Address() + " lost at "));
    EXPECT_TRUE(session.WaitForText("relay cut off")) << session.Dump();

    // Neither a request's 5 s nor a one-way command's 1 s wait for a relay known to be gone;
    // what the terminal and the log add to the program's own time is well under either.
    const auto request = FailsAtOnce("makecall 1 1 2");
    ASSERT_TRUE(request) << *session.ReadErrLog();
    EXPECT_LT(request->count(), 500);
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session.Dump();
    const auto oneWay = FailsAtOnce("stoprai 1 1");
    ASSERT_TRUE(oneWay) << *session.ReadErrLog();
    EXPECT_LT(oneWay->count(), 500);
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, EMPTY_PROMPT_ROW)) << session.Dump();
    EXPECT_TRUE(session.StillRunning());

    ASSERT_TRUE(sim.Restart());
    ASSERT_TRUE(WaitInBothLogs("relay connection to " + sim.Address() + " back at "));
    ASSERT_TRUE(WaitRestored(1)) << *session.ReadLog();
    EXPECT_FALSE(session.WaitForText("relay cut off", std::chrono::milliseconds(0)))
        << session.Dump();
    ExpectRowsFollowTheBoard();
}

TEST(RelayHelp, EventsDuringThePagerDrawOnlyWhenTheScreenComesBack) {
    SimServer sim(FARM);
    ASSERT_TRUE(sim.Running());
    TerminalOptions options = ThroughRelay(sim);
    options.env.emplace_back("CORVO_ORVANE_DIR", "inst/");
    options.env.emplace_back("LESSHISTFILE", "-");
    options.File("inst/bin/lineprobe_help.txt", "HELP PAGE\n");
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    CommandRunner commands(session);
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 8, "InService"))
        << session.Dump();

    session.TypeLine("help");
    ASSERT_TRUE(session.WaitForText("HELP PAGE")) << session.Dump();
    ASSERT_EQ(sim.Control("alarm 1 1 red on").rfind("ok", 0), 0u);
    ASSERT_EQ(sim.Control("bpv 1 1 5").rfind("ok", 0), 0u);
    // The events arrive while the pager has the terminal: nothing of the row shows.
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    EXPECT_FALSE(session.WaitForText("InService", std::chrono::milliseconds(0))) << session.Dump();
    EXPECT_TRUE(session.WaitForText("HELP PAGE", std::chrono::milliseconds(0))) << session.Dump();

    session.SendKeys({"q"});
    EXPECT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 54, "X")) << session.Dump();
    EXPECT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 85, "5 ")) << session.Dump();
    EXPECT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 8, "InService"));
    EXPECT_TRUE(session.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
