#include "transport/TKSMsgQueue.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "ScriptedRelay.h"
#include "platform/tkhost/tkhost_switch.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr unsigned int kCommand = 0x1214;
constexpr unsigned int kCompletion = 0x1215;
constexpr unsigned int kMarker = 0x7777;

// Restores the two variables that choose the transport.
class EnvGuard {
  public:
    EnvGuard() : remote(get("REMOTE_TKHOST")), host(get("HOST")) {}
    ~EnvGuard() {
        set("REMOTE_TKHOST", remote);
        set("HOST", host);
    }
    static void set(const char* name, const std::optional<std::string>& v) {
        if (v) {
            setenv(name, v->c_str(), 1);
        } else {
            unsetenv(name);
        }
    }

  private:
    static std::optional<std::string> get(const char* name) {
        const char* v = std::getenv(name);
        return v ? std::optional<std::string>(v) : std::nullopt;
    }
    std::optional<std::string> remote, host;
};

// Collects what the reader routes to the callback.
class Receiver : public TKSAsyncMsgReceiver {
  public:
    int receive(TKSMsgRef& ref) {
        std::lock_guard<std::mutex> lk(m);
        types.push_back(ref.getMsgType());
        if (ref.getMsgType() == 0xBAD) {
            ref.free();
            throw std::runtime_error("receiver failed");
        }
        ref.free();
        cv.notify_all();
        return 1;
    }
    // Waits until the marker has come through: everything sent before it has been routed.
    std::vector<unsigned int> untilMarker() {
        std::unique_lock<std::mutex> lk(m);
        cv.wait_for(lk, 5s, [this] { return !types.empty() && types.back() == kMarker; });
        std::vector<unsigned int> out(types.begin(), types.end());
        if (!out.empty() && out.back() == kMarker) {
            out.pop_back();
        }
        types.clear();
        return out;
    }

  private:
    std::mutex m;
    std::condition_variable cv;
    std::vector<unsigned int> types;
};

// A component at a raw local queue that answers by script.
struct Peer {
    TKQueueHandle q = tkQueueOpen();
    TKCompDesc addr{};
    Peer() { EXPECT_EQ(TK_OK, tkQueueBind(q, &addr)); }
    ~Peer() {
        tkQueueUnbind(q, addr);
        tkQueueClose(q);
    }
    TKMsg32Bit* readOne() {
        TKMsg32Bit* m = nullptr;
        tkMsgRead(q, 0, &m);
        return m;
    }
    void send(TKCompDesc to, TKCompDesc from, unsigned int trans, unsigned int type) {
        TKMsg32Bit* m = nullptr;
        tkMsgAllocate(4, &m);
        tkMsgFieldPut(m, TK_FIELD_TGT, &to);
        tkMsgFieldPut(m, TK_FIELD_SRC, &from);
        tkMsgFieldPut(m, TK_FIELD_TRANS, &trans);
        m->type = type;
        tkMsgWrite(q, m, 0);
    }
};

TKSMsgRef makeRequest(TKCompDesc target, unsigned int trans) {
    TKSMsgRef r(4u);
    r.setMsgType(kCommand);
    r.setTrans(trans);
    r.setTgtAddr(target);
    return r;
}

class LocalQueue : public ::testing::Test {
  protected:
    void SetUp() override {
        unsetenv("REMOTE_TKHOST");
        queue = std::make_unique<TKSMsgQueue>(TKCompDesc{}, 512, 5, nullptr);
        queue->registerAsyncCallback(&receiver, static_cast<TKSAsyncMethod>(&Receiver::receive));
    }
    void TearDown() override { queue.reset(); }
    void sendMarker() { peer.send(queue->getHostDesc(), peer.addr, 1, kMarker); }

    EnvGuard env;
    Receiver receiver;
    Peer peer;
    std::unique_ptr<TKSMsgQueue> queue;
};

struct Answer {
    int transDelta;  // added to the request's transaction id
    unsigned int type;
    bool fromTarget;  // else from another address
};

struct RoutingCase {
    const char* name;
    std::vector<Answer> answers;
    int anySource;
    int replyIndex;  // which answer the request returns; -1 for a time-out
};

class Routing : public LocalQueue, public ::testing::WithParamInterface<RoutingCase> {};

