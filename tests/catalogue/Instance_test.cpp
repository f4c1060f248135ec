#include "catalogue/stdresource/Instance.h"

#include <gtest/gtest.h>

#include "OpSupport.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "catalogue/tsc/TSC.h"

namespace {

using tolk::Addressable;
using tolk::Instance;
using tolk::TmpInstance;

const Bytes kUseBody = concat({{1}, desc(kTarget), u32(0)});
const Bytes kUnuseBody = concat({{1}, desc(kTarget)});

TEST(InstanceLifecycle, ClaimsOnConstructionAndCancelsThenUnclaimsOnDestruction) {
    FakeBoard board;
    auto queue = newQueue();
    unsigned int id = 0;
    {
        Instance inst(kTarget, queue);
        id = inst.getId();
        EXPECT_EQ(inst.getInUse(), 1);
        EXPECT_EQ(inst.getEventsDetected(), 1);
        auto s = board.sent();
        ASSERT_EQ(s.size(), 1u);
        EXPECT_EQ(s[0].type, 0x800059u);
        EXPECT_EQ(s[0].tgt, kResourceMgr);
        EXPECT_EQ(s[0].body, kUseBody);
    }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[1].type, 0x1Eu);
    EXPECT_EQ(s[1].tgt, kTarget);
    EXPECT_EQ(s[1].trans, id);
    EXPECT_EQ(s[2].type, 0x80005Au);
    EXPECT_EQ(s[2].tgt, kResourceMgr);
    EXPECT_EQ(s[2].body, kUnuseBody);
}

TEST(InstanceLifecycle, DestructionGoesOnWhenTheCancellationTimesOut) {
    FakeBoard board(
        [](const Sent& s) { return s.type == 0x1E ? std::vector<Answer>{} : boardAnswer(s); });
    auto queue = newQueue();
    { Quick<Instance> inst(kTarget, queue); }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[1].type, 0x1Eu);
    EXPECT_EQ(s[2].type, 0x80005Au);
}

TEST(InstanceLifecycle, ARefusedClaimMakesNoObjectAndReleasesNothing) {
    FakeBoard board([](const Sent& s) {
        return std::vector<Answer>{{0, concat({u32(s.type & 0xFF), u32(1)})}};
    });
    auto queue = newQueue();
    EXPECT_THROW(Instance(kTarget, queue), Addressable::UnexpectedMsg);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 1u);
    EXPECT_EQ(s[0].type, 0x800059u);
}

// Proxies made from another proxy, and temporary ones, never claim and never release.
TEST(InstanceLifecycle, CopiesAndTemporaryProxiesSendNothing) {
    FakeBoard board;
    auto queue = newQueue();
    {
        TmpInstance tmp(kTarget, queue);
        EXPECT_EQ(tmp.getResourceMgr(), nullptr);
        TmpInstance tmpCopy(tmp);
        Instance fromTmp(tmp, 0);
        Instance copy(static_cast<const Instance&>(tmp));
        tolk::TSC tsc(tmp);
        EXPECT_NE(fromTmp.getResourceMgr(), nullptr);
        EXPECT_EQ(copy.getInUse(), 0);
        EXPECT_EQ(tsc.getEventsDetected(), 0);
    }
    EXPECT_EQ(board.count(), 0u);
}

TEST(InstanceLifecycle, AnInstanceOfAStandardResourceClaimsIt) {
    FakeBoard board;
    auto queue = newQueue();
    tolk::StdResource plain(kTarget, queue);
    { Instance inst(plain); }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[0].type, 0x800059u);
    EXPECT_EQ(s[1].type, 0x1Eu);
    EXPECT_EQ(s[2].type, 0x80005Au);
}

TEST(InstanceLifecycle, AllocatedTemporaryIsMarkedForFreeingYetFreesNothing) {
    tolk::CompDesc_t given(0x21, 2, 1, 22, 0);
    FakeBoard board([&](const Sent& s) { return boardAnswer(s, desc(given)); });
    auto queue = newQueue();
    tolk::StdResource owner(kTarget, queue);
    {
        TmpInstance t = owner.getResourceMgr()->allocate(22, 1, 0xFFFF, nullptr);
        EXPECT_EQ(t.getTgtDesc(), given);
        EXPECT_EQ(t.getFreeOnDestroy(), 1);
    }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 1u);
    EXPECT_EQ(s[0].type, 0x80003Eu);
}

TEST(InstanceLifecycle, QueueChangeUnclaimsOnTheOldQueueAndClaimsAgainOnTheNew) {
    FakeBoard board;
    auto first = newQueue();
    auto second = newQueue();
    Instance inst(kTarget, first);
    inst.msgQueueAttach(second);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[1].type, 0x80005Au);
    EXPECT_EQ(s[1].src, first->getHostDesc());
    EXPECT_EQ(s[2].type, 0x800059u);
    EXPECT_EQ(s[2].src, second->getHostDesc());
    EXPECT_EQ(inst.getResourceMgr()->getMsgQueue().Get(), second.Get());
}

}  // namespace
