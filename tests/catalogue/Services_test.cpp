// The board's services as the catalogue's proxies drive them: the searches and claims of the
// resource and cluster managers, the port operations of a cluster, and the claim and release
// that an instance proxy makes over its life. Each case names the blocks it must send.

#include <gtest/gtest.h>

#include <functional>
#include <memory>

#include "OpSupport.h"
#include "catalogue/cluster/Cluster.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "catalogue/stdresource/Instance.h"
#include "catalogue/tsc/TSC.h"

namespace {

using tolk::Addressable;
using tolk::Cluster;
using tolk::ClusterMgr;
using tolk::CompAttr_t;
using tolk::Instance;
using tolk::ResourceMgr;
using tolk::TmpInstance;

const tolk::CompDesc_t kCluster(0x30, 2, 1, 0, 0);
const tolk::CompDesc_t kInst(0x44, 2, 1, 22, 0);
// The first bytes of a search: any instance of board 2, processor 1.
const Bytes kAnyOnBoard = {0xFF, 0xFF, 2, 1, 0xFF, 0};
const Bytes kNoCluster = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF};

// The searches are answered from another address than the one they went to.
std::vector<Answer> answerFromElsewhere(const Sent& s) {
    auto a = boardAnswer(s, s.type == 0x800053 ? desc(kCluster) : desc(kInst));
    for (Answer& x : a) {
        x.fromElsewhere = s.type == 0x800053 || s.type == 0x80001E || s.type == 0x800027;
    }
    return a;
}

std::vector<Answer> refuseEverything(const Sent& s) {
    return {{0, concat({u32(s.type & 0xFF), u32(1)})}};
}

struct Env {
    explicit Env(FakeBoard& b) : board(b) {
        attrs.realloc(1);
        *attrs.element(0) = CompAttr_t(7, 9);
    }
    FakeBoard& board;
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    Quick<Addressable> owner{kTarget, queue};
    tolk::staticList<CompAttr_t> attrs;
};

struct Block {
    unsigned int type;
    tolk::CompDesc_t tgt;
    Bytes body;
};

struct Case {
    const char* name;
    FakeBoard::Rule rule;
    std::function<void(Env&)> run;
    std::vector<Block> sent;
};

const Bytes kUse = concat({{1}, desc(kTarget), u32(0)});
const Bytes kUnuse = concat({{1}, desc(kTarget)});

