// The screen through changes of the terminal's size: a terminal below the minimum gets a
// notice, and the whole layout comes back once it is large enough, with what happened
// meanwhile.
#include <gtest/gtest.h>

#include <chrono>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

const std::string FARM = LINEPROBE_FARMS_DIR "/default.toml";
const std::string NOTICE = "terminal too small: 40x100 needed";
// The red alarm column of a trunk row.
constexpr int RED_COL = WINDOW_COL0 + 54;

TerminalOptions ThroughRelay(const SimServer& sim) {
    TerminalOptions options;
    options.env.emplace_back("REMOTE_TKHOST", sim.Address());
    options.env.emplace_back("VX7_FARM", FARM);
    return options;
}

class ResizeTest : public ::testing::Test {
  protected:
    ResizeTest() : sim(FARM), session(ThroughRelay(sim)), commands(session) {}
    void SetUp() override {
        ASSERT_TRUE(sim.Running());
        ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
        ASSERT_TRUE(commands.Run("trunk 1 1"));
        ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 8, "InService"))
            << session.Dump();
        // A line half typed, with the cursor inside it.
        session.Type("bogus 17");
        session.SendKeys({"Left"});
        ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> bogus 17")) << session.Dump();
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

    SimServer sim;
    TerminalSession session;
    CommandRunner commands;
};

TEST_F(ResizeTest, TooSmallSaysSoAndTheLayoutComesBackWithWhatHappenedMeanwhile) {
    std::vector<std::string> before = session.Screen();
    const std::pair<int, int> cursor = session.Cursor();
    ASSERT_EQ(cursor, std::make_pair(PROMPT_ROW, PROMPT_COL + 3 + 7));

    session.Resize(30, 80);
    ASSERT_TRUE(session.WaitForTextAt(0, 0, NOTICE)) << session.Dump();
    // An event while the layout cannot be shown: it must not be drawn over the notice.
    ASSERT_EQ(sim.Control("alarm 1 1 red on").rfind("ok", 0), 0u);
    session.Resize(39, 100);
    ASSERT_TRUE(session.WaitForTextAt(0, 0, NOTICE + " (now 39x100)")) << session.Dump();
    // Time for the event to reach the row that cannot be shown.
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    const std::vector<std::string> small = session.Screen();
    for (std::size_t row = 1; row < small.size(); ++row) {
        EXPECT_EQ(small[row].find_first_not_of(' '), std::string::npos) << "row " << row << "\n"
                                                                        << session.Dump();
    }
    EXPECT_TRUE(session.StillRunning());

    session.Resize(40, 100);
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, "X")) << session.Dump();
    before[static_cast<std::size_t>(TRUNK_ROW0 + 1)][RED_COL] = 'X';
    ExpectLayout(before, cursor);

    // The line typed before the resize goes on being edited and is entered whole.
    session.Type("8");
    session.SendKeys({"Enter"});
    ASSERT_TRUE(
        session.WaitForLogLine("lineprobe.log", "Calling CmdProcessor::FindCommand: cmdStr= bogus"))
        << session.Dump();
    EXPECT_TRUE(session.WaitForRow(RESULT_ROW, "  Unrecgnized Command")) << session.Dump();
    EXPECT_TRUE(HasLine(*session.ReadLog(), "validArgs: 2"));
    EXPECT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, "X")) << session.Dump();
    EXPECT_TRUE(session.StillRunning());
}

TEST_F(ResizeTest, ALargerTerminalShowsTheLayoutUnchangedInItsCorner) {
    const std::vector<std::string> before = session.Screen();
    const std::pair<int, int> cursor = session.Cursor();

    session.Resize(50, 130);
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 8, "InService"))
        << session.Dump();
    ASSERT_EQ(sim.Control("alarm 1 1 red on").rfind("ok", 0), 0u);
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, "X")) << session.Dump();
    // The separators stay 100 long and nothing is drawn beside or below the layout.
    const std::vector<std::string> wide = session.Screen();
    for (std::size_t row = 0; row < wide.size(); ++row) {
        const std::string beyond = row < 40 ? wide[row].substr(101) : wide[row];
        EXPECT_EQ(beyond.find_first_not_of(' '), std::string::npos) << "row " << row << "\n"
                                                                    << session.Dump();
    }
    EXPECT_EQ(session.Cursor(), cursor);

    session.Resize(40, 100);
    ASSERT_TRUE(session.WaitForRow(PROMPT_ROW, "  -> bogus 17")) << session.Dump();
    ASSERT_EQ(sim.Control("alarm 1 1 red off").rfind("ok", 0), 0u);
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 1, RED_COL, " ")) << session.Dump();
    ExpectLayout(before, cursor);
    EXPECT_TRUE(session.StillRunning());
}

}  // namespace
}  // namespace lineprobe::testing
