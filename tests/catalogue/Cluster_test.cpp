#include "catalogue/cluster/Cluster.h"

#include <gtest/gtest.h>

#include "OpSupport.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/resourcemgr/ResourceMgr.h"

namespace {

using tolk::Addressable;
using tolk::Cluster;
using tolk::ClusterMgr;
using tolk::CompAttr_t;

const tolk::CompDesc_t kCluster(0x30, 2, 1, 0, 0);
const tolk::CompDesc_t kInst(0x44, 2, 1, 22, 0);

// The searches are answered from another address than the one they went to.
std::vector<Answer> answerFromElsewhere(const Sent& s) {
    auto a = boardAnswer(s, s.type == 0x800053 ? desc(kCluster) : desc(kInst));
    for (Answer& x : a) {
        x.fromElsewhere = s.type == 0x800053 || s.type == 0x80001E || s.type == 0x800027;
    }
    return a;
}

class ClusterOps : public ::testing::Test {
  protected:
    FakeBoard board{answerFromElsewhere};
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    Quick<Addressable> owner{kTarget, queue};
};

TEST_F(ClusterOps, ManagersStandAtTheBoardsFixedAddresses) {
    ClusterMgr mgr(&owner);
    EXPECT_EQ(mgr.getTgtDesc(), kClusterMgr);
    Cluster c(kCluster, queue);
    EXPECT_EQ(c.getClusterMgr()->getTgtDesc(), kClusterMgr);
    EXPECT_EQ(c.getResourceMgr()->getTgtDesc(), kResourceMgr);
}

TEST_F(ClusterOps, FindByTSCSendsTypeTrunkAndChannelAndAcceptsAnySource) {
    ClusterMgr mgr(&owner);
    Cluster c = mgr.findByTSC(1, 2);
    EXPECT_EQ(c.getTgtDesc(), kCluster);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 1u);
    EXPECT_EQ(s[0].type, 0x800053u);
    EXPECT_EQ(s[0].tgt, kClusterMgr);
    EXPECT_EQ(s[0].body, concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 3},
                                 u32(0),
                                 u32(18),
                                 u32(0x1200),
                                 u32(1),
                                 u32(0x1201),
                                 u32(2)}));
}

TEST_F(ClusterOps, FindByLCONSendsTypeAndLine) {
    ClusterMgr mgr(&owner);
    mgr.findByLCON(4);
    EXPECT_EQ(board.sent()[0].body,
              concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 2}, u32(0), u32(22), u32(0x1600), u32(4)}));
}

TEST_F(ClusterOps, FindInstanceWithTypeZeroSendsNoAttribute) {
    Cluster c(kCluster, queue);
    tolk::TmpInstance none = c.find(0);
    tolk::TmpInstance lcon = c.find(22);
    EXPECT_EQ(lcon.getTgtDesc(), kInst);
    EXPECT_EQ(lcon.getMsgQueue().Get(), queue.Get());
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x80001Eu);
    EXPECT_EQ(s[0].tgt, kClusterMgr);
    EXPECT_EQ(s[0].body, concat({desc(kCluster), {0, 0}}));
    EXPECT_EQ(s[1].body, concat({desc(kCluster), {22, 1}, u32(0), u32(22)}));
}

TEST_F(ClusterOps, AnswerFromAnotherAddressIsNotAcceptedByPortOperations) {
    FakeBoard elsewhere([](const Sent& s) {
        auto a = boardAnswer(s);
        for (Answer& x : a) {
            x.fromElsewhere = true;
        }
        return a;
    });
    Quick<Cluster> c(kCluster, queue);
    EXPECT_THROW(c.Deactivate(1), Addressable::Timeout);
}

