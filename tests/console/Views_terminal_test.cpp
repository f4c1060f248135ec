// The views and their commands as the operator meets them, against the board emulation
// that lineprobe runs in its own process when no relay host is set.
#include <gtest/gtest.h>

#include <string>

#include "ConsoleScreen.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

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

class ViewsTest : public ::testing::Test {
  protected:
    ViewsTest() : session(BuiltinFarm()), commands(session) {}
    void SetUp() override {
        ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    }

    std::string PhoneRow(int row) { return Trimmed(session, PHONE_ROW0 + row); }
    std::string TrunkRow(int row) { return Trimmed(session, TRUNK_ROW0 + row); }
    bool WaitPhone(int row, int col, const std::string& text) {
        return session.WaitForTextAt(PHONE_ROW0 + row, WINDOW_COL0 + col, text);
    }
    bool WaitTrunk(int row, int col, const std::string& text) {
        return session.WaitForTextAt(TRUNK_ROW0 + row, WINDOW_COL0 + col, text);
    }

    TerminalSession session;
    CommandRunner commands;
};

TEST_F(ViewsTest, SystemViewAndHeadsOfTheDefaultFarm) {
    EXPECT_EQ(Trimmed(session, 0), std::string(46, ' ') + "SYSTEM VIEW - vx7-demo");
    EXPECT_EQ(Trimmed(session, 2), "  brd 1: (VX7/T1-2):  (L1 c=24 CAS) (L2 c=24 CAS)");
    EXPECT_EQ(Trimmed(session, 3), "  brd 2: (VX7/PRI-1):  (L1 c=23 CCS)");
    EXPECT_EQ(Trimmed(session, 4), "  brd 3: (VX7/AN-8):  (L1 c=4 CAS) (L2 c=4 CAS)");
    EXPECT_EQ(Trimmed(session, 5), "");
    EXPECT_EQ(PhoneRow(0),
              "  B.L.C  CallId     ChanState                   CallState              Reason");
    EXPECT_EQ(TrunkRow(0),
              "  B.L    TrunkState        Reason          Sig   LBK   Red   Yel   CRC   AIS   "
              "DChan  BPVS   FERR");
}

TEST_F(ViewsTest, CallBetweenTwoChannelsAnsweredAndDropped) {
    ASSERT_TRUE(commands.Run("phone 1 1 1"));
    EXPECT_EQ(commands.Result(), "phone view creaed successfully");
    ASSERT_TRUE(commands.Run("phone 1 1 23"));
    EXPECT_EQ(PhoneRow(1).substr(0, 56), "  1.1.1  0x0        Active                      Null");
    EXPECT_EQ(PhoneRow(2).substr(0, 8), "  1.1.23");

    // The default addresses call 1.1.23 from 1.1.1.
    ASSERT_TRUE(commands.Run("makecall 1 1 1"));
    EXPECT_EQ(commands.Result(), "makecall started successfully");
    ASSERT_TRUE(WaitPhone(2, 47, "Offered")) << session.Dump();
    ASSERT_TRUE(WaitPhone(1, 47, "Alerting")) << session.Dump();
    EXPECT_EQ(session.TextAt(PHONE_ROW0 + 2, WINDOW_COL0 + 70, 12), "IncomingCall");

    // answer prints nothing on success.
    ASSERT_TRUE(commands.Run("answer 1 1 23"));
    EXPECT_EQ(commands.Result(), "");
    ASSERT_TRUE(WaitPhone(1, 47, "Connected")) << session.Dump();
    ASSERT_TRUE(WaitPhone(2, 47, "Connected")) << session.Dump();

    ASSERT_TRUE(commands.Run("drop 1 1 1"));
    EXPECT_EQ(commands.Result(), "");
    ASSERT_TRUE(WaitPhone(2, 47, "Disconnected")) << session.Dump();
    ASSERT_TRUE(WaitPhone(1, 70, "Normal")) << session.Dump();
    EXPECT_TRUE(session.StillRunning());
}

