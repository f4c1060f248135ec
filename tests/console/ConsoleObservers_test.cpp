// The two display observers: the phone row and the trunk row, drawn from the board's events.
#include <gtest/gtest.h>

#include "RecordingView.h"
#include "console/ConsolePhoneObserver.h"
#include "console/ConsoleTrunkObserver.h"
#include "model/AllAlarms.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace vx7diag {
namespace {

using lineprobe::testing::RecordingView;
// What both observers do alike: an aspect they do not draw only refreshes, and without a
// window they neither draw nor remember anything.
struct PhoneSide {
    using ObserverType = ConsolePhoneObserver;
    static ObserverType Make() { return ConsolePhoneObserver(1, 1, 2, 3, 1); }
    // An event of the trunk's kind, with the sum the observer would remember from it.
    static void Remembered(ObserverType& o, VX7EventPublisher* p) {
        TSCCallState aspect;
        auto* event = new tolk::TSC::EvtCallState_t();
        *event->pCallId = 9;
        aspect.SetEvent(p, event);
        o.Update(nullptr, aspect);
        EXPECT_EQ(o.GetCurCallId(), 0u);
        EXPECT_EQ(o.DisplayCurrentPhoneState(1, 2, 3, 4), 0);
    }
    static void Foreign(ObserverType& o, VX7EventPublisher* p) {
        TSCCallInfo aspect;
        aspect.SetEvent(p, new tolk::TSC::EvtCallInfo_t());
        o.Update(nullptr, aspect);
    }
};

struct TrunkSide {
    using ObserverType = ConsoleTrunkObserver;
    static ObserverType Make() { return ConsoleTrunkObserver(1, 2, 2, 1); }
    static void Remembered(ObserverType& o, VX7EventPublisher* p) {
        AllAlarms aspect;
        auto* event = new tolk::LCON::Evt_0x1600_t();
        *event->pType = 5654;
        aspect.SetEvent(p, event);
        o.Update(nullptr, aspect);
        EXPECT_EQ(o.GetBipolarViolations(), 0u);
        EXPECT_EQ(o.DisplayCurrentTrunkStatus(nullptr), 0);
    }
    static void Foreign(ObserverType& o, VX7EventPublisher* p) {
        TSCCallState aspect;
        aspect.SetEvent(p, new tolk::TSC::EvtCallState_t());
        o.Update(nullptr, aspect);
    }
};

template <class Side>
class BothObservers : public ::testing::Test {
  protected:
    RecordingView view;
    isa::RefPtr<VX7EventPublisher> publisher{new VX7EventPublisher(1, 1, 1)};
};

using Sides = ::testing::Types<PhoneSide, TrunkSide>;
TYPED_TEST_SUITE(BothObservers, Sides);

TYPED_TEST(BothObservers, AnAspectTheyDoNotDrawOnlyRefreshes) {
    auto observer = TypeParam::Make();
    observer.SetView(&this->view);
    TypeParam::Foreign(observer, this->publisher.Get());
    EXPECT_TRUE(this->view.Prints().empty());
    EXPECT_EQ(this->view.Refreshes(), 1);
}

TYPED_TEST(BothObservers, WithoutAWindowNothingIsDrawnNorRemembered) {
    auto observer = TypeParam::Make();
    TypeParam::Remembered(observer, this->publisher.Get());
    EXPECT_TRUE(this->view.calls.empty());
}

constexpr int PHONE_ROW = 3;

class PhoneObserverTest : public ::testing::Test {
  protected:
    PhoneObserverTest()
        : observer(1, 1, 1, PHONE_ROW, 1), publisher(new VX7EventPublisher(1, 1, 1)) {
        observer.SetView(&view);
    }

    void CallState(unsigned int callId, unsigned int state, unsigned int reason) {
        auto* event = new tolk::TSC::EvtCallState_t();
        *event->pCallId = callId;
        *event->pCallState = state;
        *event->pReason = reason;
        callStateAspect.SetEvent(publisher.Get(), event);
        observer.Update(nullptr, callStateAspect);
    }

    void ChanState(unsigned int state) {
        auto* event = new tolk::TSC::EvtChanState_t();
        *event->pChanState = state;
        chanStateAspect.SetEvent(publisher.Get(), event);
        observer.Update(nullptr, chanStateAspect);
    }