TEST_F(ClusterOps, PortAndSlotOperationsSendTheClusterAndTheirFields) {
    Cluster c(kCluster, queue);
    c.Activate(0x4201, nullptr, 3);
    Quick<Addressable> talker(kInst, queue);
    c.Activate(0x4201, &talker, 0);
    tolk::staticList<unsigned short> none;
    c.TSAssign(0x4201, none, 1, 0x7F);
    tolk::staticList<unsigned short> two;
    two.realloc(2);
    *two.element(0) = 5;
    *two.element(1) = 0x105;
    c.TSAssign(0x4201, two, 1, 0x7F);
    c.Deactivate(0x4201);
    c.TSUnassign(0x4201);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 6u);
    EXPECT_EQ(s[0].type, 0x80001Bu);
    EXPECT_EQ(s[0].tgt, kCluster);
    EXPECT_EQ(s[0].body,
              concat({desc(kCluster), u32(0x4201), {3}, {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF}}));
    EXPECT_EQ(s[1].body, concat({desc(kCluster), u32(0x4201), {0}, desc(kInst)}));
    EXPECT_EQ(s[2].type, 0x800030u);
    EXPECT_EQ(s[2].body, concat({desc(kCluster), u32(0x4201), {0, 1, 0x7F}}));
    EXPECT_EQ(s[3].body, concat({desc(kCluster), u32(0x4201), {2, 1, 0x7F, 0, 5, 1, 5}}));
    EXPECT_EQ(s[4].type, 0x800023u);
    EXPECT_EQ(s[4].body, concat({desc(kCluster), u32(0x4201)}));
    EXPECT_EQ(s[5].type, 0x800036u);
}

TEST_F(ClusterOps, TSInfoCopiesTheAnswerIntoTheOutArguments) {
    FakeBoard info([](const Sent& s) {
        return std::vector<Answer>{{0x800033, concat({Bytes(s.body.begin(), s.body.begin() + 10),
                                                      {2, 1, 0x7F, 0, 9, 0, 10}})}};
    });
    Cluster c(kCluster, queue);
    unsigned char width = 0, encoding = 0, idle = 0;
    tolk::staticList<unsigned short> slots;
    c.TSInfo(0x4201, &width, &encoding, &idle, &slots);
    EXPECT_EQ(width, 2);
    EXPECT_EQ(encoding, 1);
    EXPECT_EQ(idle, 0x7F);
    ASSERT_EQ(slots.length(), 2u);
    EXPECT_EQ(*slots.element(1), 10);
}

TEST_F(ClusterOps, ConnectIsOneWayAndStandsInForANullInstanceWithTheCluster) {
    Quick<Cluster> c(kCluster, queue);
    Quick<Addressable> b(kInst, queue);
    c.Connect(1, 2, nullptr, &b);
    c.Disconnect(1, 2, &b, nullptr);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x80001Fu);
    EXPECT_EQ(s[0].body, concat({desc(kCluster), u32(1), desc(kInst), u32(2)}));
    EXPECT_EQ(s[1].type, 0x800025u);
    EXPECT_EQ(s[1].body, concat({desc(kInst), u32(1), desc(kCluster), u32(2)}));
}

TEST_F(ClusterOps, FindAutoAllocateAllocatesInThisClusterWhenTheSearchIsRefused) {
    FakeBoard refusing([](const Sent& s) {
        if (s.type == 0x80001E) {
            return std::vector<Answer>{{0, concat({u32(0x1E), u32(4)})}};
        }
        return boardAnswer(s, desc(kInst));
    });
    Cluster c(kCluster, queue);
    tolk::TmpInstance t = c.findAutoAllocate(22);
    EXPECT_EQ(t.getTgtDesc(), kInst);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 0u);
    auto r = refusing.sent();
    ASSERT_EQ(r.size(), 2u);
    EXPECT_EQ(r[1].type, 0x80003Eu);
    EXPECT_EQ(r[1].tgt, kResourceMgr);
    EXPECT_EQ(r[1].body,
              concat({{0xFF, 0xFF, 2, 1, 0xFF, 0}, desc(kCluster), u32(1), u32(0), u32(22)}));
}

TEST_F(ClusterOps, ClusterCompInfoFillsTheListFromAnySource) {
    FakeBoard info([](const Sent&) {
        return std::vector<Answer>{
            {0x800028, concat({desc(kCluster), {2}, desc(kInst), desc(kTarget)}), true}};
    });
    Cluster c(kCluster, queue);
    tolk::staticList<tolk::CompDesc_t> out;
    c.ClusterCompInfo(&out, kCluster);
    ASSERT_EQ(out.length(), 2u);
    EXPECT_EQ(*out.element(1), kTarget);
}

}  // namespace