struct Expect {
    const char* line;
    const char* result;
};

TEST_F(ViewsTest, EveryCommandWithoutItsViewSaysSo) {
    const Expect cases[] = {
        {"answer 1 1 5", "ERROR - unable to find phone view"},
        {"accept 1 1 5", "ERROR - unable to find phone view"},
        {"drop 1 1 5", "ERROR - unable to find phone view"},
        {"release 1 1 5", "ERROR - unable to find phone view"},
        {"reset 1 1 5", "ERROR - unable to find phone view"},
        {"chan_oos 1 1 5", "ERROR - unable to find phone view"},
        {"chan_ins 1 1 5", "ERROR - unable to find phone view"},
        {"makecall 1 1 5", "ERROR - unable to find phone view"},
        // The view is looked for before the address is checked.
        {"origaddr 1 1 5 x", "ERROR - unable to find phone view"},
        {"destaddr 1 1 5 5551234", "ERROR - unable to find phone view"},
        {"delphone 1 1 5", "ERROR - unable to delete phone view"},
        {"trunk_ins 1 2", "ERROR - unable to find trunk view"},
        {"trunk_oos 1 2", "ERROR - unable to find trunk view"},
        {"disablelbk 1 2", "ERROR - unable to find trunk view"},
        {"linelbk 1 2", "ERROR - unable to find trunk view"},
        {"payloadlbk 1 2", "ERROR - unable to find trunk view"},
        {"startrai 1 2", "ERROR - unable to find trunk view"},
        {"stoprai 1 2", "ERROR - unable to find trunk view"},
        {"deltrunk 1 2", "ERROR - unable to delete trunk view"},
        // Out of range, or no such line or board.
        {"phone 1 65 1", "ERROR - unable to create phone view"},
        {"phone 1 1 32", "ERROR - unable to create phone view"},
        {"phone 7 1 1", "ERROR - unable to create phone view"},
        {"phone -1 1 1", "ERROR - unable to create phone view"},
        {"trunk 1 3", "ERROR - unable to create trunk view"},
        // A command with the wrong number of fields reaches nothing and says nothing.
        {"phone 1 1", ""},
        {"trunk 1 1 1", ""},
        {"origaddr 1 1 5", ""},
        {"answer", ""},
    };
    for (const Expect& c : cases) {
        ASSERT_TRUE(commands.Run(c.line));
        EXPECT_EQ(commands.Result(), c.result) << c.line;
    }
    EXPECT_EQ(PhoneRow(1), "");
    EXPECT_EQ(TrunkRow(1), "");
}

TEST_F(ViewsTest, PhoneCommandsOnAnOpenView) {
    ASSERT_TRUE(commands.Run("phone 1 2 3"));
    const Expect cases[] = {
        {"phone 1 2 3", "ERROR - unable to create phone view"},
        {"reset 1 2 3", "channel reset completed"},
        {"origaddr 1 2 3 5", "ERROR - invalid origination address"},
        {"destaddr 1 2 3 5", "ERROR - invalid destination address"},
        {"origaddr 1 2 3 5551999", ""},
        {"destaddr 1 2 3 5551234", "destination address set"},
        {"chan_oos 1 2 3", ""},
    };
    for (const Expect& c : cases) {
        ASSERT_TRUE(commands.Run(c.line));
        EXPECT_EQ(commands.Result(), c.result) << c.line;
    }
    ASSERT_TRUE(WaitPhone(1, 19, "OutOfService")) << session.Dump();
    ASSERT_TRUE(commands.Run("chan_ins 1 2 3"));
    EXPECT_EQ(commands.Result(), "");
    // "Active" is followed by two tabs, which carry the blanks past the field's end.
    ASSERT_TRUE(WaitPhone(1, 19, "Active      ")) << session.Dump();
}