TEST_P(Routing, TellsTheReplyFromTheRest) {
    const RoutingCase& c = GetParam();
    const unsigned int trans = 0x10000 + 5;
    TKCompDesc other = peer.addr;
    other.instance ^= 0x8000;
    std::thread responder([&] {
        TKMsg32Bit* req = peer.readOne();
        ASSERT_NE(nullptr, req);
        TKCompDesc src{};
        tkMsgFieldGet(req, TK_FIELD_SRC, &src);
        EXPECT_TRUE(src == queue->getHostDesc()) << "the request carries the queue's address";
        tkMsgFree(req);
        for (const Answer& a : c.answers) {
            peer.send(queue->getHostDesc(), a.fromTarget ? peer.addr : other, trans + a.transDelta,
                      a.type);
        }
    });
    TKSMsgRef req = makeRequest(peer.addr, trans);
    unsigned int timeout = c.replyIndex < 0 ? 150 : 5000;
    TKSMsgRef reply = queue->request(req, timeout, kCompletion, c.anySource);
    responder.join();
    sendMarker();
    std::vector<unsigned int> routed = receiver.untilMarker();

    std::vector<unsigned int> expectRouted;
    for (std::size_t i = 0; i < c.answers.size(); ++i) {
        if (static_cast<int>(i) != c.replyIndex) {
            expectRouted.push_back(c.answers[i].type);
        }
    }
    if (c.replyIndex < 0) {
        EXPECT_EQ(nullptr, reply.getMsgRef());
    } else {
        ASSERT_NE(nullptr, reply.getMsgRef());
        EXPECT_EQ(c.answers[c.replyIndex].type, reply.getMsgType());
        reply.free();
    }
    EXPECT_EQ(expectRouted, routed);
}

INSTANTIATE_TEST_SUITE_P(
    Rules, Routing,
    ::testing::Values(
        RoutingCase{"AwaitedType", {{0, kCompletion, true}}, 0, 0},
        RoutingCase{"ErrorTypeZero", {{0, 0, true}}, 0, 0},
        RoutingCase{"ResourceError", {{0, 0x800001, true}}, 0, 0},
        RoutingCase{"OtherTransFirst", {{1, kCompletion, true}, {0, kCompletion, true}}, 0, 1},
        RoutingCase{"OtherTypeIsNoReply", {{0, 0x1300, true}}, 0, -1},
        RoutingCase{"OtherSourceIsNoReply", {{0, kCompletion, false}}, 0, -1},
        RoutingCase{"AnySourceTakesOtherSource", {{0, kCompletion, false}}, 1, 0},
        RoutingCase{"EventBeforeReply", {{0, 0x20, true}, {0, 0x800001, true}}, 0, 1},
        RoutingCase{
            "SecondMatchGoesToCallback", {{0, kCompletion, true}, {0, kCompletion, true}}, 0, 0}),
    [](const ::testing::TestParamInfo<RoutingCase>& i) { return std::string(i.param.name); });

TEST_F(LocalQueue, TransactionIdIsMatchedOn24Bits) {
    std::thread responder([&] {
        tkMsgFree(peer.readOne());
        peer.send(queue->getHostDesc(), peer.addr, 0x000005, kCompletion);
    });
    TKSMsgRef req = makeRequest(peer.addr, 0x1000005);
    TKSMsgRef reply = queue->request(req, 5000, kCompletion, 0);
    responder.join();
    ASSERT_NE(nullptr, reply.getMsgRef());
    reply.free();
}

TEST_F(LocalQueue, ReplyWakesTheCallerWithoutWaitingOutTheTimeOut) {
    std::thread responder([&] {
        tkMsgFree(peer.readOne());
        peer.send(queue->getHostDesc(), peer.addr, 9, kCompletion);
    });
    TKSMsgRef req = makeRequest(peer.addr, 9);
    auto t0 = Clock::now();
    TKSMsgRef reply = queue->request(req, 5000, kCompletion, 0);
    auto took = Clock::now() - t0;
    responder.join();
    ASSERT_NE(nullptr, reply.getMsgRef());
    EXPECT_LT(took, 2500ms);
    reply.free();
}

