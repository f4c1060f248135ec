#include "framework/MsgQueue.h"

#include <gtest/gtest.h>

#include <chrono>
#include <sstream>
#include <thread>

#include "Responder.h"
#include "framework/AsyncMsgReceiver.h"
#include "framework/tolk.h"

namespace {

using tolk::Msg;
using tolk::MsgQueue;
using Clock = std::chrono::steady_clock;

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

Msg* command(tolk::CompDesc_t target, unsigned int type) {
    Msg* m = new Msg(4u);
    m->setMsgType(type);
    m->setTgtAddr(target);
    m->setTrans(tolk::getUniqueTransId());
    return m;
}

tolk::CompDesc_t anyAddr() {
    return tolk::CompDesc_t(1, 1, 1, 1, 1);
}

TEST(MsgQueueRequest, ErrorOrOtherReplyRaisesErrorMsgHoldingItAtOnce) {
    for (auto [reply, awaited] : {std::pair{0u, 0x1215u}, {0u, 0u}, {0x800001u, 0x1215u}}) {
        SCOPED_TRACE(reply);
        Responder r([reply](TKMsg32Bit*) {
            return std::vector<Outgoing>{{reply, {0, 0, 0x12, 0x14}}};
        });
        MsgQueue q(anyAddr(), MsgQueue::DefaultMaxRetMsgSize, MsgQueue::DefaultDepth);
        auto t0 = Clock::now();
        try {
            delete q.request(command(r.address(), 0x1214), 5000, awaited, 0);
            FAIL() << "no exception";
        } catch (const MsgQueue::ErrorMsg& e) {
            ASSERT_NE(e.msg, nullptr);
            EXPECT_EQ(e.msg->getMsgType(), reply);
            EXPECT_TRUE(e.msg->getSrcAddr() == r.address());
            EXPECT_EQ(e.queue, &q);
            EXPECT_EQ(text(e).rfind("MsgQueue::ErrorMsg MsgBody: {MsgType: " +
                                        std::string(reply ? "0x800001" : "0") + " Source: ",
                                    0),
                      0u)
                << text(e);
        }
        // Not after the time-out.
        EXPECT_LT(Clock::now() - t0, std::chrono::milliseconds(2500));
    }
}

TEST(MsgQueueRequest, SilenceRaisesTimeoutWithItsText) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{}; });
    MsgQueue q(anyAddr(), 512, 5);
    auto t0 = Clock::now();
    try {
        q.request(command(r.address(), 0x1214), 200, 0x1215, 0);
        FAIL();
    } catch (const MsgQueue::Timeout& e) {
        EXPECT_EQ(text(e), "MsgQueue::Timeout MsgType: 0x1215 Timeout: 200ms)");
        EXPECT_EQ(e.timeoutMs, 200u);
    }
    EXPECT_GE(Clock::now() - t0, std::chrono::milliseconds(190));
    // Without an awaited type silence is success.
    EXPECT_EQ(q.request(command(r.address(), 0x1208), 50, 0, 0), nullptr);
}

TEST(MsgQueueRequest, SecondCallerWaitsForTheFirstThenGetsItsOwnTime) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{}; });
    MsgQueue q(anyAddr(), 512, 5);
    auto t0 = Clock::now();
    std::thread other(
        [&] { EXPECT_THROW(q.request(command(r.address(), 2), 300, 3, 0), MsgQueue::Timeout); });
    std::this_thread::sleep_for(std::chrono::milliseconds(50));
    EXPECT_THROW(q.request(command(r.address(), 2), 300, 3, 0), MsgQueue::Timeout);
    other.join();
    EXPECT_GE(Clock::now() - t0, std::chrono::milliseconds(580));
}

class Collector : public tolk::AsyncMsgReceiver {
  public:
    using AsyncMsgReceiver::AsyncMsgReceiver;
    void receive(Msg* m) override {
        types.push_back(m->getMsgType());
        delete m;
    }
    std::vector<unsigned int> types;
};

TEST(MsgQueueReceivers, SecondRegistrationOfASourceIsRefusedAndKeepsTheFirst) {
    MsgQueue q(anyAddr(), 512, 5);
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

TEST(MsgQueueRouting, UnregisteredSourcePrintsTheBannerOnceAndTheQueueGoesOn) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{{0x51, {}}, {3, {}}}; });
    MsgQueue q(anyAddr(), 512, 5);
    testing::internal::CaptureStderr();
    Msg* reply = q.request(command(r.address(), 2), 5000, 3, 0);
    delete reply;
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    std::string err = testing::internal::GetCapturedStderr();
    std::ostringstream expectHead;
    expectHead << "\n********************************************\nUnregistered Source sent to "
                  "MsgQueue "
               << q << "\nMsgType 81\n{MsgType: 0x51 Source: ";
    EXPECT_EQ(err.rfind(expectHead.str(), 0), 0u) << err;
    EXPECT_NE(err.find("}\nYou may specify your own handler for messages from unregistered sources "
                       "using\nMsgQueue::unregisteredSource\n"
                       "********************************************\n\n"),
              std::string::npos)
        << err;
    EXPECT_EQ(err.find("Unregistered Source", 100), std::string::npos);
}

std::atomic<int> customCalls{0};
void customHandler(MsgQueue&, Msg* m) {
    ++customCalls;
    delete m;
}

TEST(MsgQueueRouting, ReplacedHandlerAndRegisteredReceiverGetTheirMessages) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{}; });
    MsgQueue q(anyAddr(), 512, 5);
    q.unregisteredSource(customHandler);
    customCalls = 0;
    TKCompDesc host = q.getHostDesc().getTKCompDesc();
    r.send(host, 0x42, 1, {});
    for (int i = 0; i < 200 && customCalls == 0; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    EXPECT_EQ(customCalls.load(), 1);
}

}  // namespace
