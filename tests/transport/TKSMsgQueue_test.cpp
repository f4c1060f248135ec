#include "transport/TKSMsgQueue.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <functional>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "CompDesc.h"
#include "ScriptedRelay.h"
#include "platform/tkhost/tkhost_switch.h"
#include "transport/TKSRemoteMsgQueue.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;
using ::testing::HasSubstr;

constexpr unsigned int kCommand = 0x1214;
constexpr unsigned int kCompletion = 0x1215;
constexpr unsigned int kMarker = 0x7777;

// Each test sets the two variables that choose the transport before it opens a queue.
void setEnv(const char* name, const char* value) {
    if (value != nullptr) {
        setenv(name, value, 1);
    } else {
        unsetenv(name);
    }
}

// Collects what the reader routes to the callback, whichever transport feeds it.
class Receiver : public TKSAsyncMsgReceiver {
  public:
    int receive(TKSMsgRef& ref) {
        std::lock_guard<std::mutex> lk(m);
        types.push_back(ref.getMsgType());
        ref.free();
        cv.notify_all();
        if (types.back() == 0xBAD) {
            throw std::runtime_error("receiver failed");
        }
        return 1;
    }
    void listenTo(TKSMsgQueue& q) {
        q.registerAsyncCallback(this, static_cast<TKSAsyncMethod>(&Receiver::receive));
    }
    // Waits until the marker has come through: everything sent before it has been routed.
    std::vector<unsigned int> untilMarker() {
        std::unique_lock<std::mutex> lk(m);
        cv.wait_for(lk, 5s, [this] { return !types.empty() && types.back() == kMarker; });
        std::vector<unsigned int> out = std::exchange(types, {});
        if (!out.empty() && out.back() == kMarker) {
            out.pop_back();
        }
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
        setEnv("REMOTE_TKHOST", nullptr);
        queue = std::make_unique<TKSMsgQueue>(TKCompDesc{}, 512, 5, nullptr);
        receiver.listenTo(*queue);
    }
    void sendMarker() { peer.send(queue->getHostDesc(), peer.addr, 1, kMarker); }

    Receiver receiver;
    Peer peer;
    std::unique_ptr<TKSMsgQueue> queue;
};

struct Answer {
    int transDelta;  // added to the request's transaction id
    unsigned int type;
    bool fromTarget;  // else from another address
};

TEST_F(LocalQueue, RequestTellsTheReplyFromWhatGoesToTheCallback) {
    struct {
        std::vector<Answer> answers;
        int anySource;
        int replyIndex;  // which answer the request returns; -1 for a time-out
        unsigned int trans = 0x10005;
    } const cases[] = {
        {{{0, kCompletion, true}}, 0, 0},
        {{{0, 0, true}}, 0, 0},         // the error type
        {{{0, 0x800001, true}}, 0, 0},  // a service's resource error
        {{{1, kCompletion, true}, {0, kCompletion, true}}, 0, 1},
        {{{0, 0x1300, true}}, 0, -1},
        {{{0, kCompletion, false}}, 0, -1},
        {{{0, kCompletion, false}}, 1, 0},  // any source
        {{{0, 0x20, true}, {0, 0x800001, true}}, 0, 1},
        {{{0, kCompletion, true}, {0, kCompletion, true}}, 0, 0},
        {{{0, kCompletion, true}}, 0, 0, 0x1000005},  // the id has 24 bits
    };
    TKCompDesc other = peer.addr;
    other.instance ^= 0x8000;
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << "answers " << c.answers.size() << ", first type "
                                        << c.answers[0].type << ", reply " << c.replyIndex);
        std::thread responder([&] {
            TKMsg32Bit* req = peer.readOne();
            ASSERT_NE(nullptr, req);
            TKCompDesc src{};
            tkMsgFieldGet(req, TK_FIELD_SRC, &src);
            EXPECT_TRUE(src == queue->getHostDesc()) << "the request carries the queue's address";
            tkMsgFree(req);
            for (const Answer& a : c.answers) {
                peer.send(queue->getHostDesc(), a.fromTarget ? peer.addr : other,
                          (c.trans & 0xFFFFFF) + a.transDelta, a.type);
            }
        });
        TKSMsgRef req = makeRequest(peer.addr, c.trans);
        auto t0 = Clock::now();
        TKSMsgRef reply =
            queue->request(req, c.replyIndex < 0 ? 150 : 5000, kCompletion, c.anySource);
        auto took = Clock::now() - t0;
        responder.join();
        sendMarker();
        std::vector<unsigned int> expectRouted;
        for (std::size_t i = 0; i < c.answers.size(); ++i) {
            if (static_cast<int>(i) != c.replyIndex) {
                expectRouted.push_back(c.answers[i].type);
            }
        }
        EXPECT_EQ(expectRouted, receiver.untilMarker());
        if (c.replyIndex < 0) {
            EXPECT_EQ(nullptr, reply.getMsgRef());
            continue;
        }
        ASSERT_NE(nullptr, reply.getMsgRef());
        EXPECT_EQ(c.answers[c.replyIndex].type, reply.getMsgType());
        // The reply wakes the caller: no waiting out the time-out.
        EXPECT_LT(took, 2500ms);
        reply.free();
    }
}

