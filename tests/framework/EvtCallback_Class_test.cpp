#include "framework/EvtCallback_Class.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <mutex>
#include <sstream>
#include <stdexcept>
#include <thread>

#include "Responder.h"
#include "framework/Addressable.h"
#include "framework/Marshal.h"
#include "framework/MsgDefault_t.h"
#include "framework/MsgEvtDetected_t.h"

namespace {

using tolk::Addressable;
using tolk::EvtCallback;
using tolk::Msg;
using tolk::MsgBody;
using tolk::MsgQueue;

// An event body whose count can ask for more than any list may hold.
class CountedEvt : public MsgBody {
  public:
    unsigned int writeMsg(Msg*, unsigned int off) override { return off; }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = tolk::getFirst(m, off, 0x380000, &group);
        off = tolk::getField(m, off, 0x380000, &count);
        return tolk::getList(m, off, 7, words, count, false);
    }
    unsigned int GetByteSize() override { return 8 + 4 * words.length(); }
    void toStream(std::ostream* os) const override { *os << "{CountedEvt " << count << "}"; }
    unsigned int group = 0;
    unsigned int count = 0;
    tolk::staticList<unsigned int> words;
};

class Component : public Addressable {
  public:
    using Addressable::Addressable;
    MsgBody* MsgBodyLookup(unsigned int type) override {
        if (type == 0x5E) {
            throw std::runtime_error("lookup failed");
        }
        return Addressable::MsgBodyLookup(type);
    }
    MsgBody* EvtBodyLookup(unsigned int group) override {
        if (group == 0x1230) {
            return new CountedEvt();
        }
        return Addressable::EvtBodyLookup(group);
    }
};

struct Seen {
    std::string who;
    unsigned int number;
    std::string body;
    Msg* msg;
};

std::mutex seenLock;
std::vector<Seen> seen;

void record(const std::string& who, unsigned int n, const std::string& body, Msg* m) {
    std::lock_guard<std::mutex> g(seenLock);
    seen.push_back({who, n, body, m});
}

std::size_t seenCount() {
    std::lock_guard<std::mutex> g(seenLock);
    return seen.size();
}

