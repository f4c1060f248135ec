#include "console/ConsoleTrunkObserver.h"

#include <gtest/gtest.h>

#include "RecordingView.h"
#include "model/AllAlarms.h"
#include "model/TSCCallState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace vx7diag {
namespace {

using lineprobe::testing::RecordingView;

constexpr int ROW = 2;

class TrunkObserverFixture {
  protected:
    TrunkObserverFixture() : observer(1, 1, ROW, 1), publisher(new VX7EventPublisher(1, 1, 1)) {
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
    EXPECT_EQ(view.At(ROW, c.col, 1), c.whenActive);
    Alarm(c.code, 0);
    EXPECT_EQ(view.At(ROW, c.col, 1), c.whenClear);
    // Any state but 1 counts as clear.
    Alarm(c.code, 1);
    Alarm(c.code, 2);
    EXPECT_EQ(view.At(ROW, c.col, 1), c.whenClear);
    // No other column changes.
    std::string row = view.Row(ROW);
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
    EXPECT_EQ(view.At(ROW, 85, 2), "3 ");
    EXPECT_EQ(view.At(ROW, 92, 2), "1 ");
    EXPECT_EQ(observer.GetBipolarViolations(), 3u);
    EXPECT_EQ(observer.GetFrameErrors(), 1u);
    for (int i = 0; i < 8; ++i) {
        Alarm(5654, 1);
    }
    EXPECT_EQ(view.At(ROW, 85, 2), "11");
}

TEST_F(TrunkObserverTest, LoopbackClearLeavesTheCountersAlone) {
    Alarm(5654, 1);
    Alarm(5637, 1);
    Alarm(5637, 0);
    EXPECT_EQ(view.At(ROW, 48, 1), " ");
    EXPECT_EQ(view.At(ROW, 85, 1), "1");
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
    EXPECT_EQ(view.At(ROW, 8, 16), "InService       ");
    EXPECT_EQ(view.At(ROW, 26, 14), "Maintenance   ");
    LineState(5648, 5);
    EXPECT_EQ(view.At(ROW, 8, 16), "Out of Service  ");
    EXPECT_EQ(view.At(ROW, 26, 14), "Alarm         ");
    LineState(1234, 0);
    EXPECT_EQ(view.At(ROW, 8, 16), "Out of Service  ");
    EXPECT_EQ(view.At(ROW, 26, 14), "Null          ");
}

TEST_F(TrunkObserverTest, ReasonPastTheTableStaysInItsField) {
    LineState(5647, 6);
    EXPECT_EQ(view.At(ROW, 26, 14), "?6            ");
    EXPECT_EQ(view.At(ROW, 40, 2), "  ");
}

TEST_F(TrunkObserverTest, PhoneAspectDrawsNothing) {
    TSCCallState callState;
    callState.SetEvent(publisher.Get(), new tolk::TSC::EvtCallState_t());
    observer.Update(nullptr, callState);
    EXPECT_TRUE(view.Prints().empty());
    EXPECT_EQ(view.Refreshes(), 1);
}

TEST_F(TrunkObserverTest, WithoutAWindowNothingIsCounted) {
    ConsoleTrunkObserver detached(1, 2, ROW, 1);
    auto* event = new tolk::LCON::Evt_0x1600_t();
    *event->pType = 5654;
    alarms.SetEvent(publisher.Get(), event);
    detached.Update(nullptr, alarms);
    EXPECT_EQ(detached.GetBipolarViolations(), 0u);
    EXPECT_EQ(detached.DisplayCurrentTrunkStatus(nullptr), 0);
    EXPECT_TRUE(view.calls.empty());
}

}  // namespace
}  // namespace vx7diag
