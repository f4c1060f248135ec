#include "catalogue/tsc/TSC.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "OpSupport.h"
#include "catalogue/tsc/TSCAsync.h"

namespace {

using tolk::Addressable;
using tolk::TSC;

Bytes zeros(std::size_t n) {
    return Bytes(n, 0);
}

class TSCOps : public ::testing::Test {
  protected:
    FakeBoard board{[](const Sent& s) { return boardAnswer(s, u32(0x77)); }};
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    tolk::TmpInstance found{kTarget, queue};
    Quick<TSC> tsc{static_cast<const tolk::Instance&>(found)};

    Sent last() const { return board.sent().back(); }
};

TEST_F(TSCOps, OneWayDefaultsGoOutAsTheirDefaultValues) {
    struct Case {
        std::function<void(TSC&)> call;
        unsigned int type;
        Bytes body;
    };
    const Case cases[] = {
        {[](TSC& t) { t.DropCall(5); }, 0x120A, {0, 0, 0, 5, 0, 0, 0, 0x0E}},
        {[](TSC& t) { t.ReleaseCall(); }, 0x121C, {0, 0, 0, 0, 0, 0, 0, 0x0E}},
        {[](TSC& t) { t.RejectCall(5); }, 0x121D, {0, 0, 0, 5, 0, 0, 0, 2}},
        {[](TSC& t) { t.AnswerCall(7); }, 0x1201, {0, 0, 0, 7, 0, 0, 0, 0}},
        {[](TSC& t) { t.AcceptCall(); }, 0x1200, {0, 0, 0, 0}},
        {[](TSC& t) { t.CompleteTransfer(9, 4); }, 0x1207, {0, 0, 0, 4, 0, 0, 0, 9}},
        {[](TSC& t) { t.HoldCall(3); }, 0x1211, {0, 0, 0, 3}},
        {[](TSC& t) { t.ProceedCall(); }, 0x122D, {0, 0, 0, 0}},
        {[](TSC& t) { t.BlindTransferCall(); }, 0x1202, zeros(4 + 128 + 128 + 1)},
        {[](TSC& t) { t.RedirectCall(2); }, 0x121B, concat({u32(2), zeros(128)})},
    };
    for (const Case& c : cases) {
        board.clear();
        c.call(tsc);
        ASSERT_EQ(board.count(), 1u) << std::hex << c.type;
        EXPECT_EQ(last().type, c.type);
        EXPECT_EQ(last().tgt, kTarget);
        EXPECT_EQ(last().body, c.body) << std::hex << c.type;
    }
}

TEST_F(TSCOps, MakeCallWithOnlyTheCompletionSends257BytesAndReturnsTheCallId) {
    TSC::MsgMakeCallCmplt_t answer;
    tsc.MakeCall(&answer);
    EXPECT_EQ(last().type, 0x1214u);
    EXPECT_EQ(last().body, zeros(257));
    EXPECT_EQ(*answer.pCallId, 0x77u);
}

TEST_F(TSCOps, AnAddressOf130CharactersSendsItsFirst128AndStaysTheCallers) {
    tolk::staticList<char> dest;
    dest.realloc(130);
    for (unsigned int i = 0; i < 130; ++i) {
        *dest.element(i) = static_cast<char>('0' + i % 10);
    }
    tolk::string orig("12");
    unsigned char progress = 1;
    tsc.MakeCall(dest, orig, progress, nullptr);
    Bytes expect;
    for (unsigned int i = 0; i < 128; ++i) {
        expect.push_back(static_cast<std::uint8_t>('0' + i % 10));
    }
    Bytes origBytes = {'1', '2'};
    origBytes.resize(128, 0);
    expect.insert(expect.end(), origBytes.begin(), origBytes.end());
    expect.push_back(1);
    EXPECT_EQ(last().body, expect);
    EXPECT_EQ(dest.length(), 130u);
    EXPECT_EQ(orig.length(), 3u);
}

TEST_F(TSCOps, WaitingDefaultsGoOutAsTheirDefaultValues) {
    tolk::string digits("5");
    tsc.Dial(digits, nullptr);
    Bytes dial = concat({u32(0), {'5'}, zeros(127), {0, 2}});
    EXPECT_EQ(last().type, 0x1224u);
    EXPECT_EQ(last().body, dial);
    tsc.SetAlarmMask(1, nullptr);
    EXPECT_EQ(last().body, concat({{1}, u32(0x46)}));
    tsc.ResetLineDevice(nullptr);
    EXPECT_EQ(last().type, 0x1246u);
    EXPECT_EQ(last().body, u32(0x100));
    tsc.GetCallState(nullptr);
    EXPECT_EQ(last().body, u32(0));
    tsc.CompleteCall(3, nullptr);
    EXPECT_EQ(last().body, concat({u32(0), u32(3)}));
    tsc.GCExtension(nullptr);
    EXPECT_EQ(last().body, zeros(12 + 256));
}

TEST_F(TSCOps, ListArgumentsSendTheirRealLength) {
    tolk::staticList<TSC::MsgAttach_t::MediaInfo_t> media;
    media.realloc(3);
    for (unsigned int i = 0; i < 3; ++i) {
        media.element(i)->ComponentType = 0x30 + i;
        media.element(i)->InstDesc = tolk::CompDesc_t(static_cast<unsigned short>(i), 2, 1, 0, 0);
    }
    tsc.Attach(media, nullptr);
    Sent attach = last();
    EXPECT_EQ(attach.type, 0x1234u);
    ASSERT_EQ(attach.body.size(), 1u + 3 * 10);
    EXPECT_EQ(attach.body[0], 3);
    EXPECT_EQ(Bytes(attach.body.begin() + 1, attach.body.begin() + 11),
              concat({u32(0x30), {0, 0, 2, 1, 0, 0}}));

    tolk::staticList<unsigned char> data;
    data.realloc(2);
    *data.element(0) = 0xA1;
    *data.element(1) = 0x70;
    tsc.SendISDN(0x45, data, 6, nullptr);
    EXPECT_EQ(last().body, concat({u32(6), u32(0x45), u32(2), {0xA1, 0x70}}));

    tolk::staticList<unsigned int> ids;
    tsc.GetCallInfo(ids, nullptr);
    EXPECT_EQ(last().body, concat({u32(0), u32(0)}));
}

TEST_F(TSCOps, DetectEvtSetGoesOutAsTheStandardNumberWithTheEventRules) {
    tolk::staticList<unsigned int> set;
    set.realloc(1);
    *set.element(0) = 0x1232;
    tsc.DetectEvtSet(0x1230, set, 0, nullptr);
    EXPECT_EQ(last().type, 0x16u);
    EXPECT_EQ(last().trans, tsc.getId());
    EXPECT_EQ(last().body,
              concat({desc(queue->getHostDesc()), u32(0x1230), u32(0x1230), u32(1), u32(0x1232)}));
}

TEST_F(TSCOps, RefusedOneWayCommandRaisesAndSilentWaitingOneTimesOut) {
    FakeBoard refusing([](const Sent& s) {
        if (s.type == 0x120A) {
            return std::vector<Answer>{{0, concat({u32(0x120A), u32(5)})}};
        }
        return std::vector<Answer>{};
    });
    EXPECT_THROW(tsc.DropCall(1), Addressable::UnexpectedMsg);
    EXPECT_THROW(tsc.GetChanState(nullptr), Addressable::Timeout);
}

// The completion of StartSetChanState arrives on its own and is dropped without a banner;
// a message of a type nobody registered still reaches the unregistered handler.
std::atomic<unsigned int> g_unregistered{0};
std::atomic<unsigned int> g_lastType{0};
void countUnregistered(Addressable*, tolk::Msg* m) {
    g_lastType = m->getMsgType();
    ++g_unregistered;
    delete m;
}

TEST_F(TSCOps, ConstructionRegistersANullHandlerForTheChannelStateCompletion) {
    FakeBoard both([](const Sent& s) {
        if (s.type == 0x121F) {
            return std::vector<Answer>{{0x1220, {}}, {0x1221, {}}};
        }
        return std::vector<Answer>{};
    });
    g_unregistered = 0;
    tsc.asyncUnregisteredMsgType(&countUnregistered, 0);
    tsc.StartSetChanState(2);
    EXPECT_EQ(both.sent()[0].body, u32(2));
    for (int i = 0; i < 200 && g_unregistered.load() == 0; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    EXPECT_EQ(g_unregistered.load(), 1u);
    EXPECT_EQ(g_lastType.load(), 0x1221u);
}

TEST(TSCAsyncOps, OneWayCommandsWaitOneMillisecond) {
    FakeBoard board;
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    tolk::TSCAsync tsc(static_cast<const tolk::Instance&>(found));
    EXPECT_EQ(tsc.getErrorWaitTime(), 1u);
    EXPECT_EQ(tsc.getResponseTimeout(), 5000u);
    tsc.HoldCall(4);
    EXPECT_EQ(board.sent()[0].type, 0x1211u);
}

}  // namespace