void waitSeen(std::size_t n) {
    for (int i = 0; i < 400 && seenCount() < n; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
}

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

void msgA(Addressable*, Msg* m) {
    record("A", m->getMsgType(), "", m);
    delete m;
}
void msgB(Addressable*, Msg* m) {
    record("B", m->getMsgType(), "", m);
    delete m;
}
void bodyFn(Addressable*, unsigned int n, MsgBody* b) {
    std::string kind = dynamic_cast<tolk::MsgDefault_t*>(b)       ? "default"
                       : dynamic_cast<tolk::MsgEvtDetected_t*>(b) ? "evt"
                       : dynamic_cast<CountedEvt*>(b)             ? "counted"
                                                                  : "?";
    record("body", n, kind + text(*b), nullptr);
    delete b;
}
void unregistered(Addressable*, Msg* m) {
    record("unregistered", m->getMsgType(), "", m);
    delete m;
}
void throwing(Addressable*, Msg* m) {
    delete m;
    throw tolk::Exception("callback failed");
}

void throwingOther(Addressable*, Msg* m) {
    delete m;
    throw std::runtime_error("not a framework exception");
}

class Holder : public EvtCallback::Callback {
  public:
    void onMsg(Addressable*, Msg* m) {
        record("member", m->getMsgType(), "", m);
        delete m;
    }
};

class Dispatcher : public ::testing::Test {
  protected:
    Dispatcher()
        : board([](TKMsg32Bit*) { return std::vector<Outgoing>{}; }),
          queue(new MsgQueue(tolk::CompDesc_t(1, 1, 1, 1, 1), 512, 5)),
          comp(board.address(), queue) {
        std::lock_guard<std::mutex> g(seenLock);
        seen.clear();
    }
    void send(unsigned int type, std::vector<unsigned char> body = {}) {
        board.send(queue->getHostDesc().getTKCompDesc(), type, 1, body);
    }
    static std::vector<unsigned char> evt(unsigned int group,
                                          std::vector<unsigned char> rest = {}) {
        // Group in front of the rest, built in place (GCC 12 misjudges an insert at the end
        // of a four-byte vector as out of bounds).
        rest.resize(rest.size() + 4);
        std::rotate(rest.rbegin(), rest.rbegin() + 4, rest.rend());
        for (int i = 0; i < 4; ++i) {
            rest[i] = static_cast<unsigned char>(group >> (24 - 8 * i));
        }
        return rest;
    }

    Responder board;
    isa::RefPtr<MsgQueue> queue;
    Component comp;
};

TEST_F(Dispatcher, CallbacksRunInRegistrationOrderEachWithItsOwnMessage) {
    comp.asyncRegisterMsgType(0x51, msgA, 0);
    comp.asyncRegisterMsgType(0x51, msgB, 0);
    Holder h;
    comp.asyncRegisterMsgType(0x51, static_cast<EvtCallback::Callback*>(&h),
                              static_cast<EvtCallback::MsgMethod>(&Holder::onMsg), 0);
    send(0x51, {1});
    waitSeen(3);
    ASSERT_EQ(seenCount(), 3u);
    EXPECT_EQ(seen[0].who, "A");
    EXPECT_EQ(seen[1].who, "B");
    EXPECT_EQ(seen[2].who, "member");
}

TEST_F(Dispatcher, NullEntryDropsTheMessageSilently) {
    comp.asyncRegisterMsgType(0x1220, static_cast<EvtCallback::MsgFn>(nullptr), 0);
    comp.asyncUnregisteredMsgType(unregistered, 0);
    testing::internal::CaptureStderr();
    send(0x1220);
    send(0x53);
    waitSeen(1);
    std::this_thread::sleep_for(std::chrono::milliseconds(30));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    ASSERT_EQ(seenCount(), 1u);
    EXPECT_EQ(seen[0].who, "unregistered");
    EXPECT_EQ(seen[0].number, 0x53u);
}

TEST_F(Dispatcher, BodiesGoByTypeAndEventsByGroupWithFallBacks) {
    comp.asyncRegisterMsgType(0x52, bodyFn, 0);
    comp.asyncRegisterEvtGroup(0x1299, bodyFn, 0);
    comp.asyncUnregisteredEvtGroup(unregistered, 0);
    send(0x52, {7, 8});
    send(0x20, evt(0x1299, {5}));
    send(0x20, evt(0x1300));
    waitSeen(3);
    ASSERT_EQ(seenCount(), 3u);
    // A type without a body of its own is read as bytes.
    EXPECT_EQ(seen[0].number, 0x52u);
    EXPECT_EQ(seen[0].body, "default{ByteData {7 8 }}");
    EXPECT_EQ(seen[1].number, 0x20u);
    EXPECT_EQ(seen[1].body, "evt{EvtGroup 4761 Data {5}}");
    EXPECT_EQ(seen[2].who, "unregistered");
}

TEST_F(Dispatcher, CancellingTheLastCallbackSendsTheTypeToTheUnregisteredHandler) {
    comp.asyncRegisterMsgType(0x54, msgA, 3);
    comp.asyncUnregisteredMsgType(unregistered, 0);
    comp.asyncCancelMsgType(0x54, msgA, 4);  // another tag: not the same entry
    send(0x54);
    waitSeen(1);
    comp.asyncCancelMsgType(0x54, msgA, 3);
    send(0x54);
    waitSeen(2);
    ASSERT_EQ(seenCount(), 2u);
    EXPECT_EQ(seen[0].who, "A");
    EXPECT_EQ(seen[1].who, "unregistered");
}

TEST_F(Dispatcher, CancelOfAnUnknownNumberRaisesAndLeavesTheLockFree) {
    comp.asyncRegisterMsgType(0x55, msgA, 0);
    EXPECT_THROW(comp.asyncCancelMsgType(0x56), tolk::Exception);
    EXPECT_THROW(comp.asyncCancelEvtGroup(0x56, msgA, 0), tolk::Exception);
    Component fresh(board.address(), queue);
    EXPECT_NO_THROW(fresh.asyncCancelMsgType(0x55));  // no dispatcher yet: nothing to cancel
    comp.asyncRegisterMsgType(0x57, msgB, 0);
    send(0x57);
    waitSeen(1);
    EXPECT_EQ(seenCount(), 1u);
}

TEST_F(Dispatcher, UnregisteredMessageOrEventBannerNamesTypeOrGroupAndObject) {
    comp.asyncRegisterMsgType(0x58, msgA, 0);
    testing::internal::CaptureStderr();
    send(0x59, {1, 2});
    send(0x58);
    waitSeen(1);
    std::string err = testing::internal::GetCapturedStderr();
    std::ostringstream head;
    head << "\n********************************************\nUnregistered MsgType 89\nFor " << comp
         << "\n{MsgType: 0x59 Source: ";
    EXPECT_EQ(err.rfind(head.str(), 0), 0u) << err;
    EXPECT_NE(err.find(" Body: {ByteData {0x1 0x2 }}}\nYou may specify your own handler for "
                       "unregisted messages using\nAddressable::asyncUnregisteredMsgType\n"
                       "********************************************\n\n"),
              std::string::npos)
        << err;

    testing::internal::CaptureStderr();
    send(0x20, evt(0x77));
    send(0x58);
    waitSeen(2);
    err = testing::internal::GetCapturedStderr();
    head.str("");
    head << "********************************************\nUnregistered EventGroup 119\nFor "
         << comp << "\n{MsgType: 0x20 ";
    EXPECT_EQ(err.rfind(head.str(), 0), 0u) << err;
    EXPECT_NE(err.find("You may specify your own handler for unregisted events using\n"
                       "Addressable::asyncUnregisteredEvtGroup\n"),
              std::string::npos);
}

TEST_F(Dispatcher, ImpossibleCountInAnEventBodyIsReportedNotFatal) {
    comp.asyncRegisterEvtGroup(0x1230, bodyFn, 0);
    comp.asyncRegisterMsgType(0x5B, msgA, 0);
    testing::internal::CaptureStderr();
    send(0x20, evt(0x1230, {0xFF, 0xFF, 0xFF, 0xFF}));
    send(0x20, evt(0x1230, {0, 0, 0, 1, 0, 0, 0, 9}));
    send(0x5B);
    waitSeen(2);
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err,
              "EvtCallback_Class(321) tolk internal error\n"
              "list::AllocationError(ReqSize: 4294967295)\n");
    ASSERT_EQ(seenCount(), 2u);
    EXPECT_EQ(seen[0].body, "counted{CountedEvt 1}");
    EXPECT_EQ(seen[1].who, "A");
}

