#include "sim/Control.h"

#include <gtest/gtest.h>

namespace sim {
namespace {

TEST(Control, CallTakesChannelAndNumber) {
    ControlParse p = parseControl("call 1 2 23 5551212");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_EQ(p.cmd.kind, ControlKind::Call);
    EXPECT_EQ(p.cmd.board, 1u);
    EXPECT_EQ(p.cmd.trunk, 2u);
    EXPECT_EQ(p.cmd.channel, 23u);
    EXPECT_EQ(p.cmd.from, "5551212");
}

struct AlarmCase {
    const char* line;
    std::uint32_t alarm;
    bool on;
};

class ControlAlarm : public testing::TestWithParam<AlarmCase> {};

TEST_P(ControlAlarm, NameGivesAlarmNumber) {
    ControlParse p = parseControl(GetParam().line);
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_EQ(p.cmd.kind, ControlKind::Alarm);
    EXPECT_EQ(p.cmd.alarmId, GetParam().alarm);
    EXPECT_EQ(p.cmd.on, GetParam().on);
}

INSTANTIATE_TEST_SUITE_P(Names, ControlAlarm,
                         testing::Values(AlarmCase{"alarm 1 1 red on", 0x1601, true},
                                         AlarmCase{"alarm 1 1 yellow off", 0x1602, false},
                                         AlarmCase{"alarm 1 1 ais on", 0x1603, true},
                                         AlarmCase{"alarm 1 1 los on", 0x1604, true},
                                         AlarmCase{"alarm 1 1 loopback on", 0x1605, true},
                                         AlarmCase{"alarm 1 1 raicrc on", 0x1606, true},
                                         AlarmCase{"alarm 1 1 dchan off", 0x160A, false}));

TEST(Control, TypesAndCodesAreHex) {
    ControlParse p = parseControl("refuse 1610 1600");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_EQ(p.cmd.kind, ControlKind::Refuse);
    EXPECT_EQ(p.cmd.msgType, 0x1610u);
    EXPECT_EQ(p.cmd.code, 0x1600u);

    p = parseControl("silence 0x800053");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_EQ(p.cmd.kind, ControlKind::Silence);
    EXPECT_EQ(p.cmd.msgType, 0x800053u);
}

TEST(Control, RefuseWithoutCodeUsesDefaultCode) {
    ControlParse p = parseControl("refuse 12");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_EQ(p.cmd.code, 0x1FFu);
}

TEST(Control, LineReasonIsOptional) {
    ControlParse p = parseControl("line 1 2 out 5");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_FALSE(p.cmd.on);
    EXPECT_EQ(p.cmd.reason, 5u);
    p = parseControl("line 1 2 in");
    ASSERT_TRUE(p.ok) << p.error;
    EXPECT_TRUE(p.cmd.on);
    EXPECT_EQ(p.cmd.reason, 0u);
}

TEST(Control, BlankAndCommentLinesAreNoCommand) {
    for (const char* line : {"", "   ", "# a note", "\t# indented note"}) {
        ControlParse p = parseControl(line);
        EXPECT_FALSE(p.ok) << line;
        EXPECT_TRUE(p.error.empty()) << line;
    }
}

struct BadCase {
    const char* line;
    const char* error;
};

class ControlBad : public testing::TestWithParam<BadCase> {};

TEST_P(ControlBad, IsRefusedWithItsReason) {
    ControlParse p = parseControl(GetParam().line);
    EXPECT_FALSE(p.ok);
    EXPECT_EQ(p.error, GetParam().error);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, ControlBad,
    testing::Values(
        BadCase{"dial 1 1 1", "unknown command \"dial\" (try help)"},
        BadCase{"call 1 1 1", "call takes 4 arguments, got 3"},
        BadCase{"call 33 1 1 555", "board must be a number from 0 to 32, not \"33\""},
        BadCase{"hangup 1 65 1", "trunk must be a number from 0 to 64, not \"65\""},
        BadCase{"hangup 1 1 32", "channel must be a number from 0 to 31, not \"32\""},
        BadCase{"hangup 1 1 -1", "channel must be a number from 0 to 31, not \"-1\""},
        BadCase{"alarm 1 1 purple on",
                "unknown alarm \"purple\" (red, yellow, ais, los, loopback, raicrc, dchan)"},
        BadCase{"alarm 1 1 red maybe", "alarm state must be on or off, not \"maybe\""},
        BadCase{"line 1 1 sideways", "line state must be in or out, not \"sideways\""},
        BadCase{"line 1 1 out 6", "REASON must be a number from 0 to 5, not \"6\""},
        BadCase{"bpv 1 1 lots", "N must be a number from 0 to 10000000, not \"lots\""},
        BadCase{"refuse 12zz", "TYPE must be a hex number, not \"12zz\""},
        BadCase{"refuse", "refuse takes 1 to 2 arguments, got 0"},
        BadCase{"delay 600001", "MS must be a number from 0 to 600000, not \"600001\""},
        BadCase{"stats now", "stats takes 0 arguments, got 1"}));

TEST(ControlScript, StepsKeepTheirLineNumbersAndSleeps) {
    ScriptParse p = parseScript("# ring\n\ncall 1 1 2 5550100\r\n  sleep 250\nalarm 1 1 red on");
    ASSERT_TRUE(p.ok) << p.error;
    ASSERT_EQ(p.steps.size(), 3u);
    EXPECT_EQ(p.steps[0].line, 3u);
    EXPECT_EQ(p.steps[0].command, "call 1 1 2 5550100\r");
    EXPECT_EQ(p.steps[1].line, 4u);
    EXPECT_EQ(p.steps[1].command, "");
    EXPECT_EQ(p.steps[1].sleepMs, 250u);
    EXPECT_EQ(p.steps[2].line, 5u);
    EXPECT_EQ(p.steps[2].command, "alarm 1 1 red on");
}

struct BadScript {
    const char* text;
    const char* error;
};

class ControlScriptBad : public testing::TestWithParam<BadScript> {};

TEST_P(ControlScriptBad, OneBadLineRefusesTheWholeScript) {
    ScriptParse p = parseScript(GetParam().text);
    EXPECT_FALSE(p.ok);
    EXPECT_TRUE(p.steps.empty());
    EXPECT_EQ(p.error, GetParam().error);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, ControlScriptBad,
    testing::Values(BadScript{"call 1 1 2 5550100\nsleep\n",
                              "line 2: sleep takes a number of milliseconds "
                              "from 0 to 3600000"},
                    BadScript{"sleep 3600001",
                              "line 1: sleep takes a number of milliseconds from 0 to "
                              "3600000"},
                    BadScript{"sleep 10 20",
                              "line 1: sleep takes a number of milliseconds from 0 to 3600000"},
                    BadScript{"stats\n\n# fine so far\nhangup 1 1\nstats\n",
                              "line 4: hangup takes 3 arguments, got 2"}));

}  // namespace
}  // namespace sim