TEST_F(LocalQueue, ReplyAfterTheTimeOutGoesToTheCallback) {
    std::atomic<bool> gaveUp{false};
    std::thread responder([&] {
        tkMsgFree(peer.readOne());
        while (!gaveUp.load()) {
            std::this_thread::sleep_for(1ms);
        }
        std::this_thread::sleep_for(1ms);
        peer.send(queue->getHostDesc(), peer.addr, 11, kCompletion);
        sendMarker();
    });
    TKSMsgRef req = makeRequest(peer.addr, 11);
    TKSMsgRef reply = queue->request(req, 50, kCompletion, 0);
    gaveUp = true;
    EXPECT_EQ(nullptr, reply.getMsgRef());
    EXPECT_EQ(std::vector<unsigned int>({kCompletion}), receiver.untilMarker());
    responder.join();
}

TEST_F(LocalQueue, ZeroTimeOutSendsAndReturnsAnEmptyMessage) {
    TKSMsgRef req = makeRequest(peer.addr, 12);
    TKSMsgRef r = queue->request(req, 0, 0, 0);
    ASSERT_NE(nullptr, r.getMsgRef());
    EXPECT_EQ(0u, r.getSize());
    r.free();
    TKMsg32Bit* got = peer.readOne();
    ASSERT_NE(nullptr, got);
    EXPECT_EQ(kCommand, got->type);
    tkMsgFree(got);
}

TEST_F(LocalQueue, UndeliverableRequestTimesOutWithoutLeaking) {
    tkSwitchResetUndeliverableCount();
    TKCompDesc nowhere{};
    nowhere.board = 31;
    TKSMsgRef req = makeRequest(nowhere, 13);
    TKSMsgRef r = queue->request(req, 30, kCompletion, 0);
    EXPECT_EQ(nullptr, r.getMsgRef());
    EXPECT_EQ(1u, tkSwitchUndeliverableCount());
}

TEST_F(LocalQueue, CallbackExceptionIsReportedAndTheQueueGoesOn) {
    testing::internal::CaptureStderr();
    peer.send(queue->getHostDesc(), peer.addr, 1, 0xBAD);
    peer.send(queue->getHostDesc(), peer.addr, 1, 0x21);
    sendMarker();
    std::vector<unsigned int> routed = receiver.untilMarker();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(std::vector<unsigned int>({0xBAD, 0x21}), routed);
    EXPECT_NE(std::string::npos, err.find("0xbad")) << err;
    EXPECT_NE(std::string::npos, err.find("receiver failed")) << err;
    EXPECT_EQ(1u, queue->callbackFailures());
}

TEST(LocalQueueLifecycle, DestructionEndsTheReaderThroughTheSelfMessage) {
    EnvGuard env;
    unsetenv("REMOTE_TKHOST");
    for (int i = 0; i < 20; ++i) {
        auto q = std::make_unique<TKSMsgQueue>(TKCompDesc{}, 512, 5, nullptr);
        TKCompDesc addr = q->getHostDesc();
        EXPECT_TRUE(tkSwitchIsBound(addr));
        q.reset();
        EXPECT_FALSE(tkSwitchIsBound(addr));
    }
}

TEST(LocalQueueLifecycle, BlocksBeforeAnyCallbackWaitInThePickupSlot) {
    EnvGuard env;
    unsetenv("REMOTE_TKHOST");
    TKSMsgQueue q(TKCompDesc{}, 512, 5, nullptr);
    Peer peer;
    peer.send(q.getHostDesc(), peer.addr, 1, 0x31);
    peer.send(q.getHostDesc(), peer.addr, 1, 0x32);
    TKSMsgRef first = q.pickup(5000);
    ASSERT_NE(nullptr, first.getMsgRef());
    EXPECT_EQ(0x31u, first.getMsgType());
    first.free();
    TKSMsgRef second = q.pickup(5000);
    ASSERT_NE(nullptr, second.getMsgRef());
    EXPECT_EQ(0x32u, second.getMsgType());
    second.free();
    // A third block parks the reader on the full slot; destruction must still end it.
    peer.send(q.getHostDesc(), peer.addr, 1, 0x33);
    peer.send(q.getHostDesc(), peer.addr, 1, 0x34);
}

