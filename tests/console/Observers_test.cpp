// The two display observers: the phone row and the trunk row, drawn from the board's events,
// and the texts they draw.
#include <gtest/gtest.h>

#include <string>

#include "RecordingView.h"
#include "console/ConsolePhoneObserver.h"
#include "console/ConsoleTrunkObserver.h"
#include "console/ObserverTexts.h"
#include "model/AllAlarms.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace vx7diag {
namespace {

using lineprobe::testing::RecordingView;

struct TextCase {
    const char* (*text)(unsigned int);
    unsigned int value;
    std::string golden;
};

// Each text is padded to wipe a longer one; the last value of each table and the first one
// past it, whose number shows in the same width instead of a read past the table.
TEST(ObserverTexts, PaddedToTheirFieldUpToTheEndOfTheirTableAndPastIt) {
    const TextCase cases[] = {
        {ConsoleCallStateText, 0, "Null                 "},
        {ConsoleCallStateText, 21, "DialTone             "},
        {ConsoleCallStateText, 22, "?22                  "},
        {ConsoleCallStateText, 1000, "?1000                "},
        {ConsoleChanStateText, 0, "                          "},
        {ConsoleChanStateText, 1, "Active\t\t           "},
        {ConsoleChanStateText, 14, "OutOfServiceRemote        "},
        {ConsoleChanStateText, 15, "?15                       "},
        {ConsoleReasonText, 0, "                          "},
        {ConsoleReasonText, 51, "NoRingback                "},
        {ConsoleReasonText, 52, "?52                       "},
        {ConsoleReasonText, 4294967295u, "?4294967295               "},
        {ConsoleLineStateReasonText, 5, "Alarm         "},
        {ConsoleLineStateReasonText, 6, "?6            "},
    };
    for (const TextCase& c : cases) {
        EXPECT_EQ(std::string(c.text(c.value)), c.golden) << c.value;
    }
    EXPECT_EQ(g_LineStateStr[0], "InService       ");
    EXPECT_EQ(g_LineStateStr[1], "Out of Service  ");
}

// What both observers do alike: an aspect they do not draw only refreshes, and without a
// window they neither draw nor remember anything.
TEST(Observers, DrawOnlyTheirOwnAspectsAndOnlyWithAWindow) {
    isa::RefPtr<VX7EventPublisher> publisher(new VX7EventPublisher(1, 1, 1));
    RecordingView view;
    ConsolePhoneObserver phone(1, 1, 2, 3, 1);
    ConsoleTrunkObserver trunk(1, 2, 2, 1);

    TSCCallState callState;
    auto* call = new tolk::TSC::EvtCallState_t();
    *call->pCallId = 9;
    callState.SetEvent(publisher.Get(), call);
    phone.Update(nullptr, callState);
    EXPECT_EQ(phone.GetCurCallId(), 0u);
    EXPECT_EQ(phone.DisplayCurrentPhoneState(1, 2, 3, 4), 0);
    AllAlarms alarms;
    auto* alarm = new tolk::LCON::Evt_0x1600_t();
    *alarm->pType = 5654;
    alarms.SetEvent(publisher.Get(), alarm);
    trunk.Update(nullptr, alarms);
    EXPECT_EQ(trunk.GetBipolarViolations(), 0u);
    EXPECT_EQ(trunk.DisplayCurrentTrunkStatus(nullptr), 0);
    EXPECT_TRUE(view.calls.empty());

    phone.SetView(&view);
    trunk.SetView(&view);
    TSCCallInfo callInfo;
    callInfo.SetEvent(publisher.Get(), new tolk::TSC::EvtCallInfo_t());
    phone.Update(nullptr, callInfo);
    trunk.Update(nullptr, callState);
    EXPECT_TRUE(view.Prints().empty());
    EXPECT_EQ(view.Refreshes(), 2);
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

    // The prints so far as "column:text", in order, all on the observer's row.
    std::vector<std::string> Prints() {
        std::vector<std::string> out;
        for (const auto& p : view.Prints()) {
            EXPECT_EQ(p.row, PHONE_ROW);
            out.push_back(std::to_string(p.col) + ":" + p.text);
        }
        return out;
    }

    RecordingView view;
    ConsolePhoneObserver observer;
    isa::RefPtr<VX7EventPublisher> publisher;
    TSCCallState callStateAspect;
    TSCChanState chanStateAspect;
};

TEST_F(PhoneObserverTest, CallStateDrawsIdStateAndReasonThenRefreshes) {
    CallState(0x1f, 17, 11);
    EXPECT_EQ(Prints(), (std::vector<std::string>{"8:0x1f", "47:Alerting             ",
                                                  "70:IncomingCall              "}));
    ASSERT_FALSE(view.calls.empty());
    EXPECT_EQ(view.calls.back().what, "refresh");
    EXPECT_EQ(observer.GetCurCallId(), 0x1fu);

    // A shorter call id leaves the tail of the longer one.
    CallState(0x1234, 2, 0);
    CallState(0x5, 9, 14);
    EXPECT_EQ(view.At(PHONE_ROW, 8, 7), "0x5234 ");
    EXPECT_EQ(observer.GetCurCallId(), 0x5u);
}

TEST_F(PhoneObserverTest, ChanStateDrawsOnlyItsFieldAndZeroesBlankTheirFields) {
    ChanState(4);
    EXPECT_EQ(Prints(), (std::vector<std::string>{"19:OutOfService              "}));
    EXPECT_EQ(observer.GetCurCallId(), 0u);

    CallState(1, 2, 14);
    CallState(1, 9, 0);
    ChanState(0);
    EXPECT_EQ(view.At(PHONE_ROW, 70, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(PHONE_ROW, 19, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(PHONE_ROW, 47, 21), "Idle                 ");
}

TEST_F(PhoneObserverTest, CurrentStateDrawsInItsOrderWithoutRefreshOrCallId) {
    EXPECT_EQ(observer.DisplayCurrentPhoneState(0x2a, 2, 1, 14), 1);
    EXPECT_EQ(Prints(), (std::vector<std::string>{"19:Active\t\t           ", "8:0x2a",
                                                  "47:Connected            ",
                                                  "70:Normal                    "}));
    EXPECT_EQ(view.Refreshes(), 0);
    EXPECT_EQ(observer.GetCurCallId(), 0u);
}

constexpr int TRUNK_ROW = 2;

// A trunk observer that draws on a view of its own.
struct TrunkRow {
    TrunkRow() { observer.SetView(&view); }

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
    ConsoleTrunkObserver observer{1, 1, TRUNK_ROW, 1};
    isa::RefPtr<VX7EventPublisher> publisher{new VX7EventPublisher(1, 1, 1)};
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

TEST(TrunkObserver, EachAlarmMarksItsColumnWithItsSense) {
    // "Sig" and "DChan" tell that the signal or the D channel is good: their sense is reversed.
    const AlarmCase cases[] = {
        {5633, 54, "X", " "},  // Red
        {5634, 60, "X", " "},  // Yellow
        {5635, 72, "X", " "},  // AIS
        {5636, 42, " ", "X"},  // loss of signal
        {5637, 48, "X", " "},  // loopback
        {5638, 66, "X", " "},  // RAI CRC
        {5642, 78, " ", "X"},  // D channel
    };
    for (const AlarmCase& c : cases) {
        SCOPED_TRACE(c.code);
        TrunkRow t;
        t.Alarm(c.code, 1);
        EXPECT_EQ(t.view.At(TRUNK_ROW, c.col, 1), c.whenActive);
        t.Alarm(c.code, 0);
        EXPECT_EQ(t.view.At(TRUNK_ROW, c.col, 1), c.whenClear);
        // Any state but 1 counts as clear.
        t.Alarm(c.code, 1);
        t.Alarm(c.code, 2);
        EXPECT_EQ(t.view.At(TRUNK_ROW, c.col, 1), c.whenClear);
        // No other column changes.
        std::string row = t.view.Row(TRUNK_ROW);
        row[static_cast<std::size_t>(c.col)] = ' ';
        EXPECT_EQ(row, std::string(100, ' '));
        EXPECT_EQ(t.view.Refreshes(), 4);
    }
}

class TrunkObserverTest : public ::testing::Test, protected TrunkRow {};

// The counters go up on every event whatever its state, and a loopback clear leaves them
// alone.
TEST_F(TrunkObserverTest, CountersGoUpOnEveryEventWhateverItsState) {
    Alarm(5654, 1);
    Alarm(5654, 0);
    Alarm(5654, 7);
    Alarm(5655, 0);
    Alarm(5637, 1);
    Alarm(5637, 0);
    EXPECT_EQ(view.At(TRUNK_ROW, 85, 2), "3 ");
    EXPECT_EQ(view.At(TRUNK_ROW, 92, 2), "1 ");
    EXPECT_EQ(observer.GetBipolarViolations(), 3u);
    EXPECT_EQ(observer.GetFrameErrors(), 1u);
    for (int i = 0; i < 8; ++i) {
        Alarm(5654, 1);
    }
    EXPECT_EQ(view.At(TRUNK_ROW, 85, 2), "11");
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
    // A reason past the table stays in its field.
    LineState(5647, 6);
    EXPECT_EQ(view.At(TRUNK_ROW, 26, 14), "?6            ");
    EXPECT_EQ(view.At(TRUNK_ROW, 40, 2), "  ");
}

}  // namespace
}  // namespace vx7diag