TEST_F(ViewsTest, RowsAreTakenLowestFirstAndTheTenthWorksUnseen) {
    for (int chan = 1; chan <= 10; ++chan) {
        ASSERT_TRUE(commands.Run("phone 1 1 " + std::to_string(chan)));
        ASSERT_EQ(commands.Result(), "phone view creaed successfully") << chan;
    }
    EXPECT_EQ(PhoneRow(9).substr(0, 7), "  1.1.9");
    // Row 10 of the window lies below its last row: the tenth view is not seen.
    EXPECT_EQ(Trimmed(session, PHONE_ROW0 + 10), "");
    ASSERT_TRUE(commands.Run("reset 1 1 10"));
    EXPECT_EQ(commands.Result(), "channel reset completed");

    ASSERT_TRUE(commands.Run("phone 1 1 11"));
    EXPECT_EQ(commands.Result(), "ERROR - unable to create phone view");
    ASSERT_TRUE(commands.Run("phone 1 1 1"));
    EXPECT_EQ(commands.Result(), "ERROR - unable to create phone view");

    ASSERT_TRUE(commands.Run("delphone 1 1 4"));
    EXPECT_EQ(commands.Result(), "successfully deleted phone view");
    EXPECT_EQ(PhoneRow(4), "");
    EXPECT_EQ(PhoneRow(0).substr(0, 7), "  B.L.C");
    ASSERT_TRUE(commands.Run("phone 1 2 7"));
    EXPECT_EQ(commands.Result(), "phone view creaed successfully");
    EXPECT_EQ(PhoneRow(4).substr(0, 7), "  1.2.7");
}

TEST_F(ViewsTest, TrunkCommandsShowOnTheRow) {
    ASSERT_TRUE(commands.Run("trunk 1 1"));
    EXPECT_EQ(commands.Result(), "trunk view creaed successfully");
    ASSERT_TRUE(WaitTrunk(1, 8, "InService")) << session.Dump();
    EXPECT_EQ(TrunkRow(1).substr(0, 5), "  1.1");
    // A line with its signal and D channel good: both reversed columns show "X".
    EXPECT_EQ(session.TextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 42, 1), "X");
    EXPECT_EQ(session.TextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 78, 1), "X");
    EXPECT_EQ(session.TextAt(TRUNK_ROW0 + 1, WINDOW_COL0 + 85, 8), "0      0");

    const Expect cases[] = {
        {"trunk 1 1", "ERROR - unable to create trunk view"},
        {"linelbk 1 1", "enabling line loopback completed"},
        {"disablelbk 1 1", "Disabling loopback mode completed"},
        {"payloadlbk 1 1", "enabling Payload loopback completed"},
        {"startrai 1 1", "starting of RAI transmission completed"},
        {"stoprai 1 1", "stopping of RAI transmission completed"},
        {"trunk_oos 1 1", ""},
    };
    for (const Expect& c : cases) {
        ASSERT_TRUE(commands.Run(c.line));
        EXPECT_EQ(commands.Result(), c.result) << c.line;
    }
    ASSERT_TRUE(WaitTrunk(1, 48, "X")) << session.Dump();
    ASSERT_TRUE(WaitTrunk(1, 8, "Out of Service")) << session.Dump();
    ASSERT_TRUE(commands.Run("trunk_ins 1 1"));
    EXPECT_EQ(commands.Result(), "");
    ASSERT_TRUE(WaitTrunk(1, 8, "InService")) << session.Dump();

    ASSERT_TRUE(commands.Run("deltrunk 1 1"));
    EXPECT_EQ(commands.Result(), "successfully deleted trunk view");
    EXPECT_EQ(TrunkRow(1), "");
    ASSERT_TRUE(commands.Run("trunk 3 2"));
    EXPECT_EQ(TrunkRow(1).substr(0, 5), "  3.2");
}