TEST_F(LocalQueue, ReplyAfterTheTimeOutGoesToTheCallback) {
    std::atomic<bool> gaveUp{false};
    std::thread responder([&] {
        tkMsgFree(peer.readOne());
        while (!gaveUp.load()) {
            std::this_thread::sleep_for(1ms);
        }
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
    TKSMsgRef req = makeRequest(compDesc(0, 31), 13);
    EXPECT_EQ(nullptr, queue->request(req, 30, kCompletion, 0).getMsgRef());
    EXPECT_EQ(1u, tkSwitchUndeliverableCount());
}

TEST_F(LocalQueue, CallbackExceptionIsReportedAndTheQueueGoesOn) {
    testing::internal::CaptureStderr();
    peer.send(queue->getHostDesc(), peer.addr, 1, 0xBAD);
    peer.send(queue->getHostDesc(), peer.addr, 1, 0x21);
    sendMarker();
    EXPECT_EQ(std::vector<unsigned int>({0xBAD, 0x21}), receiver.untilMarker());
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_THAT(err, HasSubstr("0xbad"));
    EXPECT_THAT(err, HasSubstr("receiver failed"));
    EXPECT_EQ(1u, queue->callbackFailures());
}

TEST(LocalQueueLifecycle, BlocksBeforeAnyCallbackWaitInThePickupSlotUntilOneIsRegistered) {
    setEnv("REMOTE_TKHOST", nullptr);
    auto q = std::make_unique<TKSMsgQueue>(TKCompDesc{}, 512, 5, nullptr);
    const TKCompDesc addr = q->getHostDesc();
    Peer peer;
    for (unsigned int type : {0x31u, 0x32u, 0x33u}) {
        peer.send(addr, peer.addr, 1, type);
    }
    for (unsigned int type : {0x31u, 0x32u}) {
        TKSMsgRef got = q->pickup(5000);
        ASSERT_NE(nullptr, got.getMsgRef());
        EXPECT_EQ(type, got.getMsgType());
        got.free();
    }
    // 0x33 fills the slot; the reader holds 0x34, waiting for room, until a callback comes.
    peer.send(addr, peer.addr, 1, 0x34);
    std::this_thread::sleep_for(50ms);
    Receiver receiver;
    receiver.listenTo(*q);
    peer.send(addr, peer.addr, 1, kMarker);
    std::vector<unsigned int> got = receiver.untilMarker();
    ASSERT_FALSE(got.empty()) << "the reader stayed parked on the full slot";
    EXPECT_EQ(0x34u, got.back());
    // Destruction ends the reader through its message to itself and gives the address back.
    q.reset();
    EXPECT_FALSE(tkSwitchIsBound(addr));
}

TEST(LocalQueueLifecycle, OutOfDescriptorsIsACreationError) {
    setEnv("REMOTE_TKHOST", nullptr);
    TKSMsgQueue first(TKCompDesc{}, 512, 5, nullptr);
    tkSwitchSetQueueLimit(1);
    EXPECT_THROW(TKSMsgQueue(TKCompDesc{}, 512, 5, nullptr), TKSMsgQueue::CreationError);
    tkSwitchSetQueueLimit(0);
}

TEST(TransportChoice, FollowsRemoteTkhostAndHost) {
    // REMOTE_TKHOST: null for unset, "@" for the scripted relay's address.
    struct {
        const char* remote;
        const char* host;
        bool expectRemote;
    } const cases[] = {
        {nullptr, "somehost", false},
        {"myhost", "myhost", false},
        {"myhost.example:7000", "myhost", false},  // the name begins with HOST
        {"@", nullptr, true},
        {"@", "myhost", true},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message()
                     << (c.remote ? c.remote : "unset") << " on " << (c.host ? c.host : "unset"));
        std::unique_ptr<ScriptedRelay> relay;
        std::string remote = c.remote ? c.remote : "";
        if (c.expectRemote) {
            relay = std::make_unique<ScriptedRelay>([](sock& conn) {
                if (ScriptedRelay::acceptOpen(conn)) {
                    ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
                }
            });
            remote = relay->address();
        }
        setEnv("REMOTE_TKHOST", c.remote ? remote.c_str() : nullptr);
        setEnv("HOST", c.host);
        TKSMsgQueue q(TKCompDesc{}, 512, 5, nullptr);
        if (c.expectRemote) {
            EXPECT_TRUE(q.getHostDesc() == ScriptedRelay::assignedAddress());
        } else {
            EXPECT_EQ(TK_HOST_BOARD, q.getHostDesc().board);
            EXPECT_TRUE(tkSwitchIsBound(q.getHostDesc()));
        }
    }
}

TEST(TransportChoice, UnreachableRelayIsACreationErrorWithTheHostName) {
    setEnv("HOST", nullptr);
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
    EXPECT_EQ(std::string(99, 'h'),
              TKSMsgQueue::CreationError(std::string(150, 'h').c_str()).getHostName());
    TKSRemoteService_ComFailure f(std::string(120, 'r').c_str(), 6554);
    EXPECT_EQ(std::string(99, 'r'), f.getHostName());
    EXPECT_EQ(6554, f.getPort());
}

// --- Over a relay ---

TKMsg32Bit* blockFor(TKCompDesc to, unsigned int type, unsigned int trans, unsigned int size) {
    TKMsg32Bit* b = nullptr;
    tkMsgAllocate(size, &b);
    tkMsgFieldPut(b, TK_FIELD_TGT, &to);
    b->type = type;
    b->transTag = trans << 8;
    for (unsigned int i = 0; i < size; ++i) {
        tkMsgBody(b)[i] = static_cast<unsigned char>(i + 1);
    }
    return b;
}

TKSMsgQueue* openQueue(const ScriptedRelay& relay) {
    return new TKSMsgQueue(compDesc(0x0506, 2, 3, 4, 1), 512, 5, relay.address().c_str());
}

void discard(sock&, TKMsg32Bit* b) {
    tkMsgFree(b);
}

Bytes frame(std::uint32_t type, std::uint32_t size, std::uint32_t exSize, Bytes rest) {
    Bytes b = frameHeader(type, size, exSize);
    b.insert(b.end(), rest.begin(), rest.end());
    return b;
}

// What the relay sends after the open, then a good event: the good one must arrive.
TEST(RemoteQueue, BadFrameIsDroppedAndTheNextOneArrives) {
    struct {
        Bytes junk;
        const char* line;
    } const cases[] = {
        {frame(TKS_FRAME_MESSAGE, 102401, 0, Bytes(102401, 0x42)),
         "Error communicating with remote message queue on "},
        {frame(4242, 4, 0, {1, 2, 3, 4}), "Discarding"},
        // Any frame that makes no block; which frames those are is the frame reader's to say.
        {frame(TKS_FRAME_MESSAGE, 8, 0, Bytes(8, 0)), "Discarding"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(golden::hex(Bytes(c.junk.begin(), c.junk.begin() + 20)));
        std::atomic<bool> registered{false};
        ScriptedRelay relay([&](sock& conn) {
            ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
            // Until the callback is registered, blocks would wait in the pickup slot instead.
            while (!registered.load()) {
                std::this_thread::sleep_for(1ms);
            }
            ScriptedRelay::sendRaw(conn, c.junk);
            ScriptedRelay::sendBlock(conn,
                                     blockFor(ScriptedRelay::assignedAddress(), kMarker, 1, 4));
            ScriptedRelay::serve(conn, discard);
        });
        testing::internal::CaptureStderr();
        Receiver inbox;
        {
            std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
            inbox.listenTo(*q);
            registered = true;
            EXPECT_EQ(std::vector<unsigned int>{}, inbox.untilMarker());
            EXPECT_FALSE(q->transportFailed());
        }
        relay.join();
        EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr(c.line));
    }
}

struct RelayEvents {
    std::mutex m;
    std::vector<std::string> seen;
    static RelayEvents& get() {
        static RelayEvents* events = [] {
            auto* e = new RelayEvents;
            TKSMsgQueue::addRelayListener([e](bool cut, const std::string& relay) {
                std::lock_guard<std::mutex> lk(e->m);
                e->seen.push_back((cut ? "cut off from " : "back to ") + relay);
            });
            return e;
        }();
        return *events;
    }
    std::vector<std::string> take() {
        std::lock_guard<std::mutex> lk(m);
        return std::exchange(seen, {});
    }
};

bool waitUntil(const std::function<bool()>& done, std::chrono::milliseconds limit) {
    auto deadline = Clock::now() + limit;
    while (!done()) {
        if (Clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(2ms);
    }
    return true;
}

TKCompDesc secondAddress() {
    TKCompDesc d = ScriptedRelay::assignedAddress();
    d.instance = 0x4322;
    return d;
}

// The relay breaks the first connection in the middle of a frame, and answers the second
// connection's open only when the test lets it: meanwhile the queue is cut off.
TEST(RemoteReconnect, LostConnectionComesBackWithItsNewAddressAndRequestsFailAtOnceMeanwhile) {
    RelayEvents::get().take();
    Bytes openBody;
    std::mutex m;
    std::condition_variable cv;
    bool answerOpen = false;
    ScriptedRelay relay(
        [&](sock& conn, int index) {
            if (index == 0) {
                ASSERT_TRUE(ScriptedRelay::acceptOpen(conn, &openBody));
                ScriptedRelay::sendRaw(conn, frame(TKS_FRAME_MESSAGE, 56, 10, Bytes(30, 0)));
                return;
            }
            {
                std::unique_lock<std::mutex> lk(m);
                cv.wait_for(lk, 10s, [&] { return answerOpen; });
            }
            ASSERT_TRUE(ScriptedRelay::acceptOpen(conn, nullptr, secondAddress()));
            ScriptedRelay::serve(conn, [](sock& c, TKMsg32Bit* b) {
                // The answer goes back to whoever asked, from whom it asked.
                TKCompDesc from{};
                TKCompDesc to{};
                tkMsgFieldGet(b, TK_FIELD_TGT, &from);
                tkMsgFieldGet(b, TK_FIELD_SRC, &to);
                TKMsg32Bit* reply = blockFor(to, b->type + 1, b->transTag >> 8, 0);
                tkMsgFieldPut(reply, TK_FIELD_SRC, &from);
                tkMsgFree(b);
                ScriptedRelay::sendBlock(c, reply);
            });
        },
        2);
    testing::internal::CaptureStderr();
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    ASSERT_TRUE(waitUntil([&] { return q->transportFailed(); }, 5s));
    for (unsigned int type : {kCommand, 0x1216u}) {
        // Awaiting a completion or not, nothing is sent and nobody waits.
        TKSMsgRef cutOff(blockFor(compDesc(0, 1), type, 77, 0));
        auto t0 = Clock::now();
        EXPECT_EQ(nullptr,
                  q->request(cutOff, 5000, type == kCommand ? kCompletion : 0, 0).getMsgRef());
        EXPECT_LT(Clock::now() - t0, 100ms);
    }
    {
        std::lock_guard<std::mutex> lk(m);
        answerOpen = true;
    }
    cv.notify_all();
    ASSERT_TRUE(waitUntil([&] { return !q->transportFailed(); }, 10s));
    EXPECT_TRUE(q->getHostDesc() == secondAddress());
    TKSMsgRef again(blockFor(compDesc(0, 1), kCommand, 79, 0));
    TKSMsgRef reply = q->request(again, 5000, kCompletion, 0);
    ASSERT_NE(nullptr, reply.getMsgRef());
    EXPECT_EQ(kCompletion, reply.getMsgType());
    reply.free();
    q.reset();
    relay.join();
    // The open carries the address asked for, the largest reply and the depth.
    EXPECT_TRUE(golden::SameBytes(openBody, {0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3, 0, 0,
                                             0, 4, 0, 0, 5, 6, 0, 0, 2, 0, 0, 0, 0, 5}));
    std::string err = testing::internal::GetCapturedStderr();
    const std::string name = "relay connection to " + relay.address();
    EXPECT_THAT(err, HasSubstr(name + " lost at "));
    EXPECT_THAT(err, HasSubstr(name + " back at "));
    EXPECT_THAT(err, HasSubstr("request of type 0x1214 not sent: the " + name + " is lost"));
    EXPECT_THAT(err, HasSubstr("request of type 0x1216 not sent"));
    EXPECT_EQ(
        std::vector<std::string>({"cut off from " + relay.address(), "back to " + relay.address()}),
        RelayEvents::get().take());
}

TEST(RemoteReconnect, RequestWaitingWhenTheConnectionBreaksEndsAtOnce) {
    ScriptedRelay relay(
        [](sock& conn, int index) {
            ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
            if (index == 0) {
                msg_t request;
                conn.get_msg(request);
                free_msg(request);
                return;
            }
            ScriptedRelay::serve(conn, discard);
        },
        2);
    testing::internal::CaptureStderr();
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    TKSMsgRef req(blockFor(compDesc(0, 1), kCommand, 80, 0));
    auto t0 = Clock::now();
    EXPECT_EQ(nullptr, q->request(req, 5000, kCompletion, 0).getMsgRef());
    EXPECT_LT(Clock::now() - t0, 1s);
    ASSERT_TRUE(waitUntil([&] { return !q->transportFailed(); }, 10s));
    q.reset();
    relay.join();
    EXPECT_THAT(testing::internal::GetCapturedStderr(),
                HasSubstr("request of type 0x1214 ended without its answer"));
}

// Answers to the open that refuse it, stop short, or announce more than an address can be. The
// relay keeps the connection open well past the open's limit, so only the client's own limit can
// end the wait; an announced size that no address has is refused without waiting for its bytes.
struct BadOpenCase {
    Bytes answer;
    bool hangUp;  // the relay ends the connection after its answer
    std::chrono::milliseconds within;
    const char* reason;
};

Bytes firstHalfOfTheHeader() {
    Bytes b = frameHeader(TKS_FRAME_ASSIGNED, TKS_ASSIGNED_BODY_BYTES, 0);
    b.resize(10);
    return b;
}

// The open's limit is 5 s; a loaded machine gets 1.5 s more. Each case runs as a test of its own,
// so that their waits overlap.
const BadOpenCase kBadOpens[] = {
    {frameHeader(TKS_FRAME_CLOSE_ACK, 0, 0), true, 6500ms, ""},  // refused
    {{}, true, 6500ms, ""},                                      // closed unanswered
    {firstHalfOfTheHeader(), false, 6500ms,
     "incomplete answer to the open within 5 s (10 of 40 bytes)"},
    {frameHeader(TKS_FRAME_ASSIGNED, TKS_ASSIGNED_BODY_BYTES, 0), false, 6500ms,
     "incomplete answer to the open within 5 s (20 of 40 bytes)"},
    {frameHeader(TKS_FRAME_ASSIGNED, 0xFFFFFFFFu, 0), false, 1000ms,
     "an address of 4294967295 bytes, not 20"},
};

class RemoteBadOpen : public ::testing::TestWithParam<BadOpenCase> {};

TEST_P(RemoteBadOpen, IsACreationErrorWithinTheOpensLimit) {
    const BadOpenCase& c = GetParam();
    std::mutex m;
    std::condition_variable cv;
    bool done = false;
    ScriptedRelay relay([&](sock& conn) {
        msg_t open;
        ASSERT_EQ(0, conn.get_msg(open));
        free_msg(open);
        ScriptedRelay::sendRaw(conn, c.answer);
        std::unique_lock<std::mutex> lk(m);
        cv.wait_for(lk, 9s, [&] { return done || c.hangUp; });
    });
    auto t0 = Clock::now();
    std::string reason = "no CreationError";
    try {
        delete openQueue(relay);
    } catch (const TKSMsgQueue::CreationError& e) {
        reason = e.getReason();
        EXPECT_EQ(relay.address(), e.getHostName());
        EXPECT_EQ(std::to_string(e.getPort()), relay.address().substr(10));
    }
    auto took = Clock::now() - t0;
    {
        std::lock_guard<std::mutex> lk(m);
        done = true;
    }
    cv.notify_all();
    relay.join();
    EXPECT_LT(took, c.within) << std::chrono::duration_cast<std::chrono::milliseconds>(took).count()
                              << " ms";
    EXPECT_THAT(reason, HasSubstr(c.reason));
}

INSTANTIATE_TEST_SUITE_P(Answers, RemoteBadOpen, ::testing::ValuesIn(kBadOpens));

TEST(RemoteTransport, OversizeBlockIsNotSentAndStaysWithTheCaller) {
    ScriptedRelay relay([](sock& conn) {
        ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
        ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) {
            ADD_FAILURE() << "an oversize block reached the relay";
            tkMsgFree(b);
        });
    });
    {
        TKSRemoteMsgQueue t(TKCompDesc{}, 512, 5, relay.address().c_str());
        TKMsg32Bit* big = blockFor(TKCompDesc{}, 1, 1, 102401);
        EXPECT_EQ(2, t.msgWrite(big));
        EXPECT_EQ(1u, big->type);  // still the caller's
        tkMsgFree(big);
        // Used on its own, the transport runs the close exchange itself.
    }
    relay.join();
}