const Case kCases[] = {
    // The managers' searches.
    {"FindByTSCSendsTypeTrunkAndChannelAndAcceptsAnySource",
     answerFromElsewhere,
     [](Env& e) { EXPECT_EQ(ClusterMgr(&e.owner).findByTSC(1, 2).getTgtDesc(), kCluster); },
     {{0x800053, kClusterMgr,
       concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 3},
               u32(0),
               u32(18),
               u32(0x1200),
               u32(1),
               u32(0x1201),
               u32(2)})}}},
    {"FindByLCONSendsTypeAndLine",
     answerFromElsewhere,
     [](Env& e) { ClusterMgr(&e.owner).findByLCON(4); },
     {{0x800053, kClusterMgr,
       concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 2}, u32(0), u32(22), u32(0x1600), u32(4)})}}},
    {"FindInClusterWithTypeZeroSendsNoAttribute",
     answerFromElsewhere,
     [](Env& e) {
         Cluster c(kCluster, e.queue);
         c.find(0);
         TmpInstance lcon = c.find(22);
         EXPECT_EQ(lcon.getTgtDesc(), kInst);
         EXPECT_EQ(lcon.getMsgQueue().Get(), e.queue.Get());
     },
     {{0x80001E, kClusterMgr, concat({desc(kCluster), {0, 0}})},
      {0x80001E, kClusterMgr, concat({desc(kCluster), {22, 1}, u32(0), u32(22)})}}},
    {"FindAutoAllocateAllocatesInThisClusterWhenTheSearchIsRefused",
     [](const Sent& s) {
         return s.type == 0x80001E ? std::vector<Answer>{{0, concat({u32(0x1E), u32(4)})}}
                                   : boardAnswer(s, desc(kInst));
     },
     [](Env& e) { EXPECT_EQ(Cluster(kCluster, e.queue).findAutoAllocate(22).getTgtDesc(), kInst); },
     {{0x80001E, kClusterMgr, concat({desc(kCluster), {22, 1}, u32(0), u32(22)})},
      {0x80003E, kResourceMgr, concat({kAnyOnBoard, desc(kCluster), u32(1), u32(0), u32(22)})}}},
    {"ResourceFindWithTypeZeroAddsNoAttribute",
     nullptr,
     [](Env& e) {
         tolk::StdResource found = ResourceMgr(&e.owner).find(0, 1, 0xFFFF, e.attrs);
         EXPECT_EQ(found.getMsgQueue().Get(), e.queue.Get());
     },
     {{0x80003D, kResourceMgr, concat({kAnyOnBoard, u32(1), u32(7), u32(9)})}}},
    {"ResourceFindAppendsTheTypeBehindTheCallersAttributesOnACopy",
     nullptr,
     [](Env& e) {
         ResourceMgr(&e.owner).find(18, 1, 0xFFFF, e.attrs);
         EXPECT_EQ(e.attrs.length(), 1u);
     },
     {{0x80003D, kResourceMgr, concat({kAnyOnBoard, u32(2), u32(7), u32(9), u32(0), u32(18)})}}},
    {"AllocateWithoutClusterSendsAllOnesAndWithOneItsAddress",
     nullptr,
     [](Env& e) {
         ResourceMgr mgr(&e.owner);
         mgr.allocate(0, 1, 0xFFFF, nullptr, tolk::staticList<CompAttr_t>());
         Cluster cluster(kCluster, e.queue);
         mgr.allocate(0, 1, 0xFFFF, &cluster, tolk::staticList<CompAttr_t>());
     },
     {{0x80003E, kResourceMgr, concat({kAnyOnBoard, kNoCluster, u32(0)})},
      {0x80003E, kResourceMgr, concat({kAnyOnBoard, desc(kCluster), u32(0)})}}},
    {"UseAndUnuseSendOneElementAndFreeIsOneWay",
     nullptr,
     [](Env& e) {
         ResourceMgr mgr(&e.owner);
         tolk::StdResource res(kTarget, e.queue);
         mgr.use(&res, 0);
         mgr.unuse(&res);
         mgr.free(&res);
     },
     {{0x800059, kResourceMgr, kUse},
      {0x80005A, kResourceMgr, kUnuse},
      {0x800041, kResourceMgr, desc(kTarget)}}},

    // A cluster's ports and slots.
    {"PortAndSlotOperationsSendTheClusterAndTheirFields",
     nullptr,
     [](Env& e) {
         Cluster c(kCluster, e.queue);
         c.Activate(0x4201, nullptr, 3);
         Quick<Addressable> talker(kInst, e.queue);
         c.Activate(0x4201, &talker, 0);
         tolk::staticList<unsigned short> slots;
         c.TSAssign(0x4201, slots, 1, 0x7F);
         slots.realloc(2);
         *slots.element(0) = 5;
         *slots.element(1) = 0x105;
         c.TSAssign(0x4201, slots, 1, 0x7F);
     },
     {{0x80001B, kCluster, concat({desc(kCluster), u32(0x4201), {3}, kNoCluster})},
      {0x80001B, kCluster, concat({desc(kCluster), u32(0x4201), {0}, desc(kInst)})},
      {0x800030, kCluster, concat({desc(kCluster), u32(0x4201), {0, 1, 0x7F}})},
      {0x800030, kCluster, concat({desc(kCluster), u32(0x4201), {2, 1, 0x7F, 0, 5, 1, 5}})}}},
    {"ConnectIsOneWayAndStandsInForANullInstanceWithTheCluster",
     nullptr,
     [](Env& e) {
         Quick<Cluster> c(kCluster, e.queue);
         Quick<Addressable> b(kInst, e.queue);
         c.Connect(1, 2, nullptr, &b);
         c.Disconnect(1, 2, &b, nullptr);
     },
     {{0x80001F, kCluster, concat({desc(kCluster), u32(1), desc(kInst), u32(2)})},
      {0x800025, kCluster, concat({desc(kInst), u32(1), desc(kCluster), u32(2)})}}},

    // An instance proxy claims its resource, and on destruction cancels its events and
    // releases it (its lifecycle below), even when the cancellation goes unanswered.
    {"InstanceDestructionGoesOnWhenTheCancellationTimesOut",
     [](const Sent& s) { return s.type == 0x1E ? std::vector<Answer>{} : boardAnswer(s); },
     [](Env& e) { Quick<Instance> inst(kTarget, e.queue); },
     {{0x800059, kResourceMgr, kUse}, {0x1E, kTarget, {}}, {0x80005A, kResourceMgr, kUnuse}}},
    {"AnInstanceOfAStandardResourceClaimsIt",
     nullptr,
     [](Env& e) {
         tolk::StdResource plain(kTarget, e.queue);
         Instance inst(plain);
     },
     {{0x800059, kResourceMgr, kUse}, {0x1E, kTarget, {}}, {0x80005A, kResourceMgr, kUnuse}}},
    {"ARefusedClaimMakesNoObjectAndReleasesNothing",
     refuseEverything,
     [](Env& e) { EXPECT_THROW(Instance(kTarget, e.queue), Addressable::UnexpectedMsg); },
     {{0x800059, kResourceMgr, kUse}}},
    // Proxies made from another proxy, and temporary ones, never claim and never release.
    {"CopiesAndTemporaryProxiesSendNothing",
     nullptr,
     [](Env& e) {
         TmpInstance tmp(kTarget, e.queue);
         EXPECT_EQ(tmp.getResourceMgr(), nullptr);
         TmpInstance tmpCopy(tmp);
         Instance fromTmp(tmp, 0);
         Instance copy(static_cast<const Instance&>(tmp));
         tolk::TSC tsc(tmp);
         EXPECT_NE(fromTmp.getResourceMgr(), nullptr);
         EXPECT_EQ(copy.getInUse(), 0);
         EXPECT_EQ(tsc.getEventsDetected(), 0);
     },
     {}},
    {"AllocatedTemporaryIsMarkedForFreeingYetFreesNothing",
     [](const Sent& s) { return boardAnswer(s, desc(kInst)); },
     [](Env& e) {
         TmpInstance t = ResourceMgr(&e.owner).allocate(22, 1, 0xFFFF, nullptr);
         EXPECT_EQ(t.getTgtDesc(), kInst);
         EXPECT_EQ(t.getFreeOnDestroy(), 1);
     },
     {{0x80003E, kResourceMgr, concat({kAnyOnBoard, kNoCluster, u32(1), u32(0), u32(22)})}}},
};

