#include "sim/Control.h"

#include <gtest/gtest.h>

#include <tuple>

namespace sim {
namespace {

auto fields(const ControlCommand& c) {
    return std::tie(c.kind, c.board, c.trunk, c.channel, c.from, c.alarmId, c.on, c.count, c.reason,
                    c.msgType, c.code, c.delayMs);
}

// A line the language takes, and the whole command it must give: a field left at its default
// in the row must stay at its default.
struct Good {
    const char* line;
    ControlCommand cmd;
};

TEST(Control, EachGoodLineGivesItsCommand) {
    using K = ControlKind;
    auto alarm = [](std::uint32_t id, bool on) {
        return ControlCommand{.kind = K::Alarm, .board = 1, .trunk = 1, .alarmId = id, .on = on};
    };
    const Good rows[] = {
        {"call 1 2 23 5551212",
         {.kind = K::Call, .board = 1, .trunk = 2, .channel = 23, .from = "5551212"}},
        {"alarm 1 1 red on", alarm(0x1601, true)},
        {"alarm 1 1 yellow off", alarm(0x1602, false)},
        {"alarm 1 1 ais on", alarm(0x1603, true)},
        {"alarm 1 1 los on", alarm(0x1604, true)},
        {"alarm 1 1 loopback on", alarm(0x1605, true)},
        {"alarm 1 1 raicrc on", alarm(0x1606, true)},
        {"alarm 1 1 dchan off", alarm(0x160A, false)},
        // Types and codes are hex, with or without a prefix; a refusal has a default code.
        {"refuse 1610 1600", {.kind = K::Refuse, .msgType = 0x1610, .code = 0x1600}},
        {"refuse 12", {.kind = K::Refuse, .msgType = 0x12, .code = 0x1FF}},
        {"silence 0x800053", {.kind = K::Silence, .msgType = 0x800053}},
        // The reason of a line state is optional.
        {"line 1 2 out 5", {.kind = K::Line, .board = 1, .trunk = 2, .reason = 5}},
        {"line 1 2 in", {.kind = K::Line, .board = 1, .trunk = 2, .on = true}},
    };
    for (const Good& g : rows) {
        SCOPED_TRACE(g.line);
        ControlParse p = parseControl(g.line);
        ASSERT_TRUE(p.ok) << p.error;
        EXPECT_TRUE(fields(p.cmd) == fields(g.cmd));
    }
}

// A line the language refuses, with the reason it gives; blank and comment lines are no
// command and no error either.
struct Bad {
    const char* line;
    const char* error;
};

TEST(Control, EachBadLineIsRefusedWithItsReason) {
    const Bad rows[] = {
        {"", ""},
        {"   ", ""},
        {"# a note", ""},
        {"\t# indented note", ""},
        {"dial 1 1 1", "unknown command \"dial\" (try help)"},
        {"call 1 1 1", "call takes 4 arguments, got 3"},
        {"call 33 1 1 555", "board must be a number from 0 to 32, not \"33\""},
        {"hangup 1 65 1", "trunk must be a number from 0 to 64, not \"65\""},
        {"hangup 1 1 32", "channel must be a number from 0 to 31, not \"32\""},
        {"hangup 1 1 -1", "channel must be a number from 0 to 31, not \"-1\""},
        {"alarm 1 1 purple on",
         "unknown alarm \"purple\" (red, yellow, ais, los, loopback, raicrc, dchan)"},
        {"alarm 1 1 red maybe", "alarm state must be on or off, not \"maybe\""},
        {"line 1 1 sideways", "line state must be in or out, not \"sideways\""},
        {"line 1 1 out 6", "REASON must be a number from 0 to 5, not \"6\""},
        {"bpv 1 1 lots", "N must be a number from 0 to 10000000, not \"lots\""},
        {"refuse 12zz", "TYPE must be a hex number, not \"12zz\""},
        {"refuse", "refuse takes 1 to 2 arguments, got 0"},
        {"delay 600001", "MS must be a number from 0 to 600000, not \"600001\""},
        {"stats now", "stats takes 0 arguments, got 1"},
    };
    for (const Bad& b : rows) {
        SCOPED_TRACE(b.line);
        ControlParse p = parseControl(b.line);
        EXPECT_FALSE(p.ok);
        EXPECT_EQ(p.error, b.error);
    }
}

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

TEST(ControlScript, OneBadLineRefusesTheWholeScript) {
    const std::string sleepTakes = "sleep takes a number of milliseconds from 0 to 3600000";
    const std::pair<const char*, std::string> rows[] = {
        {"call 1 1 2 5550100\nsleep\n", "line 2: " + sleepTakes},
        {"sleep 3600001", "line 1: " + sleepTakes},
        {"sleep 10 20", "line 1: " + sleepTakes},
        {"stats\n\n# fine so far\nhangup 1 1\nstats\n", "line 4: hangup takes 3 arguments, got 2"},
    };
    for (const auto& [text, error] : rows) {
        SCOPED_TRACE(text);
        ScriptParse p = parseScript(text);
        EXPECT_FALSE(p.ok);
        EXPECT_TRUE(p.steps.empty());
        EXPECT_EQ(p.error, error);
    }
}

}  // namespace
}  // namespace sim
