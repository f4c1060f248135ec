// The messaging core against a fake board: the queue's requests and routing, a proxy's request
// with its refusals and time-outs, and the dispatcher that hands messages and events to the
// callbacks registered for them.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <mutex>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <thread>

#include "FakeBoard.h"
#include "framework/Addressable.h"
#include "framework/AsyncMsgReceiver.h"
#include "framework/CompAttr_t.h"
#include "framework/EvtCallback_Class.h"
#include "framework/Marshal.h"
#include "framework/MsgDefault_t.h"
#include "framework/MsgEvtDetected_t.h"
#include "framework/MsgQueue.h"
#include "framework/tolk.h"

namespace {

using testing::HasSubstr;
using testing::StartsWith;
using tolk::Addressable;
using tolk::CompAttr_t;
using tolk::EvtCallback;
using tolk::Msg;
using tolk::MsgBody;
using tolk::MsgQueue;
using Bytes = std::vector<std::uint8_t>;
using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

const tolk::CompDesc_t kBoard(7, 2, 1, 18, 0);
const tolk::CompDesc_t kAny(1, 1, 1, 1, 1);

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

// What `call` raised as E, or nothing.
template <class E, class F>
std::optional<E> raised(F call) {
    try {
        call();
    } catch (const E& e) {
        return e;
    }
    return std::nullopt;
}

// A board that answers every block alike.
FakeBoard::Rule always(std::vector<Answer> answers) {
    return [answers](const Sent&) { return answers; };
}

isa::RefPtr<MsgQueue> newQueue() {
    return isa::RefPtr<MsgQueue>(new MsgQueue(kAny, 512, 5));
}

// ---- the queue ----

Msg* command(unsigned int type) {
    Msg* m = new Msg(4u);
    m->setMsgType(type);
    tolk::CompDesc_t target = kBoard;  // taken by reference
    m->setTgtAddr(target);
    m->setTrans(tolk::getUniqueTransId());
    return m;
}

TEST(MsgQueueRequest, ErrorOrOtherReplyRaisesErrorMsgHoldingItAtOnce) {
    for (auto [reply, awaited] : {std::pair{0u, 0x1215u}, {0u, 0u}, {0x800001u, 0x1215u}}) {
        SCOPED_TRACE(reply);
        FakeBoard board(always({{reply, {0, 0, 0x12, 0x14}}}));
        MsgQueue q(kAny, MsgQueue::DefaultMaxRetMsgSize, MsgQueue::DefaultDepth);
        // A structured binding is copied in: clang 14 cannot capture one.
        auto e = raised<MsgQueue::ErrorMsg>(
            [&q, type = awaited] { delete q.request(command(0x1214), 5000, type, 0); });
        ASSERT_TRUE(e);
        ASSERT_NE(e->msg, nullptr);
        EXPECT_EQ(e->msg->getMsgType(), reply);
        EXPECT_TRUE(e->msg->getSrcAddr() == kBoard);
        EXPECT_EQ(e->queue, &q);
        EXPECT_THAT(text(*e), StartsWith("MsgQueue::ErrorMsg MsgBody: {MsgType: " +
                                         std::string(reply ? "0x800001" : "0") + " Source: "));
    }
}

TEST(MsgQueueRequest, SilenceRaisesTimeoutWithItsText) {
    FakeBoard board;
    MsgQueue q(kAny, 512, 5);
    auto t0 = Clock::now();
    auto e = raised<MsgQueue::Timeout>([&] { q.request(command(0x1214), 200, 0x1215, 0); });
    ASSERT_TRUE(e);
    EXPECT_EQ(text(*e), "MsgQueue::Timeout MsgType: 0x1215 Timeout: 200ms)");
    EXPECT_EQ(e->timeoutMs, 200u);
    EXPECT_GE(Clock::now() - t0, milliseconds(190));
    // Without an awaited type silence is success.
    EXPECT_EQ(q.request(command(0x1208), 50, 0, 0), nullptr);
}

TEST(MsgQueueRequest, SecondCallerWaitsForTheFirstThenGetsItsOwnTime) {
    FakeBoard board;
    MsgQueue q(kAny, 512, 5);
    auto t0 = Clock::now();
    std::thread other([&] { EXPECT_THROW(q.request(command(2), 300, 3, 0), MsgQueue::Timeout); });
    std::this_thread::sleep_for(milliseconds(50));
    EXPECT_THROW(q.request(command(2), 300, 3, 0), MsgQueue::Timeout);
    other.join();
    EXPECT_GE(Clock::now() - t0, milliseconds(580));
}

TEST(MsgQueueReceivers, SecondRegistrationOfASourceIsRefusedAndKeepsTheFirst) {
    MsgQueue q(kAny, 512, 5);
    tolk::CompDesc_t src(9, 9, 9, 9, 9);
    auto* first = reinterpret_cast<tolk::AsyncMsgReceiver*>(0x10);
    q.RegisterAsyncMsgReceiver(src, first);
    try {
        q.RegisterAsyncMsgReceiver(src, reinterpret_cast<tolk::AsyncMsgReceiver*>(0x20));
        FAIL();
    } catch (const tolk::Exception& e) {
        EXPECT_EQ(text(e),
                  "Only One AsyncMsgReceiver can be registered for each source address on a "
                  "particular MsgQueue");
    }
    q.DeregisterAsyncMsgReceiver(src);
    EXPECT_THROW(q.DeregisterAsyncMsgReceiver(src), tolk::Exception);
    q.RegisterAsyncMsgReceiver(src, first);
    q.DeregisterAsyncMsgReceiver(src);
}

std::atomic<int> customCalls{0};

TEST(MsgQueueRouting, UnregisteredSourcePrintsTheBannerOnceUnlessItsHandlerIsReplaced) {
    FakeBoard board(always({{0x51, {}}, {3, {}}}));
    MsgQueue q(kAny, 512, 5);
    testing::internal::CaptureStderr();
    delete q.request(command(2), 5000, 3, 0);
    std::this_thread::sleep_for(milliseconds(100));
    std::string err = testing::internal::GetCapturedStderr();
    std::ostringstream expectHead;
    expectHead << "\n********************************************\nUnregistered Source sent to "
                  "MsgQueue "
               << q << "\nMsgType 81\n{MsgType: 0x51 Source: ";
    EXPECT_THAT(err, StartsWith(expectHead.str()));
    EXPECT_THAT(err, HasSubstr("}\nYou may specify your own handler for messages from "
                               "unregistered sources using\nMsgQueue::unregisteredSource\n"
                               "********************************************\n\n"));
    EXPECT_EQ(err.find("Unregistered Source", 100), std::string::npos);

    q.unregisteredSource([](MsgQueue&, Msg* m) {
        ++customCalls;
        delete m;
    });
    FakeBoard::send(kBoard, q.getHostDesc(), 0x42, 1, {});
    for (int i = 0; i < 200 && customCalls == 0; ++i) {
        std::this_thread::sleep_for(milliseconds(5));
    }
    EXPECT_EQ(customCalls.load(), 1);
}

// ---- a proxy's requests ----

// Short waits so that the time-out paths stay fast; knows type 0 as a CompAttr_t body.
class Proxy : public Addressable {
  public:
    Proxy(isa::RefPtr<MsgQueue>& q, unsigned int response, unsigned int errorWait)
        : Addressable(kBoard, q) {
        ResponseTimeout = response;
        ErrorWaitTime = errorWait;
    }
    MsgBody* MsgBodyLookup(unsigned int type) override {
        if (type == 0) {
            return new CompAttr_t();
        }
        return Addressable::MsgBodyLookup(type);
    }
};

TEST(AddressableRequest, RefusalBecomesUnexpectedMsgWithItsBodyAttached) {
    FakeBoard board(always({{0, {0, 0, 0, 8, 0, 0, 0, 3}}}));
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(q, 5000, 1000);
    CompAttr_t cmd(1, 1);
    auto e = raised<Addressable::UnexpectedMsg>([&] { p.request(0x08, &cmd, 0x09, nullptr); });
    ASSERT_TRUE(e);
    EXPECT_EQ(e->cmdType, 0x08u);
    EXPECT_EQ(e->addressable, &p);
    ASSERT_NE(e->msg, nullptr);
    EXPECT_NE(dynamic_cast<CompAttr_t*>(e->msg->getBodyDef()), nullptr);
    std::string t = text(*e);
    EXPECT_THAT(t, StartsWith("Addressable::UnexpectedMsg ObjSource: {TgtDesc: "));
    EXPECT_THAT(t, HasSubstr(" CmdMsgType 0x8 RespMsg: {MsgType: 0 Source: "));
    EXPECT_THAT(t, HasSubstr(" Body: {key 0x8 value 0x3}}"));
}

TEST(AddressableRequest, UnexpectedMsgMadeFromAReplyOwnsItAcrossCopies) {
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(q, 5000, 1000);
    auto* reply = new Msg(2u);
    reply->setMsgType(0x800001);
    tkMsgBody(reply->getMsgRef())[1] = 9;
    std::string printed;
    try {
        Addressable::UnexpectedMsg original(&p, 0x1214, reply);
        Addressable::UnexpectedMsg copy(original);
        throw copy;
    } catch (const MsgQueue::ErrorMsg& e) {
        // Both earlier copies are gone; the reply must still be there.
        EXPECT_EQ(e.msg, reply);
        EXPECT_EQ(e.queue, q.Get());
        printed = text(e);
    }
    // The text is the refusal's (tested above); the body shows the reply outlived the copies.
    EXPECT_THAT(printed, HasSubstr(" Body: {ByteData {0 0x9 }}}"));
}

TEST(AddressableRequest, SilenceRaisesTimeoutWithTypesAndTime) {
    FakeBoard board;
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(q, 150, 1000);
    CompAttr_t cmd(1, 1);
    auto e = raised<Addressable::Timeout>([&] { p.request(0x1214, &cmd, 0x1215, nullptr, 4242); });
    ASSERT_TRUE(e);
    std::ostringstream expect;
    expect << "Addressable::Timeout ObjSource: " << p
           << " CmdMsgType: 0x1214 RetMsgType: 0x1215 Trans: 4242 Timeout: 150ms";
    EXPECT_EQ(text(*e), expect.str());
    EXPECT_EQ(e->trans, 4242u);
    // The proxy stays usable.
    EXPECT_THROW(p.request(0x1214, &cmd, 0x1215, nullptr), tolk::Exception);
}

TEST(AddressableRequest, OneWayCommandReturnsAfterTheErrorWaitUnlessRefusedAtOnce) {
    for (int reply : {-1, 0, 0x800001}) {
        SCOPED_TRACE(reply);
        FakeBoard board(reply < 0 ? always({}) : always({{static_cast<unsigned int>(reply), {}}}));
        isa::RefPtr<MsgQueue> q = newQueue();
        Proxy p(q, 5000, reply < 0 ? 120 : 3000);
        CompAttr_t cmd(1, 1);
        auto t0 = Clock::now();
        if (reply < 0) {
            p.request(0x06, &cmd);
            EXPECT_GE(Clock::now() - t0, milliseconds(110));
            EXPECT_EQ(board.sent().size(), 1u);
        } else {
            EXPECT_THROW(p.request(0x06, &cmd), Addressable::UnexpectedMsg);
            EXPECT_LT(Clock::now() - t0, milliseconds(1500));
        }
    }
}

TEST(AddressableConstruction, EmptyQueueMakesAPrivateOneAndCopiesShareIt) {
    isa::RefPtr<MsgQueue> none;
    Addressable a(tolk::CompDesc_t(3, 1, 1, 18, 0), none);
    ASSERT_NE(a.getMsgQueue().Get(), nullptr);
    Addressable own(tolk::CompDesc_t(4, 1, 1, 18, 0));
    EXPECT_NE(own.getMsgQueue().Get(), a.getMsgQueue().Get());
    Addressable c(a);
    Addressable d(&a);
    EXPECT_EQ(c.getMsgQueue().Get(), a.getMsgQueue().Get());
    EXPECT_TRUE(c.getTgtDesc() == a.getTgtDesc());
    EXPECT_NE(c.getId(), a.getId());
    EXPECT_NE(d.getId(), c.getId());
    EXPECT_EQ(c.getResponseTimeout(), 5000u);
    EXPECT_EQ(c.getErrorWaitTime(), 1000u);
    std::ostringstream expect;
    expect << "{TgtDesc: " << a.getTgtDesc() << " HostDesc: " << a.getMsgQueue()->getHostDesc();
    EXPECT_EQ(text(a), expect.str());
}

// The catalogue's tables see the base lookups raise these; what they carry and print is theirs.
TEST(AddressableLookup, UndefinedBodiesCarryTheirNumberAndPrintTheirClass) {
    Addressable::UndefinedMsgBody msg(0x2B);
    EXPECT_EQ(msg.type, 0x2Bu);
    EXPECT_EQ(text(msg), "tolk::Addressable::UndefinedMsgBody");
    Addressable::UndefinedEvtBody evt(0x1230);
    EXPECT_EQ(evt.group, 0x1230u);
    EXPECT_EQ(text(evt), "tolk::Addressable::UndefinedEvtBody");
}

// ---- the dispatcher ----
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
};

