#include "console/ConsolePhoneObserver.h"

#include <gtest/gtest.h>

#include "RecordingView.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/VX7EventPublisher.h"

namespace vx7diag {
namespace {

using lineprobe::testing::RecordingView;

constexpr int ROW = 3;

class PhoneObserverTest : public ::testing::Test {
  protected:
    PhoneObserverTest() : observer(1, 1, 1, ROW, 1), publisher(new VX7EventPublisher(1, 1, 1)) {
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
        EXPECT_EQ(p.row, ROW);
    }
    ASSERT_FALSE(view.calls.empty());
    EXPECT_EQ(view.calls.back().what, "refresh");
    EXPECT_EQ(observer.GetCurCallId(), 0x1fu);
}

TEST_F(PhoneObserverTest, ShorterCallIdLeavesTheTailOfTheLongerOne) {
    CallState(0x1234, 2, 0);
    CallState(0x5, 9, 14);
    EXPECT_EQ(view.At(ROW, 8, 7), "0x5234 ");
    EXPECT_EQ(observer.GetCurCallId(), 0x5u);
}

TEST_F(PhoneObserverTest, ReasonZeroAndChanStateZeroBlankTheirFields) {
    CallState(1, 2, 14);
    ChanState(4);
    CallState(1, 9, 0);
    ChanState(0);
    EXPECT_EQ(view.At(ROW, 70, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(ROW, 19, 26), std::string(26, ' '));
    EXPECT_EQ(view.At(ROW, 47, 21), "Idle                 ");
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
    EXPECT_EQ(view.At(ROW, 47, 5), "?1000");
    EXPECT_EQ(view.At(ROW, 70, 3), "?52");
    EXPECT_EQ(view.At(ROW, 19, 3), "?15");
}

TEST_F(PhoneObserverTest, OtherAspectDrawsNothingButRefreshes) {
    TSCCallInfo callInfo;
    callInfo.SetEvent(publisher.Get(), new tolk::TSC::EvtCallInfo_t());
    observer.Update(nullptr, callInfo);
    EXPECT_TRUE(view.Prints().empty());
    EXPECT_EQ(view.Refreshes(), 1);
}

TEST_F(PhoneObserverTest, WithoutAWindowNothingIsDrawnNorRemembered) {
    ConsolePhoneObserver detached(1, 1, 2, ROW, 1);
    auto* event = new tolk::TSC::EvtCallState_t();
    *event->pCallId = 9;
    callStateAspect.SetEvent(publisher.Get(), event);
    detached.Update(nullptr, callStateAspect);
    EXPECT_EQ(detached.GetCurCallId(), 0u);
    EXPECT_EQ(detached.DisplayCurrentPhoneState(1, 2, 3, 4), 0);
    EXPECT_TRUE(view.calls.empty());
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

}  // namespace
}  // namespace vx7diag