TEST_F(ViewsTest, QuitStopsTheViewsAndEndsWithStatusOne) {
    ASSERT_TRUE(commands.Run("phone 1 1 1"));
    ASSERT_TRUE(commands.Run("trunk 1 2"));
    session.TypeLine("quit");
    EXPECT_EQ(session.WaitForExit(), std::optional<int>(1));
    const auto log = session.ReadLog();
    ASSERT_TRUE(log);
    EXPECT_TRUE(HasLine(*log, "PhoneView::Stop() called: board=1 line=1 chan=1"));
    EXPECT_TRUE(HasLine(*log, "Stopping Trunk Viev: board=1 line=2"));
}

struct FarmCase {
    const char* name;
    const char* farmText;
    std::vector<std::string> rows;  // screen rows 0 to 9, trimmed
};

class SystemViewTest : public ::testing::TestWithParam<FarmCase> {};

TEST_P(SystemViewTest, BoardsAndLinesAsTheFarmHasThem) {
    TerminalOptions options = BuiltinFarm("farm.toml");
    options.File("farm.toml", GetParam().farmText);
    TerminalSession session(options);
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT)) << session.Dump();
    for (std::size_t row = 0; row < GetParam().rows.size(); ++row) {
        EXPECT_EQ(Trimmed(session, static_cast<int>(row)), GetParam().rows[row]) << row;
    }
    EXPECT_TRUE(session.StillRunning());
}

INSTANTIATE_TEST_SUITE_P(
    Farms, SystemViewTest,
    ::testing::Values(
        // Boards keep their numbers, 32 included, in ascending order; signalling texts.
        FarmCase{"Gaps",
                 "system_name = \"gaps\"\n"
                 "[[board]]\nlogical_id = 32\nname = \"E\"\nserial = \"s32\"\n"
                 "  [[board.trunk]]\n  channels = 30\n  type = 2\n  signaling = \"CAS\"\n"
                 "[[board]]\nlogical_id = 0\nname = \"Z\"\nserial = \"s0\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CLEAR\"\n"
                 "[[board]]\nlogical_id = 3\nname = \"T\"\nserial = \"s3\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CCS\"\n",
                 {std::string(46, ' ') + "SYSTEM VIEW - gaps", "", "  brd 0: (Z):  (L1 c=24 CLEAR)",
                  "  brd 3: (T):  (L1 c=24 CCS)", "  brd 32: (E):  (L1 c=30 CAS)", ""}},
        // A board without trunks shows its "brd" text alone.
        FarmCase{"NoTrunks",
                 "system_name = \"bare\"\n"
                 "[[board]]\nlogical_id = 4\nname = \"B\"\nserial = \"s4\"\n",
                 {std::string(46, ' ') + "SYSTEM VIEW - bare", "", "  brd 4: (B):", ""}},
        // Past column 89 the lines of a board go on at column 9 of the next row.
        FarmCase{"Wrapping",
                 "system_name = \"wide\"\n"
                 "[[board]]\nlogical_id = 1\nname = \"VX7/T1-8\"\nserial = \"w\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n"
                 "  [[board.trunk]]\n  channels = 24\n  type = 1\n  signaling = \"CAS\"\n",
                 {std::string(46, ' ') + "SYSTEM VIEW - wide", "",
                  "  brd 1: (VX7/T1-8):  (L1 c=24 CAS) (L2 c=24 CAS) (L3 c=24 CAS) (L4 c=24 CAS) "
                  "(L5 c=24 CAS)",
                  "          (L6 c=24 CAS) (L7 c=24 CAS)", ""}},
        // A farm that cannot be read: no board service, an empty name, no boards.
        FarmCase{"BrokenFarm",
                 "this is = = not toml\n",
                 {std::string(46, ' ') + "SYSTEM VIEW -", "", "", ""}}),
    [](const ::testing::TestParamInfo<FarmCase>& info) { return info.param.name; });

}  // namespace
}  // namespace lineprobe::testing
