#include "transport/TKSRemoteMsgQueue.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstring>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "ScriptedRelay.h"
#include "transport/TKSMsgQueue.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

class Inbox : public TKSAsyncMsgReceiver {
  public:
    int receive(TKSMsgRef& ref) {
        std::lock_guard<std::mutex> lk(m);
        types.push_back(ref.getMsgType());
        ref.free();
        cv.notify_all();
        return 1;
    }
    bool waitFor(std::size_t n) {
        std::unique_lock<std::mutex> lk(m);
        return cv.wait_for(lk, 5s, [&] { return types.size() >= n; });
    }
    std::vector<unsigned int> got() {
        std::lock_guard<std::mutex> lk(m);
        return types;
    }

  private:
    std::mutex m;
    std::condition_variable cv;
    std::vector<unsigned int> types;
};

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
    TKCompDesc want{};
    want.node = 1;
    want.board = 2;
    want.processor = 3;
    want.component = 4;
    want.instance = 0x0506;
    return new TKSMsgQueue(want, 512, 5, relay.address().c_str());
}

TEST(RemoteQueue, OpenSendsTheRequestedAddressAndTakesTheAssignedOne) {
    Bytes openBody;
    std::atomic<bool> closed{false};
    ScriptedRelay relay([&](sock& conn) {
        ASSERT_TRUE(ScriptedRelay::acceptOpen(conn, &openBody));
        ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
        closed = true;
    });
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    EXPECT_TRUE(q->getHostDesc() == ScriptedRelay::assignedAddress());
    auto t0 = Clock::now();
    q.reset();
    // The close was acknowledged: no 5 s wait.
    EXPECT_LT(Clock::now() - t0, 4s);
    relay.join();
    EXPECT_TRUE(closed.load());
    EXPECT_TRUE(golden::SameBytes(openBody, {0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3, 0, 0,
                                             0, 4, 0, 0, 5, 6, 0, 0, 2, 0, 0, 0, 0, 5}));
}

TEST(RemoteQueue, RequestTravelsAsAFrameAndTheReplyComesBack) {
    Bytes seen;
    ScriptedRelay relay([&](sock& conn) {
        ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
        Bytes header(20);
        ASSERT_EQ(0, conn.readblock(header.data(), 20));
        Bytes rest(56 + 3);
        ASSERT_EQ(0, conn.readblock(rest.data(), static_cast<long>(rest.size())));
        seen = header;
        seen.insert(seen.end(), rest.begin(), rest.end());
        // Reply: same transaction id, completion type, from the target, 2 body bytes.
        TKCompDesc from{};
        from.board = 1;
        from.processor = 1;
        from.instance = 5;
        TKMsg32Bit* reply = blockFor(ScriptedRelay::assignedAddress(), 0x1215, 0x2345, 2);
        tkMsgFieldPut(reply, TK_FIELD_SRC, &from);
        ScriptedRelay::sendBlock(conn, reply);
        ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
    });
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    TKCompDesc target{};
    target.board = 1;
    target.processor = 1;
    target.instance = 5;
    TKSMsgRef req(blockFor(target, 0x1214, 0x2345, 3));
    req.getMsgRef()->transTag |= 0x5A;
    TKSMsgRef reply = q->request(req, 5000, 0x1215, 0);
    ASSERT_NE(nullptr, reply.getMsgRef());
    EXPECT_EQ(0x1215u, reply.getMsgType());
    EXPECT_EQ(2u, reply.getSize());
    EXPECT_EQ(1, tkMsgBody(reply.getMsgRef())[0]);
    EXPECT_EQ(2, tkMsgBody(reply.getMsgRef())[1]);
    reply.free();
    q.reset();
    relay.join();

    Bytes golden = {0x00, 0x00, 0x03, 0xE9, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x38, 0x00,
                    0x00, 0x00, 0x03, 0x00, 0x00, 0x00, 0x00,
                    // tag, trans, type
                    0x00, 0x00, 0x00, 0x5A, 0x00, 0x00, 0x23, 0x45, 0x00, 0x00, 0x12, 0x14,
                    // source node, board, processor: the assigned address
                    0x00, 0x00, 0x00, 0x02, 0x00, 0x00, 0x00, 0xFE, 0x00, 0x00, 0x00, 0x00,
                    // target node, board, processor
                    0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x01, 0x00, 0x00, 0x00, 0x01,
                    // source instance, source component, target instance, target component
                    0x00, 0x00, 0x43, 0x21, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x05, 0x00,
                    0x00, 0x00, 0x00,
                    // body size and body
                    0x00, 0x00, 0x00, 0x03, 0x01, 0x02, 0x03};
    EXPECT_TRUE(golden::SameBytes(seen, golden));
}