// Once the close is sent, the relay may end the connection after its acknowledgement, in place
// of it, or may have vanished before. Each is the end of the exchange: no error line, and no 5 s
// wait for an acknowledgement that cannot come any more.
TEST(RemoteTransport, RelayEndingTheConnectionAfterTheCloseIsNoErrorAndEndsTheWait) {
    for (bool acknowledge : {true, false}) {
        SCOPED_TRACE(acknowledge ? "acknowledged" : "not acknowledged");
        ScriptedRelay relay([acknowledge](sock& conn) {
            ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
            msg_t m;
            ASSERT_EQ(0, conn.get_msg(m));
            EXPECT_EQ(TKS_FRAME_CLOSE, m.type);
            free_msg(m);
            if (acknowledge) {
                ScriptedRelay::sendEmpty(conn, TKS_FRAME_CLOSE_ACK);
            }
            // The connection ends as the script returns.
        });
        testing::internal::CaptureStderr();
        std::vector<int> results;
        {
            TKSRemoteMsgQueue t(TKCompDesc{}, 512, 5, relay.address().c_str());
            std::thread reader([&] {
                for (int i = 0; i < (acknowledge ? 2 : 1); ++i) {
                    TKMsg32Bit* b = nullptr;
                    results.push_back(t.msgRead(&b));
                    EXPECT_EQ(nullptr, b);
                }
            });
            auto t0 = Clock::now();
            t.closeExchange();
            EXPECT_LT(Clock::now() - t0, 4s);
            relay.join();
            // Time for a reader that took the ended connection for a fault to say so.
            std::this_thread::sleep_for(20ms);
            t.sendLastMessage();
            reader.join();
        }
        EXPECT_THAT(testing::internal::GetCapturedStderr(),
                    ::testing::Not(HasSubstr("Error communicating")));
        EXPECT_EQ(std::vector<int>(acknowledge ? 2 : 1, 2), results);
    }
}

TEST(RemoteTransport, RelayVanishedBeforeTheCloseEndsTheWait) {
    ScriptedRelay relay([](sock& conn) { ASSERT_TRUE(ScriptedRelay::acceptOpen(conn)); });
    testing::internal::CaptureStderr();
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    relay.join();
    auto t0 = Clock::now();
    q.reset();
    EXPECT_LT(Clock::now() - t0, 4s);
    testing::internal::GetCapturedStderr();
}

}  // namespace
