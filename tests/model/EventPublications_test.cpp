#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LogCapture.h"
#include "framework/Addressable.h"
#include "model/AllAlarms.h"
#include "model/PublicationTexts.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"

namespace {

using namespace vx7diag;

// The edges of each table: first and last entries, the holes inside and the values just
// past it, where an off-by-one or a read past the table would show.
TEST(PublicationTexts, EdgesAndHolesOfEachTable) {
    struct Case {
        const char* (*text)(unsigned int);
        unsigned int value;
        const char* expected;
    };
    const Case cases[] = {
        {ChanStateText, 0, "Unknown"},
        {ChanStateText, 10, "Null"},
        {ChanStateText, 11, "Unknown"},
        {ChanStateText, 12, "Unknown"},
        {ChanStateText, 13, "OutOfServiceMediaDetached"},
        {ChanStateText, 14, "OutOfServiceRemote"},
        {ChanStateText, 15, "Unknown"},
        {CallStateText, 0, "Null"},
        {CallStateText, 15, "Proceeding"},
        {CallStateText, 16, "Unknown"},
        {CallStateText, 17, "Alerting"},
        {CallStateText, 21, "DialTone"},
        {CallStateText, 22, "Unknown"},
        {CallStateText, 0xFFFFFFFF, "Unknown"},
        {TrunkStateText, 0x160F, "In Service"},
        {TrunkStateText, 0x1610, "Out Of Service"},
        {TrunkStateText, 0x1611, "Unknown"},
        {TrunkReasonText, 0, "Normal"},
        {TrunkReasonText, 5, "Alarm"},
        {TrunkReasonText, 6, "Unknown"},
        {AlarmTypeText, 0x1600, "unknown"},
        {AlarmTypeText, 0x1601, "Red"},
        {AlarmTypeText, 0x160E, "Transmit AIS TS16"},
        {AlarmTypeText, 0x160F, "unknown"},
        {AlarmTypeText, 0x1615, "unknown"},
        {AlarmTypeText, 0x1616, "Bipolar Violation Saturation"},
        {AlarmTypeText, 0x161A, "Out-Of-Frame Saturation"},
        {AlarmTypeText, 0x161B, "unknown"},
        {AlarmStateText, 0, "InActive"},
        {AlarmStateText, 1, "Active"},
        {AlarmStateText, 2, "Unknown"},
        {CallInfoText, 0x100000C, "Charge"},
        {CallInfoText, 0x2000007, "CallerId"},
        {CallInfoText, 0x100000D, "Unknown"},
        {CallInfoText, 0, "Unknown"},
    };
    for (const Case& c : cases) {
        EXPECT_STREQ(c.text(c.value), c.expected) << "value 0x" << std::hex << c.value;
    }
}

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

// The channel states 11 and 12 have no event of their own: their types belong to others.
TEST(EventPublications, SubscribedEventTypes) {
    std::vector<unsigned int> chan = Range(0x1260, 0x1269);
    chan.push_back(0x126C);
    chan.push_back(0x126D);
    EXPECT_EQ(Types(TSCChanState()), chan);
    EXPECT_EQ(Types(TSCCallInfo()), Range(0x1200, 0x121A));
    EXPECT_EQ(Types(TSCCallState()), Range(0x1230, 0x1241));
    EXPECT_TRUE(Types(TrunkState()).empty());
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

tolk::TSC::EvtCallState_t* CallEvent(unsigned int state) {
    auto* e = new tolk::TSC::EvtCallState_t();
    *e->pEvtGroup = 0x1230;
    *e->pType = 0x1233;
    *e->pTimestamp = 4711;
    *e->pCallId = 9;
    *e->pCallState = state;
    *e->pReason = 0xE;
    return e;
}

tolk::TSC::EvtChanState_t* ChanEvent(unsigned int state) {
    auto* e = new tolk::TSC::EvtChanState_t();
    *e->pEvtGroup = 0x1260;
    *e->pType = 0x1261;
    *e->pTimestamp = 12;
    *e->pChanState = state;
    return e;
}

tolk::TSC::EvtCallInfo_t* InfoEvent(unsigned int info) {
    auto* e = new tolk::TSC::EvtCallInfo_t();
    *e->pEvtGroup = 0x1200;
    *e->pType = 0x1202;
    *e->pTimestamp = 1;
    *e->pCallId = 2;
    *e->pInfoId = info;
    return e;
}

// The text of one event as an observer reads it between Lock and Unlock, asked for twice
// (it is built once), with what asking wrote to standard output; afterwards the aspect holds
// neither event nor text and its lock is free.
template <class Publication, class Event>
std::string TextOf(VX7EventPublisher& publisher, Event* event, std::string* said = nullptr) {
    Publication aspect;
    aspect.Lock();
    aspect.SetEvent(&publisher, event);
    EXPECT_EQ(aspect.GetEvent(), event);
    testsupport::LogCapture out;
    char* text = aspect.ToZLG();
    EXPECT_EQ(aspect.ToZLG(), text);
    std::string result = text != nullptr ? text : "(null)";
    if (said != nullptr) {
        *said = out.Text();
    }
    aspect.Unlock();
    EXPECT_EQ(aspect.GetEvent(), nullptr);
    EXPECT_EQ(aspect.ToZLG(), nullptr);
    aspect.Lock();
    aspect.Unlock();
    return result;
}

TEST(EventPublications, TextsOfEachKindOfEvent) {
    VX7EventPublisher line(1, 2, 1);
    VX7EventPublisher alarms(4, 7, 1);
    VX7EventPublisher channel(2, 1, 17);
    EXPECT_EQ(TextOf<TrunkState>(line, LineEvent(0x160F, 3)),
              "Trunk State board=1 trunk=2 state=In Service reason=Maintenance");
    EXPECT_EQ(TextOf<AllAlarms>(alarms, AlarmEvent(0x1601, 1)),
              "Alarm Event:  board=4 trunk=7 type=Red state=Active");
    EXPECT_EQ(TextOf<AllAlarms>(alarms, AlarmEvent(0x1604, 0)),
              "Alarm Event:  board=4 trunk=7 type=Loss of Signal (LOS) state=InActive");
    EXPECT_EQ(TextOf<AllAlarms>(alarms, AlarmEvent(0x1619, 7)),
              "Alarm Event:  board=4 trunk=7 type=Consecutively Errored Seconds Saturation "
              "state=Unknown");
    EXPECT_EQ(TextOf<TSCCallState>(channel, CallEvent(17)),
              "Call State timestamp=4711 board=2 trunk=1 channel=17 state=Alerting");

    // The channel state tells its number once, for the text; call info says so at each call.
    std::string said;
    EXPECT_EQ(TextOf<TSCChanState>(channel, ChanEvent(11), &said),
              "Channel State timestamp=12 board=2 trunk=1 channel=17 state=Unknown");
    EXPECT_EQ(said, "ChanState = 11\n");
    EXPECT_EQ(TextOf<TSCCallInfo>(channel, InfoEvent(0x2000007), &said),
              "Call Info timestamp=1 board=2 trunk=1 channel=17 state=CallerId");
    EXPECT_EQ(said, "received callinfo event\nreceived callinfo event\n");
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