std::mutex seenLock;
std::vector<Seen> seen;

void record(const std::string& who, unsigned int n, const std::string& body = "") {
    std::lock_guard<std::mutex> g(seenLock);
    seen.push_back({who, n, body});
}

std::size_t seenCount() {
    std::lock_guard<std::mutex> g(seenLock);
    return seen.size();
}

void clearSeen() {
    std::lock_guard<std::mutex> g(seenLock);
    seen.clear();
}

using Who = std::vector<std::string>;

// Who got each message so far, in order.
Who seenWho() {
    std::lock_guard<std::mutex> g(seenLock);
    Who who;
    for (const Seen& s : seen) {
        who.push_back(s.who);
    }
    return who;
}

void waitSeen(std::size_t n) {
    for (int i = 0; i < 400 && seenCount() < n; ++i) {
        std::this_thread::sleep_for(milliseconds(5));
    }
}

void msgA(Addressable*, Msg* m) {
    record("A", m->getMsgType());
    delete m;
}
void msgB(Addressable*, Msg* m) {
    record("B", m->getMsgType());
    delete m;
}
void bodyFn(Addressable*, unsigned int n, MsgBody* b) {
    std::string kind = dynamic_cast<tolk::MsgDefault_t*>(b)       ? "default"
                       : dynamic_cast<tolk::MsgEvtDetected_t*>(b) ? "evt"
                       : dynamic_cast<CountedEvt*>(b)             ? "counted"
                                                                  : "?";
    record("body", n, kind + text(*b));
    delete b;
}
void unregistered(Addressable*, Msg* m) {
    record("unregistered", m->getMsgType());
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
        record("member", m->getMsgType());
        delete m;
    }
};

