#include "sim/Model.h"

#include <gtest/gtest.h>

#include "platform/farm/FarmParser.h"
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
    std::uint32_t channel;
    std::uint32_t callState;
    std::uint32_t reason;
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

bool operator==(const Seen& a, const Seen& b) {
    return a.channel == b.channel && a.callState == b.callState && a.reason == b.reason;
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

TEST_F(ModelTest, CallOutsideTheFarmDialsProceedsAlertsConnects) {
    std::uint32_t id = dial(1, "9999");
    EXPECT_NE(id, 0u);
    std::vector<Seen> want = {{1, call::Dialing, 0},
                              {1, call::Proceeding, 0},
                              {1, call::Alerting, 0},
                              {1, call::Connected, 0}};
    EXPECT_EQ(callStates(ev), want);
    for (const Event& e : ev) {
        EXPECT_EQ(e.a, id);
    }
}

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
    ASSERT_FALSE(ev.empty());
    EXPECT_EQ(ev[0].kind, Event::Kind::LineState);
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
    EXPECT_EQ(m.setLineState(l, kInService, 0, ev), kErrAlreadyInService);
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

}  // namespace
}  // namespace sim