// What the relay sends after the open, then a good event: the good one must arrive.
struct HostileCase {
    const char* name;
    Bytes junk;
    bool errorLine;
};

Bytes oversize() {
    Bytes b = frameHeader(TKS_FRAME_MESSAGE, 102401, 0);
    b.insert(b.end(), 102401, 0x42);
    return b;
}

Bytes unknownType() {
    Bytes b = frameHeader(4242, 4, 0);
    b.insert(b.end(), {1, 2, 3, 4});
    return b;
}

Bytes shortHeader() {
    Bytes b = frameHeader(TKS_FRAME_MESSAGE, 8, 0);
    b.insert(b.end(), 8, 0);
    return b;
}

Bytes countTooLarge() {
    Bytes b = frameHeader(TKS_FRAME_MESSAGE, 56, 2);
    Bytes words(52, 0);
    b.insert(b.end(), words.begin(), words.end());
    golden::u32(b, 100000);  // body size word far above the bytes that follow
    b.insert(b.end(), {9, 9});
    return b;
}

class RemoteHostile : public ::testing::TestWithParam<HostileCase> {};

TEST_P(RemoteHostile, BadFrameIsDroppedAndTheNextOneArrives) {
    const HostileCase& c = GetParam();
    std::atomic<bool> registered{false};
    ScriptedRelay relay([&](sock& conn) {
        ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
        // Until the callback is registered, blocks would wait in the pickup slot instead.
        while (!registered.load()) {
            std::this_thread::sleep_for(1ms);
        }
        ScriptedRelay::sendRaw(conn, c.junk);
        ScriptedRelay::sendBlock(conn, blockFor(ScriptedRelay::assignedAddress(), 0x20, 1, 4));
        ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
    });
    testing::internal::CaptureStderr();
    Inbox inbox;
    {
        std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
        q->registerAsyncCallback(&inbox, static_cast<TKSAsyncMethod>(&Inbox::receive));
        registered = true;
        ASSERT_TRUE(inbox.waitFor(1));
        EXPECT_EQ(std::vector<unsigned int>({0x20}), inbox.got());
        EXPECT_FALSE(q->transportFailed());
    }
    relay.join();
    std::string err = testing::internal::GetCapturedStderr();
    if (c.errorLine) {
        EXPECT_NE(std::string::npos, err.find("Error communicating with remote message queue on "))
            << err;
    } else {
        EXPECT_NE(std::string::npos, err.find("Discarding")) << err;
    }
}