TEST_F(Dispatcher, MsgWaitReturnsTheMessageAndTimesOutWithoutOne) {
    std::thread later([this] {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        send(0x5C, {4});
    });
    Msg* m = comp.asyncWaitMsgMsg(0x5C, 3000);
    later.join();
    ASSERT_NE(m, nullptr);
    EXPECT_EQ(m->getMsgType(), 0x5Cu);
    delete m;
    try {
        comp.asyncWaitMsg(0x5D, nullptr, 50);
        FAIL();
    } catch (const EvtCallback::MsgWait::Timeout& t) {
        EXPECT_EQ(t.number, 0x5Du);
        EXPECT_EQ(t.timeoutMs, 50u);
    }
    // The entry is gone once the wait has fired: the next 0x5C is unregistered.
    comp.asyncUnregisteredMsgType(unregistered, 0);
    send(0x5C);
    waitSeen(1);
    ASSERT_EQ(seenCount(), 1u);
    EXPECT_EQ(seen[0].who, "unregistered");
}

TEST_F(Dispatcher, EvtWaitFillsTheBody) {
    std::unique_ptr<EvtCallback::EvtWait> w(comp.getNewEvtWait(0x1299));
    send(0x20, evt(0x1299, {1, 2}));
    tolk::MsgEvtDetected_t body;
    w->wait(&body, 3000);
    EXPECT_EQ(body.EvtGroup, 0x1299u);
    EXPECT_EQ(body.Data.length(), 2u);
}

// Whatever fails inside a dispatch is reported once, under the line that names where it came
// from, and the dispatcher goes on: later entries and later messages still arrive.
struct DispatchFailure {
    const char* name;
    unsigned int type;
    void (*registerFailing)(Addressable&);
    std::string report;
    std::vector<std::string> reached;
};

class DispatchFailures : public Dispatcher,
                         public ::testing::WithParamInterface<DispatchFailure> {};

TEST_P(DispatchFailures, AreReportedOnceAndLaterMessagesStillArrive) {
    const DispatchFailure& c = GetParam();
    c.registerFailing(comp);
    comp.asyncRegisterMsgType(0x5B, msgB, 0);
    testing::internal::CaptureStderr();
    send(c.type);
    send(0x5B);
    waitSeen(c.reached.size());
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err, c.report);
    std::vector<std::string> who;
    {
        std::lock_guard<std::mutex> g(seenLock);
        for (const Seen& s : seen) {
            who.push_back(s.who);
        }
    }
    EXPECT_EQ(who, c.reached);
}

INSTANTIATE_TEST_SUITE_P(
    Dispatcher, DispatchFailures,
    ::testing::Values(
        DispatchFailure{"FrameworkExceptionFromACallback",
                        0x5A,
                        [](Addressable& a) {
                            a.asyncRegisterMsgType(0x5A, throwing, 0);
                            a.asyncRegisterMsgType(0x5A, msgA, 0);
                        },
                        "EvtCallback_Class(138) TOLK Exception caught from callback handler "
                        "thread\ncallback failed\n",
                        {"A", "B"}},
        DispatchFailure{"OtherExceptionFromACallback",
                        0x5A,
                        [](Addressable& a) {
                            a.asyncRegisterMsgType(0x5A, throwingOther, 0);
                            a.asyncRegisterMsgType(0x5A, msgA, 0);
                        },
                        "EvtCallback_Class(147) general Exception caught from callback handler "
                        "thread\n",
                        {"A", "B"}},
        DispatchFailure{"OtherExceptionWhileMakingTheBody",
                        0x5E,
                        [](Addressable& a) { a.asyncRegisterMsgType(0x5E, bodyFn, 0); },
                        "EvtCallback_Class(330) tolk internal error\n",
                        {"B"}},
        DispatchFailure{"OtherExceptionFromTheUnregisteredHandler",
                        0x5F,
                        [](Addressable& a) { a.asyncUnregisteredMsgType(throwingOther, 0); },
                        "EvtCallback_Class(147) general Exception caught from callback handler "
                        "thread\n",
                        {"B"}}),
    [](const ::testing::TestParamInfo<DispatchFailure>& i) { return std::string(i.param.name); });

}  // namespace