class Services : public ::testing::TestWithParam<Case> {};

TEST_P(Services, SendTheirBlocks) {
    const Case& c = GetParam();
    FakeBoard board(c.rule ? c.rule : FakeBoard::Rule([](const Sent& s) {
        return boardAnswer(s, desc(tolk::CompDesc_t(0x42, 2, 1, 19, 0)));
    }));
    {
        Env env(board);
        c.run(env);
    }
    auto s = board.sent();
    ASSERT_EQ(s.size(), c.sent.size());
    for (std::size_t i = 0; i < s.size(); ++i) {
        SCOPED_TRACE(i);
        EXPECT_EQ(s[i].type, c.sent[i].type) << std::hex << s[i].type;
        EXPECT_EQ(s[i].tgt, c.sent[i].tgt);
        EXPECT_EQ(s[i].body, c.sent[i].body);
    }
}

INSTANTIATE_TEST_SUITE_P(Catalogue, Services, ::testing::ValuesIn(kCases),
                         [](const ::testing::TestParamInfo<Case>& info) {
                             return info.param.name;
                         });

// A cancellation and a release travel under the instance's own transaction, and a queue change
// moves the claim from the old queue's address to the new one's.
TEST(InstanceLifecycle, ReleasesUnderItsIdAndMovesItsClaimWithTheQueue) {
    FakeBoard board;
    auto first = newQueue();
    auto second = newQueue();
    unsigned int id = 0;
    {
        Instance inst(kTarget, first);
        EXPECT_EQ(inst.getInUse(), 1);
        EXPECT_EQ(inst.getEventsDetected(), 1);
        id = inst.getId();
        inst.msgQueueAttach(second);
        EXPECT_EQ(inst.getResourceMgr()->getMsgQueue().Get(), second.Get());
    }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 5u);
    EXPECT_EQ(s[0].type, 0x800059u);
    EXPECT_EQ(s[1].type, 0x80005Au);
    EXPECT_EQ(s[1].src, first->getHostDesc());
    EXPECT_EQ(s[2].type, 0x800059u);
    EXPECT_EQ(s[2].src, second->getHostDesc());
    EXPECT_EQ(s[3].type, 0x1Eu);
    EXPECT_EQ(s[3].trans, id);
    EXPECT_EQ(s[4].type, 0x80005Au);
}

TEST(ClusterAnswers, AreReadIntoTheCallersArgumentsAndPortOperationsWantTheirTarget) {
    auto queue = newQueue();
    {
        FakeBoard info([](const Sent& s) {
            if (s.type == 0x800032) {
                return std::vector<Answer>{
                    {0x800033, concat({Bytes(s.body.begin(), s.body.begin() + 10),
                                       {2, 1, 0x7F, 0, 9, 0, 10}})}};
            }
            return std::vector<Answer>{
                {0x800028, concat({desc(kCluster), {2}, desc(kInst), desc(kTarget)}), true}};
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
        // The component list is taken from any source.
        tolk::staticList<tolk::CompDesc_t> out;
        c.ClusterCompInfo(&out, kCluster);
        ASSERT_EQ(out.length(), 2u);
        EXPECT_EQ(*out.element(1), kTarget);
    }
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

TEST(ResourceMgrAnswers, ARefusedFreeRaisesInsideTheErrorWait) {
    FakeBoard refusing(refuseEverything);
    auto queue = newQueue();
    Quick<Addressable> owner(kTarget, queue);
    ResourceMgr mgr(&owner);
    tolk::StdResource res(tolk::CompDesc_t(0x42, 2, 1, 19, 0), queue);
    EXPECT_THROW(mgr.free(&res), Addressable::UnexpectedMsg);
}

}  // namespace