INSTANTIATE_TEST_SUITE_P(
    Frames, RemoteHostile,
    ::testing::Values(HostileCase{"Oversize", oversize(), true},
                      HostileCase{"UnknownType", unknownType(), false},
                      HostileCase{"ShortMessageHeader", shortHeader(), false},
                      HostileCase{"CountLargerThanMessage", countTooLarge(), false}),
    [](const ::testing::TestParamInfo<HostileCase>& i) { return std::string(i.param.name); });

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
    std::mutex m;
    std::condition_variable cv;
    bool answerOpen = false;
    ScriptedRelay relay(
        [&](sock& conn, int index) {
            if (index == 0) {
                ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
                Bytes part = frameHeader(TKS_FRAME_MESSAGE, 56, 10);
                part.insert(part.end(), 30, 0);
                ScriptedRelay::sendRaw(conn, part);
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

    TKCompDesc target{};
    target.board = 1;
    TKSMsgRef cutOff(blockFor(target, 0x1214, 77, 0));
    auto t0 = Clock::now();
    EXPECT_EQ(nullptr, q->request(cutOff, 5000, 0x1215, 0).getMsgRef());
    EXPECT_LT(Clock::now() - t0, 100ms);
    TKSMsgRef oneWay(blockFor(target, 0x1216, 78, 0));
    t0 = Clock::now();
    EXPECT_EQ(nullptr, q->request(oneWay, 1000, 0, 0).getMsgRef());
    EXPECT_LT(Clock::now() - t0, 100ms);

    {
        std::lock_guard<std::mutex> lk(m);
        answerOpen = true;
    }
    cv.notify_all();
    ASSERT_TRUE(waitUntil([&] { return !q->transportFailed(); }, 10s));
    EXPECT_TRUE(q->getHostDesc() == secondAddress());
    TKSMsgRef again(blockFor(target, 0x1214, 79, 0));
    TKSMsgRef reply = q->request(again, 5000, 0x1215, 0);
    ASSERT_NE(nullptr, reply.getMsgRef());
    EXPECT_EQ(0x1215u, reply.getMsgType());
    reply.free();
    q.reset();
    relay.join();

    std::string err = testing::internal::GetCapturedStderr();
    const std::string name = "relay connection to " + relay.address();
    EXPECT_NE(std::string::npos, err.find(name + " lost at ")) << err;
    EXPECT_NE(std::string::npos, err.find(name + " back at ")) << err;
    EXPECT_NE(std::string::npos,
              err.find("request of type 0x1214 not sent: the relay connection to " +
                       relay.address() + " is lost"))
        << err;
    EXPECT_NE(std::string::npos, err.find("request of type 0x1216 not sent")) << err;
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
            ScriptedRelay::serve(conn, [](sock&, TKMsg32Bit* b) { tkMsgFree(b); });
        },
        2);
    testing::internal::CaptureStderr();
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    TKCompDesc target{};
    target.board = 1;
    TKSMsgRef req(blockFor(target, 0x1214, 80, 0));
    auto t0 = Clock::now();
    EXPECT_EQ(nullptr, q->request(req, 5000, 0x1215, 0).getMsgRef());
    EXPECT_LT(Clock::now() - t0, 1s);
    ASSERT_TRUE(waitUntil([&] { return !q->transportFailed(); }, 10s));
    q.reset();
    relay.join();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_NE(std::string::npos, err.find("request of type 0x1214 ended without its answer"))
        << err;
}

TEST(RemoteQueue, RefusedOpenIsACreationError) {
    ScriptedRelay relay([](sock& conn) {
        msg_t m;
        conn.get_msg(m);
        free_msg(m);
        ScriptedRelay::sendEmpty(conn, TKS_FRAME_CLOSE_ACK);
    });
    EXPECT_THROW(delete openQueue(relay), TKSMsgQueue::CreationError);
    relay.join();
}

TEST(RemoteQueue, RelayThatClosesBeforeAnsweringTheOpenIsACreationError) {
    ScriptedRelay relay([](sock& conn) {
        msg_t m;
        conn.get_msg(m);
        free_msg(m);
    });
    EXPECT_THROW(delete openQueue(relay), TKSMsgQueue::CreationError);
    relay.join();
}

// Answers to the open that stop short, or announce more than an address can be. The relay keeps
// the connection open well past the open's limit, so only the client's own limit can end the
// wait; an announced size that no address has is refused without waiting for its bytes.
struct PartialOpenCase {
    const char* name;
    Bytes answer;
    std::chrono::milliseconds within;
    const char* reason;
};

Bytes firstHalfOfTheHeader() {
    Bytes b = frameHeader(TKS_FRAME_ASSIGNED, TKS_ASSIGNED_BODY_BYTES, 0);
    b.resize(10);
    return b;
}

class RemotePartialOpen : public ::testing::TestWithParam<PartialOpenCase> {};

