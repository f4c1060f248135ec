#include "catalogue/resourcemgr/ResourceMgr.h"

#include <gtest/gtest.h>

#include "OpSupport.h"
#include "catalogue/cluster/Cluster.h"

namespace {

using tolk::Addressable;
using tolk::CompAttr_t;
using tolk::ResourceMgr;

const tolk::CompDesc_t kFound(0x42, 2, 1, 19, 0);

class ResourceMgrOps : public ::testing::Test {
  protected:
    FakeBoard board{[](const Sent& s) { return boardAnswer(s, desc(kFound)); }};
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    Quick<Addressable> owner{kTarget, queue};
    ResourceMgr mgr{&owner};
    tolk::staticList<CompAttr_t> attrs;

    void SetUp() override {
        attrs.realloc(1);
        *attrs.element(0) = CompAttr_t(7, 9);
    }
};

TEST_F(ResourceMgrOps, FindWithTypeZeroAddsNoAttribute) {
    tolk::StdResource found = mgr.find(0, 1, 0xFFFF, attrs);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 1u);
    EXPECT_EQ(s[0].type, 0x80003Du);
    EXPECT_EQ(s[0].tgt, kResourceMgr);
    EXPECT_EQ(s[0].body, (Bytes{0xFF, 0xFF, 2, 1, 0xFF, 0, 0, 0, 0, 1, 0, 0, 0, 7, 0, 0, 0, 9}));
    EXPECT_EQ(found.getTgtDesc(), kFound);
    EXPECT_EQ(found.getMsgQueue().Get(), queue.Get());
}

TEST_F(ResourceMgrOps, FindWithATypeAppendsItBehindTheCallersAttributesOnACopy) {
    mgr.find(18, 1, 0xFFFF, attrs);
    EXPECT_EQ(attrs.length(), 1u);
    EXPECT_EQ(board.sent()[0].body, (Bytes{0xFF, 0xFF, 2, 1, 0xFF, 0, 0, 0, 0, 2, 0, 0, 0,
                                           7,    0,    0, 0, 9,    0, 0, 0, 0, 0, 0, 0, 18}));
}

TEST_F(ResourceMgrOps, AllocateWithoutClusterSendsAllOnesAndWithOneItsAddress) {
    mgr.allocate(0, 1, 0xFFFF, nullptr, tolk::staticList<CompAttr_t>());
    tolk::CompDesc_t clusterAddr(0x30, 2, 1, 0, 0);
    tolk::Cluster cluster(clusterAddr, queue);
    mgr.allocate(0, 1, 0xFFFF, &cluster, tolk::staticList<CompAttr_t>());
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x80003Eu);
    EXPECT_EQ(s[0].body,
              (Bytes{0xFF, 0xFF, 2, 1, 0xFF, 0, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0, 0, 0, 0}));
    EXPECT_EQ(s[1].body, (Bytes{0xFF, 0xFF, 2, 1, 0xFF, 0, 0, 0x30, 2, 1, 0, 0, 0, 0, 0, 0}));
}

TEST_F(ResourceMgrOps, UseAndUnuseSendOneElementAndFreeIsOneWay) {
    tolk::StdResource res(kFound, queue);
    mgr.use(&res, 0);
    mgr.unuse(&res);
    mgr.free(&res);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[0].type, 0x800059u);
    EXPECT_EQ(s[0].body, (Bytes{1, 0, 0x42, 2, 1, 19, 0, 0, 0, 0, 0}));
    EXPECT_EQ(s[1].type, 0x80005Au);
    EXPECT_EQ(s[1].body, (Bytes{1, 0, 0x42, 2, 1, 19, 0}));
    EXPECT_EQ(s[2].type, 0x800041u);
    EXPECT_EQ(s[2].body, (Bytes{0, 0x42, 2, 1, 19, 0}));
}

TEST_F(ResourceMgrOps, FindAllComponentsAndAttrInfoSendTheirFields) {
    tolk::CompDesc_t start(0, 2, 1, 0, 0), end(0xFFFF, 2, 1, 0xFF, 0);
    ResourceMgr::CompMultipleResult_t many;
    mgr.FindAllComponents(start, end, attrs, &many);
    ResourceMgr::CompAttrInfoResult_t info;
    tolk::CompDesc_t inst = kFound;
    mgr.AttrInfo(inst, 4, 1, &info);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x800062u);
    EXPECT_EQ(s[0].body, concat({desc(start), desc(end), u32(1), u32(7), u32(9)}));
    EXPECT_EQ(s[1].type, 0x80003Au);
    EXPECT_EQ(s[1].body, concat({desc(kFound), u32(4), u32(1)}));
}

TEST_F(ResourceMgrOps, RefusedFreeRaisesInsideTheErrorWait) {
    FakeBoard refusing([](const Sent&) {
        return std::vector<Answer>{{0, concat({u32(0x41), u32(3)})}};
    });
    tolk::StdResource res(kFound, queue);
    EXPECT_THROW(mgr.free(&res), Addressable::UnexpectedMsg);
}

}  // namespace
