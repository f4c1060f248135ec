#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "LogCapture.h"
#include "SimFixture.h"
#include "framework/Addressable.h"
#include "model/AllAlarms.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace {

using namespace vx7diag;

std::vector<unsigned int> Types(const VX7EventPublication& p) {
    tolk::staticList<unsigned int> list = p.EventTypeList();
    std::vector<unsigned int> out;
    for (unsigned int i = 0; i < list.length(); ++i) {
        out.push_back(*list.element(i));
    }
    return out;
}

std::vector<unsigned int> Range(unsigned int first, unsigned int last) {
    std::vector<unsigned int> out;
    for (unsigned int t = first; t <= last; ++t) {
        out.push_back(t);
    }
    return out;
}

TEST(EventPublications, ComponentsGroupsAndEventTypes) {
    TSCCallInfo info;
    TSCCallState callState;
    TSCChanState chanState;
    TrunkState trunkState;
    AllAlarms alarms;

    EXPECT_EQ(info.Component(), 3);
    EXPECT_EQ(callState.Component(), 3);
    EXPECT_EQ(chanState.Component(), 3);
    EXPECT_EQ(trunkState.Component(), 2);
    EXPECT_EQ(alarms.Component(), 2);

    EXPECT_EQ(info.Group(), 0x1200u);
    EXPECT_EQ(callState.Group(), 0x1230u);
    EXPECT_EQ(chanState.Group(), 0x1260u);
    EXPECT_EQ(trunkState.Group(), 0x1611u);
    EXPECT_EQ(alarms.Group(), 0x1600u);

    EXPECT_EQ(Types(info), Range(0x1200, 0x121A));
    EXPECT_EQ(Types(info).size(), 27u);
    EXPECT_EQ(Types(callState), Range(0x1230, 0x1241));
    EXPECT_EQ(Types(callState).size(), 18u);
    std::vector<unsigned int> chan = Range(0x1260, 0x1269);
    chan.push_back(0x126C);
    chan.push_back(0x126D);
    EXPECT_EQ(Types(chanState), chan);
    EXPECT_TRUE(Types(trunkState).empty());
    EXPECT_TRUE(Types(alarms).empty());

    for (VX7EventPublication* p :
         std::vector<VX7EventPublication*>{&info, &callState, &chanState, &trunkState, &alarms}) {
        EXPECT_EQ(p->QueryHandlerType(), 1);
        EXPECT_EQ(p->MsgHandler(), nullptr);
        EXPECT_NE(p->Handler(), nullptr);
    }
    EXPECT_NE(info.Handler(), callState.Handler());
    EXPECT_FALSE(info == callState);
}

TEST(EventPublications, ComponentMakesTheObjectTheCallbackTarget) {
    TrunkState first;
    TrunkState second;
    second.Component();
    EXPECT_EQ(TrunkState::g_this.load(), &second);
    first.Component();
    EXPECT_EQ(TrunkState::g_this.load(), &first);
}

tolk::LCON::Evt_0x1611_t* LineEvent(unsigned int type, unsigned int reason) {
    auto* e = new tolk::LCON::Evt_0x1611_t();
    *e->pLabel = 0x1611;
    *e->pType = type;
    *e->pReason = reason;
    return e;
}

tolk::LCON::Evt_0x1600_t* AlarmEvent(unsigned int type, unsigned char state) {
    auto* e = new tolk::LCON::Evt_0x1600_t();
    *e->pLabel = 0x1600;
    *e->pType = type;
    *e->pState = state;
    return e;
}

TEST(EventPublications, TextIsNullWithoutAnEvent) {
    TrunkState trunkState;
    EXPECT_EQ(trunkState.GetEvent(), nullptr);
    EXPECT_EQ(trunkState.ToZLG(), nullptr);
    EXPECT_EQ(trunkState.ToZLG(), nullptr);
}

TEST(EventPublications, TrunkStateTextLastsUntilUnlock) {
    VX7EventPublisher publisher(1, 2, 1);
    TrunkState trunkState;
    trunkState.Lock();
    trunkState.SetEvent(&publisher, LineEvent(0x160F, 3));
    char* text = trunkState.ToZLG();
    ASSERT_NE(text, nullptr);
    EXPECT_STREQ(text, "Trunk State board=1 trunk=2 state=In Service reason=Maintenance");
    EXPECT_EQ(trunkState.ToZLG(), text);
    trunkState.Unlock();
    EXPECT_EQ(trunkState.GetEvent(), nullptr);
    EXPECT_EQ(trunkState.ToZLG(), nullptr);
    // The lock is free again.
    trunkState.Lock();
    trunkState.Unlock();
}