TEST_P(RemotePartialOpen, FailsWithinTheOpensLimit) {
    const PartialOpenCase& c = GetParam();
    std::mutex m;
    std::condition_variable cv;
    bool done = false;
    ScriptedRelay relay([&](sock& conn) {
        msg_t open;
        ASSERT_EQ(0, conn.get_msg(open));
        free_msg(open);
        ScriptedRelay::sendRaw(conn, c.answer);
        std::unique_lock<std::mutex> lk(m);
        cv.wait_for(lk, 9s, [&] { return done; });
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
    EXPECT_NE(std::string::npos, reason.find(c.reason)) << reason;
}

// The open's limit is 5 s; a loaded machine gets 1.5 s more.
INSTANTIATE_TEST_SUITE_P(
    Answers, RemotePartialOpen,
    ::testing::Values(PartialOpenCase{"HalfAHeader", firstHalfOfTheHeader(), 6500ms,
                                      "incomplete answer to the open within 5 s (10 of 40 bytes)"},
                      PartialOpenCase{"HeaderWithoutItsBody",
                                      frameHeader(TKS_FRAME_ASSIGNED, TKS_ASSIGNED_BODY_BYTES, 0),
                                      6500ms,
                                      "incomplete answer to the open within 5 s (20 of 40 bytes)"},
                      PartialOpenCase{"AbsurdSize", frameHeader(TKS_FRAME_ASSIGNED, 0xFFFFFFFFu, 0),
                                      1000ms, "an address of 4294967295 bytes, not 20"}),
    [](const ::testing::TestParamInfo<PartialOpenCase>& i) { return std::string(i.param.name); });

TEST(RemoteQueue, DestructionWithAPeerThatVanishedDoesNotWait) {
    ScriptedRelay relay([](sock& conn) { ASSERT_TRUE(ScriptedRelay::acceptOpen(conn)); });
    testing::internal::CaptureStderr();
    std::unique_ptr<TKSMsgQueue> q(openQueue(relay));
    relay.join();
    auto t0 = Clock::now();
    q.reset();
    EXPECT_LT(Clock::now() - t0, 4s);
    testing::internal::GetCapturedStderr();
}

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

// Once the close is sent, the relay may end the connection after its acknowledgement or in
// place of it. Either is the end of the exchange: no error line, and no 5 s wait for an
// acknowledgement that cannot come any more.
struct CloseCase {
    const char* name;
    bool acknowledge;
};

class RemoteClose : public ::testing::TestWithParam<CloseCase> {};

TEST_P(RemoteClose, RelayEndingTheConnectionIsNoErrorAndEndsTheWait) {
    const bool ack = GetParam().acknowledge;
    ScriptedRelay relay([ack](sock& conn) {
        ASSERT_TRUE(ScriptedRelay::acceptOpen(conn));
        msg_t m;
        ASSERT_EQ(0, conn.get_msg(m));
        EXPECT_EQ(TKS_FRAME_CLOSE, m.type);
        free_msg(m);
        if (ack) {
            ScriptedRelay::sendEmpty(conn, TKS_FRAME_CLOSE_ACK);
        }
        // The connection ends as the script returns.
    });
    testing::internal::CaptureStderr();
    std::vector<int> results;
    {
        TKSRemoteMsgQueue t(TKCompDesc{}, 512, 5, relay.address().c_str());
        std::thread reader([&] {
            for (int i = 0; i < (ack ? 2 : 1); ++i) {
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
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(std::string::npos, err.find("Error communicating")) << err;
    EXPECT_EQ(std::vector<int>(ack ? 2 : 1, 2), results);
}

INSTANTIATE_TEST_SUITE_P(Relay, RemoteClose,
                         ::testing::Values(CloseCase{"AcknowledgesThenCloses", true},
                                           CloseCase{"ClosesWithoutAcknowledging", false}),
                         [](const ::testing::TestParamInfo<CloseCase>& i) {
                             return std::string(i.param.name);
                         });

TEST(RemoteTransport, ComFailureCarriesHostAndPort) {
    TKSRemoteService_ComFailure f(std::string(120, 'r').c_str(), 6554);
    EXPECT_EQ(std::string(99, 'r'), f.getHostName());
    EXPECT_EQ(6554, f.getPort());
}

}  // namespace