TEST(LocalQueueLifecycle, CallbackRegisteredWhileTheSlotIsFullGetsWhatComesNext) {
    EnvGuard env;
    unsetenv("REMOTE_TKHOST");
    TKSMsgQueue q(TKCompDesc{}, 512, 5, nullptr);
    Peer peer;
    // The first fills the pickup slot; the reader holds the second, waiting for room.
    peer.send(q.getHostDesc(), peer.addr, 1, 0x31);
    peer.send(q.getHostDesc(), peer.addr, 1, 0x32);
    std::this_thread::sleep_for(50ms);
    Receiver receiver;
    q.registerAsyncCallback(&receiver, static_cast<TKSAsyncMethod>(&Receiver::receive));
    peer.send(q.getHostDesc(), peer.addr, 1, kMarker);
    std::vector<unsigned int> got = receiver.untilMarker();
    ASSERT_FALSE(got.empty()) << "the reader stayed parked on the full slot";
    EXPECT_EQ(0x32u, got.back());
}

TEST(LocalQueueLifecycle, OutOfDescriptorsIsACreationError) {
    EnvGuard env;
    unsetenv("REMOTE_TKHOST");
    TKSMsgQueue first(TKCompDesc{}, 512, 5, nullptr);
    tkSwitchSetQueueLimit(1);
    EXPECT_THROW(TKSMsgQueue(TKCompDesc{}, 512, 5, nullptr), TKSMsgQueue::CreationError);
    tkSwitchSetQueueLimit(0);
}

struct EnvCase {
    const char* name;
    const char* remote;  // null: unset; "@": the scripted relay's address
    const char* host;
    bool expectRemote;
};

class TransportChoice : public ::testing::TestWithParam<EnvCase> {};

TEST_P(TransportChoice, FollowsRemoteTkhostAndHost) {
    const EnvCase& c = GetParam();
    EnvGuard env;
    std::unique_ptr<ScriptedRelay> relay;
    if (c.expectRemote) {
        relay = std::make_unique<ScriptedRelay>([](sock& conn) {
            if (ScriptedRelay::acceptOpen(conn)) {
                ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
            }
        });
    }
    std::string remote = c.remote == nullptr ? "" : c.remote;
    if (relay && remote == "@") {
        remote = relay->address();
    }
    EnvGuard::set("REMOTE_TKHOST", c.remote ? std::optional<std::string>(remote) : std::nullopt);
    EnvGuard::set("HOST", c.host ? std::optional<std::string>(c.host) : std::nullopt);
    TKSMsgQueue q(TKCompDesc{}, 512, 5, nullptr);
    if (c.expectRemote) {
        EXPECT_TRUE(q.getHostDesc() == ScriptedRelay::assignedAddress());
    } else {
        EXPECT_EQ(TK_HOST_BOARD, q.getHostDesc().board);
        EXPECT_TRUE(tkSwitchIsBound(q.getHostDesc()));
    }
}

INSTANTIATE_TEST_SUITE_P(
    Environment, TransportChoice,
    ::testing::Values(EnvCase{"Unset", nullptr, "somehost", false},
                      EnvCase{"SameHost", "myhost", "myhost", false},
                      EnvCase{"NameBeginsWithHost", "myhost.example:7000", "myhost", false},
                      EnvCase{"HostUnset", "@", nullptr, true},
                      EnvCase{"OtherHost", "@", "myhost", true}),
    [](const ::testing::TestParamInfo<EnvCase>& i) { return std::string(i.param.name); });

TEST(TransportChoice, UnreachableRelayIsACreationErrorWithTheHostName) {
    EnvGuard env;
    unsetenv("HOST");
    sock probe(inet_addr("127.0.0.1"), 0);
    ASSERT_EQ(0, probe.bind());
    std::string where = "127.0.0.1:" + std::to_string(probe.localPort());
    probe.close();
    try {
        TKSMsgQueue q(TKCompDesc{}, 512, 5, where.c_str());
        FAIL() << "no CreationError";
    } catch (const TKSMsgQueue::CreationError& e) {
        EXPECT_EQ(where, e.getHostName());
    }
}

TEST(TransportChoice, HostNameInTheErrorIsCutTo99Characters) {
    std::string longName(150, 'h');
    TKSMsgQueue::CreationError e(longName.c_str());
    EXPECT_EQ(std::string(99, 'h'), e.getHostName());
}

}  // namespace