struct AlarmCase {
    unsigned int type;
    unsigned char state;
    const char* text;
};

class AlarmText : public ::testing::TestWithParam<AlarmCase> {};

TEST_P(AlarmText, ReadsTypeAndState) {
    VX7EventPublisher publisher(4, 7, 1);
    AllAlarms alarms;
    alarms.Lock();
    alarms.SetEvent(&publisher, AlarmEvent(GetParam().type, GetParam().state));
    EXPECT_STREQ(alarms.ToZLG(), GetParam().text);
    alarms.Unlock();
}

INSTANTIATE_TEST_SUITE_P(
    EventPublications, AlarmText,
    ::testing::Values(
        AlarmCase{0x1601, 1, "Alarm Event:  board=4 trunk=7 type=Red state=Active"},
        AlarmCase{0x1604, 0,
                  "Alarm Event:  board=4 trunk=7 type=Loss of Signal (LOS) state=InActive"},
        AlarmCase{0x1610, 1, "Alarm Event:  board=4 trunk=7 type=unknown state=Active"},
        AlarmCase{0x1619, 7,
                  "Alarm Event:  board=4 trunk=7 type=Consecutively Errored Seconds Saturation "
                  "state=Unknown"}));

TEST(EventPublications, CallStateTextCarriesTheEventsChannel) {
    VX7EventPublisher publisher(2, 1, 17);
    TSCCallState callState;
    auto* e = new tolk::TSC::EvtCallState_t();
    *e->pEvtGroup = 0x1230;
    *e->pType = 0x1233;
    *e->pTimestamp = 4711;
    *e->pCallId = 9;
    *e->pCallState = 17;
    *e->pReason = 0xE;
    callState.Lock();
    callState.SetEvent(&publisher, e);
    EXPECT_EQ(callState.GetEvent(), e);
    EXPECT_STREQ(callState.ToZLG(),
                 "Call State timestamp=4711 board=2 trunk=1 channel=17 state=Alerting");
    callState.Unlock();
}

TEST(EventPublications, ChanStateTellsTheNumberOnceForItsText) {
    VX7EventPublisher publisher(1, 1, 3);
    TSCChanState chanState;
    auto* e = new tolk::TSC::EvtChanState_t();
    *e->pEvtGroup = 0x1260;
    *e->pType = 0x1261;
    *e->pTimestamp = 12;
    *e->pChanState = 11;
    chanState.Lock();
    chanState.SetEvent(&publisher, e);
    testsupport::LogCapture out;
    EXPECT_STREQ(chanState.ToZLG(),
                 "Channel State timestamp=12 board=1 trunk=1 channel=3 state=Unknown");
    chanState.ToZLG();
    EXPECT_EQ(out.Text(), "ChanState = 11\n");
    chanState.Unlock();
}

TEST(EventPublications, CallInfoSaysSoAtEveryCall) {
    VX7EventPublisher publisher(1, 2, 5);
    TSCCallInfo info;
    auto* e = new tolk::TSC::EvtCallInfo_t();
    *e->pEvtGroup = 0x1200;
    *e->pType = 0x1202;
    *e->pTimestamp = 1;
    *e->pCallId = 2;
    *e->pInfoId = 0x2000007;
    info.Lock();
    info.SetEvent(&publisher, e);
    testsupport::LogCapture out;
    EXPECT_STREQ(info.ToZLG(), "Call Info timestamp=1 board=1 trunk=2 channel=5 state=CallerId");
    info.ToZLG();
    EXPECT_EQ(out.Text(), "received callinfo event\nreceived callinfo event\n");
    info.Unlock();
}

// An event for a component no publisher made (one whose publisher has gone) is dropped; the
// body is freed (the sanitizer build would report it otherwise) and nothing is locked.
TEST(EventPublications, CallbackWithoutPublisherDropsTheEvent) {
    TrunkState trunkState;
    trunkState.Component();
    tolk::Addressable stranger(tolk::CompDesc_t(1, 1, 1, 22, 0));
    trunkState.Handler()(&stranger, 0x20, LineEvent(0x1610, 0));
    EXPECT_EQ(trunkState.GetEvent(), nullptr);
    trunkState.Lock();
    trunkState.Unlock();
}

}  // namespace