class Dispatcher : public ::testing::Test {
  protected:
    Dispatcher() : queue(newQueue()), comp(kBoard, queue) { clearSeen(); }
    void send(unsigned int type, Bytes body = {}) {
        FakeBoard::send(kBoard, queue->getHostDesc(), type, 1, body);
    }
    static Bytes evt(unsigned int group, Bytes rest = {}) {
        // Group in front of the rest, built in place (GCC 12 misjudges an insert at the end
        // of a four-byte vector as out of bounds).
        rest.resize(rest.size() + 4);
        std::rotate(rest.rbegin(), rest.rbegin() + 4, rest.rend());
        for (int i = 0; i < 4; ++i) {
            rest[i] = static_cast<std::uint8_t>(group >> (24 - 8 * i));
        }
        return rest;
    }

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
    EXPECT_EQ(seenWho(), (Who{"A", "B", "member"}));
}

TEST_F(Dispatcher, BodiesGoByTypeAndEventsByGroupWithFallBacks) {
    comp.asyncRegisterMsgType(0x52, bodyFn, 0);
    comp.asyncRegisterEvtGroup(0x1299, bodyFn, 0);
    comp.asyncUnregisteredEvtGroup(unregistered, 0);
    send(0x52, {7, 8});
    send(0x20, evt(0x1299, {5}));
    send(0x20, evt(0x1300));
    waitSeen(3);
    ASSERT_EQ(seenWho(), (Who{"body", "body", "unregistered"}));
    // A type without a body of its own is read as bytes.
    EXPECT_EQ(seen[0].number, 0x52u);
    EXPECT_EQ(seen[0].body, "default{ByteData {7 8 }}");
    EXPECT_EQ(seen[1].number, 0x20u);
    EXPECT_EQ(seen[1].body, "evt{EvtGroup 4761 Data {5}}");
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
    EXPECT_EQ(seenWho(), (Who{"A", "unregistered"}));
}

