#include "framework/Addressable.h"

#include <gtest/gtest.h>

#include <chrono>
#include <sstream>

#include "Responder.h"
#include "framework/CompAttr_t.h"

namespace {

using tolk::Addressable;
using tolk::CompAttr_t;
using tolk::MsgQueue;
using Clock = std::chrono::steady_clock;

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

// Short waits so that the time-out paths stay fast; knows type 0 as a CompAttr_t body.
class Proxy : public Addressable {
  public:
    Proxy(const tolk::CompDesc_t& t, isa::RefPtr<MsgQueue>& q, unsigned int response,
          unsigned int errorWait)
        : Addressable(t, q) {
        ResponseTimeout = response;
        ErrorWaitTime = errorWait;
    }
    tolk::MsgBody* MsgBodyLookup(unsigned int type) override {
        if (type == 0) {
            return new CompAttr_t();
        }
        return Addressable::MsgBodyLookup(type);
    }
};

isa::RefPtr<MsgQueue> newQueue() {
    return isa::RefPtr<MsgQueue>(new MsgQueue(tolk::CompDesc_t(1, 1, 1, 1, 1), 512, 5));
}

TEST(AddressableRequest, FillsTheCompletionBodyFromTheReply) {
    Responder r([](TKMsg32Bit* in) {
        // Echo the command's attribute with the key incremented.
        std::vector<unsigned char> b(tkMsgBody(in), tkMsgBody(in) + in->size);
        b[3] += 1;
        return std::vector<Outgoing>{{in->type + 1, b}};
    });
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(r.address(), q, 5000, 1000);
    CompAttr_t cmd(0x41, -7);
    CompAttr_t ret;
    p.request(0x08, &cmd, 0x09, &ret);
    EXPECT_EQ(ret.key, 0x42u);
    EXPECT_EQ(ret.value, -7);
    // A null completion body drops the reply and returns normally.
    p.request(0x08, &cmd, 0x09, nullptr);
    EXPECT_EQ(r.received(), 2u);
}

TEST(AddressableRequest, RepliesAreTakenAsTheyArriveNotAtTheNextPoll) {
    Responder r([](TKMsg32Bit* in) {
        return std::vector<Outgoing>{{in->type + 1, {0, 0, 0, 1, 0, 0, 0, 2}}};
    });
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(r.address(), q, 5000, 1000);
    CompAttr_t cmd(1, 1);
    CompAttr_t ret;
    constexpr int rounds = 300;
    auto t0 = Clock::now();
    for (int i = 0; i < rounds; ++i) {
        p.request(0x08, &cmd, 0x09, &ret);
    }
    // Waiting for the next 10 ms step after each reply would take at least 3 s.
    EXPECT_LT(Clock::now() - t0, std::chrono::milliseconds(rounds * 10 * 3 / 4));
    EXPECT_EQ(r.received(), static_cast<unsigned int>(rounds));
}

TEST(AddressableRequest, RefusalBecomesUnexpectedMsgWithItsBodyAttached) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{{0, {0, 0, 0, 8, 0, 0, 0, 3}}}; });
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(r.address(), q, 5000, 1000);
    CompAttr_t cmd(1, 1);
    auto t0 = Clock::now();
    try {
        p.request(0x08, &cmd, 0x09, nullptr);
        FAIL();
    } catch (const Addressable::UnexpectedMsg& e) {
        EXPECT_EQ(e.cmdType, 0x08u);
        EXPECT_EQ(e.addressable, &p);
        ASSERT_NE(e.msg, nullptr);
        EXPECT_NE(dynamic_cast<CompAttr_t*>(e.msg->getBodyDef()), nullptr);
        std::string t = text(e);
        EXPECT_EQ(t.rfind("Addressable::UnexpectedMsg ObjSource: {TgtDesc: ", 0), 0u) << t;
        EXPECT_NE(t.find(" CmdMsgType 0x8 RespMsg: {MsgType: 0 Source: "), std::string::npos) << t;
        EXPECT_NE(t.find(" Body: {key 0x8 value 0x3}}"), std::string::npos) << t;
    }
    EXPECT_LT(Clock::now() - t0, std::chrono::milliseconds(2500));
}