    RecordingView view;
    ConsolePhoneObserver observer;
    isa::RefPtr<VX7EventPublisher> publisher;
    TSCCallState callStateAspect;
    TSCChanState chanStateAspect;
};

TEST_F(PhoneObserverTest, CallStateDrawsIdStateAndReasonThenRefreshes) {
    CallState(0x1f, 17, 11);
    const auto prints = view.Prints();
    ASSERT_EQ(prints.size(), 3u);
    EXPECT_EQ(prints[0].text, "0x1f");
    EXPECT_EQ(prints[0].col, 8);
    EXPECT_EQ(prints[1].text, "Alerting             ");
    EXPECT_EQ(prints[1].col, 47);
    EXPECT_EQ(prints[2].text, "IncomingCall              ");
    EXPECT_EQ(prints[2].col, 70);
    for (const auto& p : prints) {
        EXPECT_EQ(p.row, PHONE_ROW);
    }
    ASSERT_FALSE(view.calls.empty());
    EXPECT_EQ(view.calls.back().what, "refresh");
    EXPECT_EQ(observer.GetCurCallId(), 0x1fu);
}

TEST_F(PhoneObserverTest, ShorterCallIdLeavesTheTailOfTheLongerOne) {
    CallState(0x1234, 2, 0);
    CallState(0x5, 9, 14);
    EXPECT_EQ(view.At(PHONE_ROW, 8, 7), "0x5234 ");
    EXPECT_EQ(observer.GetCurCallId(), 0x5u);
}

TEST_F(PhoneObserverTest, ReasonZeroAndChanStateZeroBlankTheirFields) {
    CallState(1, 2, 14);
    ChanState(4);
    CallState(1, 9, 0);
    ChanState(0);
    EXPECT_EQ(view.At(PHONE_ROW, 70, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(PHONE_ROW, 19, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(PHONE_ROW, 47, 21), "Idle                 ");
}

TEST_F(PhoneObserverTest, ChanStateDrawsOnlyItsField) {
    ChanState(4);
    const auto prints = view.Prints();
    ASSERT_EQ(prints.size(), 1u);
    EXPECT_EQ(prints[0].col, 19);
    EXPECT_EQ(prints[0].text, "OutOfService              ");
    EXPECT_EQ(observer.GetCurCallId(), 0u);
}

TEST_F(PhoneObserverTest, ValuesPastTheTablesDrawWithoutReadingPastThem) {
    CallState(7, 1000, 52);
    ChanState(15);
    EXPECT_EQ(view.At(PHONE_ROW, 47, 5), "?1000");
    EXPECT_EQ(view.At(PHONE_ROW, 70, 3), "?52");
    EXPECT_EQ(view.At(PHONE_ROW, 19, 3), "?15");
}

TEST_F(PhoneObserverTest, CurrentStateDrawsInItsOrderWithoutRefreshOrCallId) {
    EXPECT_EQ(observer.DisplayCurrentPhoneState(0x2a, 2, 1, 14), 1);
    const auto prints = view.Prints();
    ASSERT_EQ(prints.size(), 4u);
    EXPECT_EQ(prints[0].col, 19);
    EXPECT_EQ(prints[0].text, "Active\t\t           ");
    EXPECT_EQ(prints[1].col, 8);
    EXPECT_EQ(prints[1].text, "0x2a");
    EXPECT_EQ(prints[2].col, 47);
    EXPECT_EQ(prints[2].text, "Connected            ");
    EXPECT_EQ(prints[3].col, 70);
    EXPECT_EQ(prints[3].text, "Normal                    ");
    EXPECT_EQ(view.Refreshes(), 0);
    EXPECT_EQ(observer.GetCurCallId(), 0u);
}

constexpr int TRUNK_ROW = 2;

class TrunkObserverFixture {
  protected:
    TrunkObserverFixture()
        : observer(1, 1, TRUNK_ROW, 1), publisher(new VX7EventPublisher(1, 1, 1)) {
        observer.SetView(&view);
    }

    void Alarm(unsigned int code, unsigned char state) {
        auto* event = new tolk::LCON::Evt_0x1600_t();
        *event->pType = code;
        *event->pState = state;
        alarms.SetEvent(publisher.Get(), event);
        observer.Update(nullptr, alarms);
    }

    void LineState(unsigned int code, unsigned int reason) {
        auto* event = new tolk::LCON::Evt_0x1611_t();
        *event->pType = code;
        *event->pReason = reason;
        trunkState.SetEvent(publisher.Get(), event);
        observer.Update(nullptr, trunkState);
    }

    RecordingView view;
    ConsoleTrunkObserver observer;
    isa::RefPtr<VX7EventPublisher> publisher;
    AllAlarms alarms;
    TrunkState trunkState;
};

struct AlarmCase {
    unsigned int code;
    int col;
    // What the column shows for state 1 and for state 0.
    const char* whenActive;
    const char* whenClear;
};

class AlarmColumnTest : public TrunkObserverFixture, public ::testing::TestWithParam<AlarmCase> {};

TEST_P(AlarmColumnTest, EachAlarmMarksItsColumnWithItsSense) {
    const AlarmCase& c = GetParam();
    Alarm(c.code, 1);
    EXPECT_EQ(view.At(TRUNK_ROW, c.col, 1), c.whenActive);
    Alarm(c.code, 0);
    EXPECT_EQ(view.At(TRUNK_ROW, c.col, 1), c.whenClear);
    // Any state but 1 counts as clear.
    Alarm(c.code, 1);
    Alarm(c.code, 2);
    EXPECT_EQ(view.At(TRUNK_ROW, c.col, 1), c.whenClear);
    // No other column changes.
    std::string row = view.Row(TRUNK_ROW);
    row[static_cast<std::size_t>(c.col)] = ' ';
    EXPECT_EQ(row, std::string(100, ' '));
    EXPECT_EQ(view.Refreshes(), 4);
}

// "Sig" and "DChan" tell that the signal or the D channel is good: their sense is reversed.
INSTANTIATE_TEST_SUITE_P(Alarms, AlarmColumnTest,
                         ::testing::Values(AlarmCase{5633, 54, "X", " "},  // Red
                                           AlarmCase{5634, 60, "X", " "},  // Yellow
                                           AlarmCase{5635, 72, "X", " "},  // AIS
                                           AlarmCase{5636, 42, " ", "X"},  // loss of signal
                                           AlarmCase{5637, 48, "X", " "},  // loopback
                                           AlarmCase{5638, 66, "X", " "},  // RAI CRC
                                           AlarmCase{5642, 78, " ", "X"}   // D channel
                                           ));

class TrunkObserverTest : public TrunkObserverFixture, public ::testing::Test {};

TEST_F(TrunkObserverTest, CountersGoUpOnEveryEventWhateverItsState) {
    Alarm(5654, 1);
    Alarm(5654, 0);
    Alarm(5654, 7);
    Alarm(5655, 0);
    EXPECT_EQ(view.At(TRUNK_ROW, 85, 2), "3 ");
    EXPECT_EQ(view.At(TRUNK_ROW, 92, 2), "1 ");
    EXPECT_EQ(observer.GetBipolarViolations(), 3u);
    EXPECT_EQ(observer.GetFrameErrors(), 1u);
    for (int i = 0; i < 8; ++i) {
        Alarm(5654, 1);
    }
    EXPECT_EQ(view.At(TRUNK_ROW, 85, 2), "11");
}

TEST_F(TrunkObserverTest, LoopbackClearLeavesTheCountersAlone) {
    Alarm(5654, 1);
    Alarm(5637, 1);
    Alarm(5637, 0);
    EXPECT_EQ(view.At(TRUNK_ROW, 48, 1), " ");
    EXPECT_EQ(view.At(TRUNK_ROW, 85, 1), "1");
    EXPECT_EQ(observer.GetBipolarViolations(), 1u);
}

TEST_F(TrunkObserverTest, CodesBetweenAndOutsideTheTableChangeNothingButRefresh) {
    for (unsigned int code : {5632u, 5639u, 5643u, 5653u, 5656u, 0u}) {
        Alarm(code, 1);
    }
    EXPECT_TRUE(view.Prints().empty());
    EXPECT_EQ(view.Refreshes(), 6);
}

TEST_F(TrunkObserverTest, LineStateShowsInServiceOnlyFor5647) {
    LineState(5647, 3);
    EXPECT_EQ(view.At(TRUNK_ROW, 8, 16), "InService       ");
    EXPECT_EQ(view.At(TRUNK_ROW, 26, 14), "Maintenance   ");
    LineState(5648, 5);
    EXPECT_EQ(view.At(TRUNK_ROW, 8, 16), "Out of Service  ");
    EXPECT_EQ(view.At(TRUNK_ROW, 26, 14), "Alarm         ");
    LineState(1234, 0);
    EXPECT_EQ(view.At(TRUNK_ROW, 8, 16), "Out of Service  ");
    EXPECT_EQ(view.At(TRUNK_ROW, 26, 14), "Null          ");
}

TEST_F(TrunkObserverTest, ReasonPastTheTableStaysInItsField) {
    LineState(5647, 6);
    EXPECT_EQ(view.At(TRUNK_ROW, 26, 14), "?6            ");
    EXPECT_EQ(view.At(TRUNK_ROW, 40, 2), "  ");
}

}  // namespace
}  // namespace vx7diag
