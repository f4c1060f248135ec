// Aspects, observers and subjects; the event publications and their texts; the trace logger.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "LogCapture.h"
#include "framework/Addressable.h"
#include "model/AllAlarms.h"
#include "model/Aspect.h"
#include "model/Observer.h"
#include "model/PublicationTexts.h"
#include "model/Subject.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"
#include "model/VX7EventZLGLogger.h"
#include "platform/zlg/zlg.h"

namespace {

using namespace vx7diag;
using testing::ElementsAre;
using testing::EndsWith;

// ---- aspects, observers and subjects ----

class CallAspect : public Aspect {};
class ChanAspect : public Aspect {
  public:
    explicit ChanAspect(int v = 0) : volume(v) {}
    int volume;
};

// Subjects key their observer sets on the aspect's class: the fields never take part, and
// two classes are never equal, each counting as less than the other. Observers are told
// apart by identity alone.
TEST(Aspect, ComparesByClassOnlyAndObserversByIdentity) {
    ChanAspect a(1);
    ChanAspect b(99);
    CallAspect other;
    Aspect& base = other;
    EXPECT_TRUE(a == b);
    EXPECT_FALSE(a < b);
    EXPECT_FALSE(a == base);
    EXPECT_TRUE(a < base);
    EXPECT_TRUE(base < a);
    EXPECT_EQ(other.ToZLG(), nullptr);

    Observer first;
    Observer second;
    EXPECT_TRUE(first < second);
    EXPECT_TRUE(second < first);
    EXPECT_FALSE(first < first);
}

// Records, into a log shared by all observers of a test, who was told of what.
class Recorder : public Observer {
  public:
    Recorder(std::string n, std::vector<std::string>* l) : name(std::move(n)), log(l) {}
    void Update(Subject*, Aspect& aspect) override {
        log->push_back(name + (dynamic_cast<CallAspect*>(&aspect) != nullptr ? ":call" : ":chan"));
    }
    std::string name;
    std::vector<std::string>* log;
};

// Detach answers how many observers the aspect keeps, -1 when it has none to detach from.
TEST(SubjectTest, DetachCountsWhatIsLeftOfTheAspect) {
    std::vector<std::string> log;
    isa::RefPtr<Observer> first{new Recorder("first", &log)};
    isa::RefPtr<Observer> second{new Recorder("second", &log)};
    CallAspect callAspect;
    ChanAspect chanAspect;
    Subject subject;
    EXPECT_EQ(subject.Detach(first, callAspect), -1);
    subject.Attach(first, &chanAspect);
    EXPECT_EQ(subject.Detach(first, callAspect), -1);
    subject.Attach(first, &callAspect);
    subject.Attach(second, &callAspect);
    EXPECT_EQ(subject.Detach(first, callAspect), 1);
    EXPECT_EQ(subject.Detach(second, callAspect), 0);
    EXPECT_EQ(subject.Detach(second, callAspect), -1);
    subject.Notify(callAspect);
    // Detached from one aspect, the observer is still told of the other.
    subject.Notify(chanAspect);
    EXPECT_THAT(log, ElementsAre("first:chan"));
}

// ---- event publications ----

// The edges of each table: first and last entries, the holes inside and the values just
// past it, where an off-by-one or a read past the table would show.
TEST(PublicationTexts, EdgesAndHolesOfEachTable) {
    const struct {
        const char* (*text)(unsigned int);
        std::vector<std::pair<unsigned int, const char*>> edges;
    } tables[] = {
        {ChanStateText,
         {{0, "Unknown"},
          {10, "Null"},
          {11, "Unknown"},
          {12, "Unknown"},
          {13, "OutOfServiceMediaDetached"},
          {14, "OutOfServiceRemote"},
          {15, "Unknown"}}},
        {CallStateText,
         {{0, "Null"},
          {15, "Proceeding"},
          {16, "Unknown"},
          {17, "Alerting"},
          {21, "DialTone"},
          {22, "Unknown"},
          {0xFFFFFFFF, "Unknown"}}},
        {TrunkStateText, {{0x160F, "In Service"}, {0x1610, "Out Of Service"}, {0x1611, "Unknown"}}},
        {TrunkReasonText, {{0, "Normal"}, {5, "Alarm"}, {6, "Unknown"}}},
        {AlarmTypeText,
         {{0x1600, "unknown"},
          {0x1601, "Red"},
          {0x160E, "Transmit AIS TS16"},
          {0x160F, "unknown"},
          {0x1615, "unknown"},
          {0x1616, "Bipolar Violation Saturation"},
          {0x161A, "Out-Of-Frame Saturation"},
          {0x161B, "unknown"}}},
        {AlarmStateText, {{0, "InActive"}, {1, "Active"}, {2, "Unknown"}}},
        {CallInfoText,
         {{0x100000C, "Charge"}, {0x2000007, "CallerId"}, {0x100000D, "Unknown"}, {0, "Unknown"}}},
    };
    for (const auto& table : tables) {
        for (const auto& [value, expected] : table.edges) {
            EXPECT_STREQ(table.text(value), expected) << "value 0x" << std::hex << value;
        }
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

// Events with what their texts show filled in.
tolk::LCON::Evt_0x1611_t* LineEvent(unsigned int type, unsigned int reason) {
    auto* e = new tolk::LCON::Evt_0x1611_t();
    *e->pType = type;
    *e->pReason = reason;
    return e;
}

tolk::LCON::Evt_0x1600_t* AlarmEvent(unsigned int type, unsigned char state) {
    auto* e = new tolk::LCON::Evt_0x1600_t();
    *e->pType = type;
    *e->pState = state;
    return e;
}

tolk::TSC::EvtCallState_t* CallEvent(unsigned int state) {
    auto* e = new tolk::TSC::EvtCallState_t();
    *e->pTimestamp = 4711;
    *e->pCallState = state;
    return e;
}

tolk::TSC::EvtChanState_t* ChanEvent(unsigned int state) {
    auto* e = new tolk::TSC::EvtChanState_t();
    *e->pTimestamp = 12;
    *e->pChanState = state;
    return e;
}

tolk::TSC::EvtCallInfo_t* InfoEvent(unsigned int info) {
    auto* e = new tolk::TSC::EvtCallInfo_t();
    *e->pTimestamp = 1;
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

// ---- the trace logger ----

// An aspect in the middle of an event: it has a text, built once.
class Carrying : public Aspect {
  public:
    explicit Carrying(const char* text) {
        zlgText = new char[64];
        std::snprintf(zlgText, 64, "%s", text);
    }
    char* ToZLG() override { return zlgText; }
};

std::vector<std::string> ReadLines(const std::string& path) {
    std::ifstream in(path);
    std::vector<std::string> lines;
    for (std::string line; std::getline(in, line);) {
        lines.push_back(line);
    }
    return lines;
}

class TraceFile : public ::testing::Test {
  protected:
    void SetUp() override {
        char name[] = "/tmp/model_zlg_XXXXXX";
        int fd = mkstemp(name);
        ASSERT_GE(fd, 0);
        close(fd);
        path = name;
        setenv(ZLG_TRACE_FILE_ENV, path.c_str(), 1);
    }
    void TearDown() override {
        unsetenv(ZLG_TRACE_FILE_ENV);
        unlink(path.c_str());
    }
    std::string path;
};

// An aspect without a text (never a publication during an event) is traced as an empty line.
TEST_F(TraceFile, EachEventGoesToStandardOutputAndTheTraceAlike) {
    VX7EventZLGLogger logger;
    Carrying event("Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting");
    Aspect textless;

    testsupport::LogCapture out;
    logger.Update(nullptr, event);
    logger.Update(nullptr, textless);
    EXPECT_EQ(out.Text(),
              "trace:: Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting\n"
              "trace:: \n");
    EXPECT_THAT(
        ReadLines(path),
        ElementsAre(
            EndsWith(
                " Ocelot/Error: Call State timestamp=7 board=1 trunk=1 channel=3 state=Alerting"),
            EndsWith(" Ocelot/Error: ")));
}

// The trace library's name tables are process-wide, so the failure is provoked in a freshly
// started child, where "Ocelot" has not been registered by an earlier test.
TEST_F(TraceFile, FailedModuleHandleIsTracedAndTheLabelStillAskedFor) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    std::string tracePath = path;
    EXPECT_EXIT(
        {
            for (int i = 0; i < ZLG_MAX_NAMES; ++i) {
                ZLG_HANDLE h;
                ZlgGetModuleHandle(("filler" + std::to_string(i)).c_str(), &h);
            }
            VX7EventZLGLogger logger;
            std::vector<std::string> lines = ReadLines(tracePath);
            bool ok = lines.size() == 1 &&
                      lines[0].ends_with(" -: Unable to retrieve module handle, ZlgRet = 2") &&
                      logger.GetLabelHandle() != 0 && logger.GetModuleHandle() == 0;
            std::exit(ok ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

}  // namespace
