// The emulation's model of boards, lines and calls, and the language of its control lines.
#include "sim/Model.h"

#include <gtest/gtest.h>

#include <tuple>

#include "platform/farm/FarmParser.h"
#include "sim/Control.h"
#include "sim/ErrorCodes.h"

namespace sim {
namespace {

constexpr const char* kFarm = R"(
system_name = "test"
[[board]]
logical_id = 1
name = "B1"
serial = "S1"
routing = "fixed"
  [[board.trunk]]
  channels = 4
  type = 1
  signaling = "CAS"
  first_number = "1000"
)";

std::shared_ptr<const farm::Farm> testFarm() {
    std::string error;
    auto f = farm::parseFarm(kFarm, "test.toml", error);
    EXPECT_TRUE(f) << error;
    return std::make_shared<const farm::Farm>(*f);
}

struct Seen {
    std::uint32_t channel, callState, reason;
    bool operator==(const Seen&) const = default;
};

// The call states of the events, with the channel each came from.
std::vector<Seen> callStates(const std::vector<Event>& ev) {
    std::vector<Seen> out;
    for (const Event& e : ev) {
        if (e.kind == Event::Kind::CallState) {
            EXPECT_EQ(e.type, 0x1230u + e.b);
            out.push_back(Seen{static_cast<std::uint32_t>(e.source.instance % 32), e.b, e.c});
        }
    }
    return out;
}

class ModelTest : public testing::Test {
  protected:
    Model m{testFarm()};
    std::vector<Event> ev;
    Channel& ch(int c) { return *m.channel(1, 1, c); }
    // A call from channel c to `to` that must be taken: its id.
    std::uint32_t dial(int c, const char* to, const char* from = "1000") {
        std::uint32_t id = 0;
        EXPECT_EQ(m.makeCall(ch(c), to, from, id, ev), 0u);
        return id;
    }
};

TEST_F(ModelTest, CallToAFarmNumberRingsThatChannelAndAnswerConnectsBoth) {
    std::uint32_t id = dial(1, "1003");
    std::vector<Seen> want = {{1, call::Dialing, 0},
                              {1, call::Proceeding, 0},
                              {1, call::Alerting, 0},
                              {4, call::Offered, reason::IncomingCall}};
    EXPECT_EQ(callStates(ev), want);
    // The called channel learns who calls before it is offered the call.
    auto info = std::find_if(ev.begin(), ev.end(),
                             [](const Event& e) { return e.kind == Event::Kind::CallInfo; });
    ASSERT_NE(info, ev.end());
    EXPECT_EQ(info->text, "1000");
    EXPECT_EQ(info->b, kInfoIdCallerId);
    ASSERT_TRUE(ch(4).call);
    std::uint32_t farId = ch(4).call->id;
    EXPECT_NE(farId, id);

    ev.clear();
    ASSERT_EQ(m.answerCall(ch(4), 0, ev), 0u);
    want = {{4, call::Connected, 0}, {1, call::Connected, 0}};
    EXPECT_EQ(callStates(ev), want);

    ev.clear();
    ASSERT_EQ(m.dropCall(ch(1), id, reason::Normal, ev), 0u);
    want = {{1, call::Idle, reason::Normal}, {4, call::Disconnected, reason::Normal}};
    EXPECT_EQ(callStates(ev), want);

    ev.clear();
    EXPECT_EQ(m.makeCall(ch(1), "9999", "1000", id, ev), kErrChannelBusy);
    ASSERT_EQ(m.releaseCall(ch(1), 0, reason::Normal, ev), 0u);
    ASSERT_EQ(m.releaseCall(ch(4), farId, reason::Normal, ev), 0u);
    EXPECT_FALSE(ch(1).call);
    EXPECT_FALSE(ch(4).call);
}

TEST_F(ModelTest, CallToABusyChannelIsDisconnectedDestBusy) {
    std::uint32_t id = 0;
    ASSERT_EQ(m.incomingCall(ch(2), "777", id, ev), 0u);
    ev.clear();
    ASSERT_EQ(m.makeCall(ch(1), "1001", "1000", id, ev), 0u);
    EXPECT_EQ(callStates(ev).back(), (Seen{1, call::Disconnected, reason::DestBusy}));
}

TEST_F(ModelTest, FarEndHangupOfAFarmCallIdlesThePeerAndDisconnectsTheChannel) {
    dial(1, "1003");
    ASSERT_EQ(m.answerCall(ch(4), 0, ev), 0u);
    ev.clear();
    ASSERT_EQ(m.farEndHangup(ch(1), ev), 0u);
    std::vector<Seen> want = {{4, call::Idle, reason::Normal},
                              {1, call::Disconnected, reason::Normal}};
    EXPECT_EQ(callStates(ev), want);
    EXPECT_EQ(m.farEndHangup(ch(3), ev), kErrNoSuchCall);
}

// Call states with their call ids, to tell the consultation from the call it transfers.
std::vector<std::pair<std::uint32_t, std::uint32_t>> idsAndStates(const std::vector<Event>& ev) {
    std::vector<std::pair<std::uint32_t, std::uint32_t>> out;
    for (const Event& e : ev) {
        if (e.kind == Event::Kind::CallState) {
            out.emplace_back(e.a, e.b);
        }
    }
    return out;
}

TEST_F(ModelTest, SupervisedTransferHoldsTheCallConsultsAndHandsTheFarEndOver) {
    std::uint32_t id = dial(1, "1003");
    ASSERT_EQ(m.answerCall(ch(4), 0, ev), 0u);
    std::uint32_t farId = ch(4).call->id;
    EXPECT_EQ(m.completeTransfer(ch(1), id, 0, ev), kErrNoSuchCall);  // nothing under way

    ev.clear();
    std::uint32_t consult = 0;
    ASSERT_EQ(m.initTransfer(ch(1), 0, consult, ev), 0u);
    EXPECT_NE(consult, 0u);
    EXPECT_NE(consult, id);
    EXPECT_NE(consult, farId);
    std::vector<std::pair<std::uint32_t, std::uint32_t>> want = {{id, call::HoldPendXfer},
                                                                 {consult, call::Dialing},
                                                                 {consult, call::Proceeding},
                                                                 {consult, call::Alerting},
                                                                 {consult, call::Connected}};
    EXPECT_EQ(idsAndStates(ev), want);
    std::uint32_t again = 0;
    EXPECT_EQ(m.initTransfer(ch(1), id, again, ev), kErrBadState);
    EXPECT_EQ(m.completeTransfer(ch(1), id, consult + 1, ev), kErrNoSuchCall);

    ev.clear();
    ASSERT_EQ(m.completeTransfer(ch(1), id, consult, ev), 0u);
    std::vector<Seen> gone = {{1, call::Null, reason::Transfer}, {1, call::Null, reason::Transfer}};
    EXPECT_EQ(callStates(ev), gone);
    EXPECT_EQ(idsAndStates(ev).front().first, consult);
    EXPECT_FALSE(ch(1).call);
    // The far end now talks to the transfer target and is no longer tied to this channel.
    ASSERT_TRUE(ch(4).call);
    EXPECT_EQ(ch(4).call->state, call::Connected);
    EXPECT_EQ(ch(4).call->peer, nullptr);
}

TEST_F(ModelTest, CancelledTransferEndsTheConsultationAndTakesTheCallBack) {
    std::uint32_t id = dial(2, "9999", "1001"), consult = 0;
    EXPECT_EQ(m.cancelTransfer(ch(2), id, ev), kErrBadState);
    ASSERT_EQ(m.initTransfer(ch(2), id, consult, ev), 0u);
    ev.clear();
    // The consultation's id names the transfer as well as the held call's.
    ASSERT_EQ(m.cancelTransfer(ch(2), consult, ev), 0u);
    std::vector<std::pair<std::uint32_t, std::uint32_t>> want = {{consult, call::Null},
                                                                 {id, call::Connected}};
    EXPECT_EQ(idsAndStates(ev), want);
    EXPECT_EQ(ev.front().c, reason::Canceled);

    // Dropping a call whose transfer is under way ends the consultation first.
    ASSERT_EQ(m.initTransfer(ch(2), 0, consult, ev), 0u);
    ev.clear();
    ASSERT_EQ(m.dropCall(ch(2), 0, reason::Normal, ev), 0u);
    want = {{consult, call::Null}, {id, call::Idle}};
    EXPECT_EQ(idsAndStates(ev), want);
    EXPECT_EQ(m.cancelTransfer(ch(2), consult, ev), kErrNoSuchCall);
}

TEST_F(ModelTest, AnswerAndRejectNeedARingingCall) {
    EXPECT_EQ(m.answerCall(ch(1), 0, ev), kErrNoSuchCall);
    std::uint32_t id = dial(1, "9999");
    EXPECT_EQ(m.answerCall(ch(1), id, ev), kErrBadState);
    EXPECT_EQ(m.rejectCall(ch(1), id, 2, ev), kErrBadState);
    EXPECT_EQ(m.answerCall(ch(1), id + 1000, ev), kErrNoSuchCall);
}

TEST_F(ModelTest, LineOutOfServiceTakesItsChannelsAndCallsDown) {
    std::uint32_t id = dial(1, "9999");
    ev.clear();
    Line& l = *m.line(1, 1);
    ASSERT_EQ(m.setLineState(l, kOutOfService, 4, ev), 0u);
    EXPECT_EQ(ev.at(0).kind, Event::Kind::LineState);
    EXPECT_EQ(ev[0].a, kOutOfService);
    EXPECT_EQ(ev[0].b, 4u);
    EXPECT_EQ(callStates(ev), (std::vector<Seen>{{1, call::Disconnected, reason::NetworkAlarm}}));
    int chanEvents = 0;
    for (const Event& e : ev) {
        if (e.kind == Event::Kind::ChanState) {
            EXPECT_EQ(e.a, chan::OutOfService);
            EXPECT_EQ(e.type, 0x1263u);
            ++chanEvents;
        }
    }
    EXPECT_EQ(chanEvents, 4);
    EXPECT_EQ(m.makeCall(ch(2), "9999", "1000", id, ev), kErrOutOfService);

    ev.clear();
    ASSERT_EQ(m.setLineState(l, kInService, 0, ev), 0u);
    EXPECT_EQ(ch(2).chanState, chan::Active);
}

TEST_F(ModelTest, DiagnosticModeRaisesAndClearsLoopbackOnce) {
    Line& l = *m.line(1, 1);
    ASSERT_EQ(m.setDiagMode(l, 1, ev), 0u);
    ASSERT_EQ(m.setDiagMode(l, 2, ev), 0u);
    ASSERT_EQ(ev.size(), 1u);
    EXPECT_EQ(ev[0].a, kAlarmLoopback);
    EXPECT_EQ(ev[0].b, 1u);
    EXPECT_EQ(m.alarmState(l, kAlarmLoopback), 1);
    ASSERT_EQ(m.setDiagMode(l, 0, ev), 0u);
    ASSERT_EQ(ev.size(), 2u);
    EXPECT_EQ(ev[1].b, 0u);
    EXPECT_EQ(m.setDiagMode(l, 3, ev), kErrBadParameter);
}

TEST_F(ModelTest, TransmittedAlarmStopsOnlyWhenSent) {
    Line& l = *m.line(1, 1);
    EXPECT_EQ(m.stopAlarm(l, 0x160B, ev), kErrBadState);
    ASSERT_EQ(m.sendAlarm(l, 0x160B, ev), 0u);
    EXPECT_EQ(m.alarmState(l, 0x160B), 1);
    ASSERT_EQ(m.stopAlarm(l, 0x160B, ev), 0u);
    EXPECT_EQ(m.alarmState(l, 0x160B), 0);
    EXPECT_EQ(m.sendAlarm(l, 0x1601, ev), kErrBadParameter);
}

TEST_F(ModelTest, SubscriptionToAGroupTakesEveryTypeOfIt) {
    Address host{7, 0xFF, 0, 0, 0};
    Subscription all{kGroupCallState, kGroupCallState, host, 1001, host};
    Subscription one{kGroupCallState + call::Connected, kGroupCallState, host, 1002, host};
    m.subscribe(ch(1).tsc, all);
    m.subscribe(ch(1).tsc, one);
    dial(1, "9999");
    std::vector<const Subscription*> to;
    int toAll = 0, toOne = 0;
    for (const Event& e : ev) {
        m.subscribersOf(e, to);
        for (const Subscription* s : to) {
            (s->trans == 1001 ? toAll : toOne)++;
        }
    }
    EXPECT_EQ(toAll, 4);
    EXPECT_EQ(toOne, 1);
}

TEST_F(ModelTest, CancelNeedsTheSameOwnerAndTransaction) {
    Address host{7, 0xFF, 0, 0, 0};
    Address other{8, 0xFF, 0, 0, 0};
    Address lcon = m.line(1, 1)->lcon;
    m.subscribe(lcon, Subscription{kGroupAlarms, kGroupAlarms, host, 1001, host});
    m.cancel(lcon, other, 1001, kGroupAlarms);
    m.cancel(lcon, host, 1002, kGroupAlarms);
    EXPECT_EQ(m.subscriptionCount(), 1u);
    m.cancel(lcon, host, 1001, kGroupAlarms);
    EXPECT_EQ(m.subscriptionCount(), 0u);

    m.subscribe(lcon, Subscription{kGroupAlarms, kGroupAlarms, host, 1001, host});
    m.subscribe(lcon, Subscription{kGroupLineState, kGroupLineState, other, 5, other});
    m.forget(host);
    EXPECT_EQ(m.subscriptionCount(), 1u);
}

// ---- control lines ----

auto fields(const ControlCommand& c) {
    return std::tie(c.kind, c.board, c.trunk, c.channel, c.from, c.alarmId, c.on, c.count, c.reason,
                    c.msgType, c.code, c.delayMs);
}

// A line the language takes, and the whole command it must give: a field left at its default
// in the row must stay at its default.
TEST(Control, EachGoodLineGivesItsCommand) {
    using K = ControlKind;
    auto alarm = [](std::uint32_t id, bool on) {
        return ControlCommand{.kind = K::Alarm, .board = 1, .trunk = 1, .alarmId = id, .on = on};
    };
    const std::pair<const char*, ControlCommand> rows[] = {
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
    for (const auto& [line, cmd] : rows) {
        SCOPED_TRACE(line);
        ControlParse p = parseControl(line);
        ASSERT_TRUE(p.ok) << p.error;
        EXPECT_TRUE(fields(p.cmd) == fields(cmd));
    }
}

// A line the language refuses, with the reason it gives; blank and comment lines are no
// command and no error either.
TEST(Control, EachBadLineIsRefusedWithItsReason) {
    const std::pair<const char*, const char*> rows[] = {
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
    for (const auto& [line, error] : rows) {
        SCOPED_TRACE(line);
        ControlParse p = parseControl(line);
        EXPECT_FALSE(p.ok);
        EXPECT_EQ(p.error, error);
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