TEST_F(Dispatcher, CancelOfAnUnknownNumberRaisesAndLeavesTheLockFree) {
    comp.asyncRegisterMsgType(0x55, msgA, 0);
    EXPECT_THROW(comp.asyncCancelMsgType(0x56), tolk::Exception);
    EXPECT_THROW(comp.asyncCancelEvtGroup(0x56, msgA, 0), tolk::Exception);
    Component fresh(kBoard, queue);
    EXPECT_NO_THROW(fresh.asyncCancelMsgType(0x55));  // no dispatcher yet: nothing to cancel
    comp.asyncRegisterMsgType(0x57, msgB, 0);
    send(0x57);
    waitSeen(1);
    EXPECT_EQ(seenWho(), Who{"B"});
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
    ASSERT_EQ(seenWho(), (Who{"body", "A"}));
    EXPECT_EQ(seen[0].body, "counted{CountedEvt 1}");
}

TEST_F(Dispatcher, MsgWaitReturnsTheMessageAndTimesOutWithoutOne) {
    std::thread later([this] {
        std::this_thread::sleep_for(milliseconds(50));
        send(0x5C, {4});
    });
    Msg* m = comp.asyncWaitMsgMsg(0x5C, 3000);
    later.join();
    ASSERT_NE(m, nullptr);
    EXPECT_EQ(m->getMsgType(), 0x5Cu);
    delete m;
    auto t = raised<EvtCallback::MsgWait::Timeout>([&] { comp.asyncWaitMsg(0x5D, nullptr, 50); });
    ASSERT_TRUE(t);
    EXPECT_EQ(t->number, 0x5Du);
    EXPECT_EQ(t->timeoutMs, 50u);
    // The entry is gone once the wait has fired: the next 0x5C is unregistered.
    comp.asyncUnregisteredMsgType(unregistered, 0);
    send(0x5C);
    waitSeen(1);
    EXPECT_EQ(seenWho(), Who{"unregistered"});
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
TEST_F(Dispatcher, FailuresAreReportedOnceAndLaterMessagesStillArrive) {
    const struct {
        unsigned int type;
        void (*registerFailing)(Addressable&);
        std::string report;
        Who reached;
    } rows[] = {
        {0x5A,
         [](Addressable& a) {
             a.asyncRegisterMsgType(0x5A, throwing, 0);
             a.asyncRegisterMsgType(0x5A, msgA, 0);
         },
         "EvtCallback_Class(138) TOLK Exception caught from callback handler thread\n"
         "callback failed\n",
         {"A", "B"}},
        {0x5A,
         [](Addressable& a) {
             a.asyncRegisterMsgType(0x5A, throwingOther, 0);
             a.asyncRegisterMsgType(0x5A, msgA, 0);
         },
         "EvtCallback_Class(147) general Exception caught from callback handler thread\n",
         {"A", "B"}},
        // An exception other than the framework's while making the body.
        {0x5E,
         [](Addressable& a) { a.asyncRegisterMsgType(0x5E, bodyFn, 0); },
         "EvtCallback_Class(330) tolk internal error\n",
         {"B"}},
        {0x5F,
         [](Addressable& a) { a.asyncUnregisteredMsgType(throwingOther, 0); },
         "EvtCallback_Class(147) general Exception caught from callback handler thread\n",
         {"B"}},
    };
    for (const auto& c : rows) {
        SCOPED_TRACE(c.report);
        clearSeen();
        Component fresh(kBoard, queue);
        c.registerFailing(fresh);
        fresh.asyncRegisterMsgType(0x5B, msgB, 0);
        testing::internal::CaptureStderr();
        send(c.type);
        send(0x5B);
        waitSeen(c.reached.size());
        EXPECT_EQ(testing::internal::GetCapturedStderr(), c.report);
        EXPECT_EQ(seenWho(), c.reached);
    }
}

}  // namespace