TEST(AddressableRequest, UnexpectedMsgMadeFromAReplyOwnsItAcrossCopies) {
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(tolk::CompDesc_t(7, 1, 1, 18, 0), q, 5000, 1000);
    auto* reply = new tolk::Msg(2u);
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
    EXPECT_NE(printed.find(" Body: {ByteData {0 0x9 }}}"), std::string::npos) << printed;
}

TEST(AddressableRequest, SilenceRaisesTimeoutWithTypesAndTime) {
    Responder r([](TKMsg32Bit*) { return std::vector<Outgoing>{}; });
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(r.address(), q, 150, 1000);
    CompAttr_t cmd(1, 1);
    try {
        p.request(0x1214, &cmd, 0x1215, nullptr, 4242);
        FAIL();
    } catch (const Addressable::Timeout& e) {
        std::ostringstream expect;
        expect << "Addressable::Timeout ObjSource: " << p
               << " CmdMsgType: 0x1214 RetMsgType: 0x1215 Trans: 4242 Timeout: 150ms";
        EXPECT_EQ(text(e), expect.str());
        EXPECT_EQ(e.trans, 4242u);
    }
    // The proxy stays usable.
    EXPECT_THROW(p.request(0x1214, &cmd, 0x1215, nullptr), tolk::Exception);
}

TEST(AddressableRequest, OneWayCommandReturnsAfterTheErrorWaitUnlessRefusedAtOnce) {
    for (int reply : {-1, 0, 0x800001}) {
        SCOPED_TRACE(reply);
        Responder r([reply](TKMsg32Bit*) {
            return reply < 0 ? std::vector<Outgoing>{}
                             : std::vector<Outgoing>{{static_cast<unsigned int>(reply), {}}};
        });
        isa::RefPtr<MsgQueue> q = newQueue();
        Proxy p(r.address(), q, 5000, reply < 0 ? 120 : 3000);
        CompAttr_t cmd(1, 1);
        auto t0 = Clock::now();
        if (reply < 0) {
            p.request(0x06, &cmd);
            EXPECT_GE(Clock::now() - t0, std::chrono::milliseconds(110));
            EXPECT_EQ(r.received(), 1u);
        } else {
            EXPECT_THROW(p.request(0x06, &cmd), Addressable::UnexpectedMsg);
            EXPECT_LT(Clock::now() - t0, std::chrono::milliseconds(1500));
        }
    }
}

TEST(AddressableRequest, ReplyFromAnotherSourceCountsOnlyWithAnySource) {
    Responder other([](TKMsg32Bit*) { return std::vector<Outgoing>{}; });
    Responder r([&other](TKMsg32Bit* in) {
        TKCompDesc from{};
        tkMsgFieldGet(in, TK_FIELD_SRC, &from);
        other.send(from, in->type + 1, in->transTag >> 8, {});
        return std::vector<Outgoing>{};
    });
    isa::RefPtr<MsgQueue> q = newQueue();
    Proxy p(r.address(), q, 150, 1000);
    CompAttr_t cmd(1, 1);
    q->unregisteredSource([](MsgQueue&, tolk::Msg* m) { delete m; });
    EXPECT_THROW(p.request(0x10, &cmd, 0x11, nullptr, 0, 0), Addressable::Timeout);
    EXPECT_NO_THROW(p.request(0x10, &cmd, 0x11, nullptr, 0, 1));
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

TEST(AddressableLookup, BaseRaisesUndefinedBodies) {
    isa::RefPtr<MsgQueue> q = newQueue();
    Addressable a(tolk::CompDesc_t(3, 1, 1, 18, 0), q);
    try {
        a.MsgBodyLookup(0x2B);
        FAIL();
    } catch (const Addressable::UndefinedMsgBody& e) {
        EXPECT_EQ(e.type, 0x2Bu);
        EXPECT_EQ(text(e), "tolk::Addressable::UndefinedMsgBody");
    }
    try {
        a.superEvtBodyLookup(0x1230);
        FAIL();
    } catch (const Addressable::UndefinedEvtBody& e) {
        EXPECT_EQ(e.group, 0x1230u);
        EXPECT_EQ(text(e), "tolk::Addressable::UndefinedEvtBody");
    }
}

}  // namespace
