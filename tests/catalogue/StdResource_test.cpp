#include "catalogue/stdresource/StdResource.h"

#include <gtest/gtest.h>

#include "OpSupport.h"
#include "catalogue/resourcemgr/ResourceMgr.h"

namespace {

using tolk::Addressable;
using tolk::StdResource;

class StdResourceOps : public ::testing::Test {
  protected:
    FakeBoard board;
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    Quick<StdResource> res{kTarget, queue};
    tolk::CompDesc_t host = queue->getHostDesc();
};

TEST_F(StdResourceOps, DetectEvtWithoutTargetAsksForTheTypeAsGroupWithOwnIdAndHostAddress) {
    res.DetectEvt(0x1230, 0, nullptr);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 1u);
    EXPECT_EQ(s[0].type, 0x16u);
    EXPECT_EQ(s[0].tgt, kTarget);
    EXPECT_EQ(s[0].trans, res.getId());
    EXPECT_EQ(s[0].body, concat({desc(host), {0, 0, 0x12, 0x30, 0, 0, 0x12, 0x30}}));
}

TEST_F(StdResourceOps, EventOperationsWithATargetUseItsAddressAndId) {
    tolk::CompDesc_t elsewhere(9, 2, 1, 19, 0);
    Quick<StdResource> other(elsewhere, queue);
    res.DetectEvt(0x1201, 0x1200, &other);
    res.CancelEvt(0x1200, &other);
    tolk::staticList<unsigned int> types;
    types.realloc(1);
    *types.element(0) = 0x1260;
    res.CancelxEvts(types, &other);
    res.CancelAllEvts(&other);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 4u);
    EXPECT_EQ(s[0].body, concat({desc(elsewhere), {0, 0, 0x12, 0x01, 0, 0, 0x12, 0x00}}));
    EXPECT_EQ(s[1].type, 0x1Au);
    EXPECT_EQ(s[1].body, (Bytes{0, 0, 0x12, 0x00}));
    EXPECT_EQ(s[2].type, 0x1Cu);
    EXPECT_EQ(s[2].body, (Bytes{0, 0, 0, 1, 0, 0, 0x12, 0x60}));
    EXPECT_EQ(s[3].type, 0x1Eu);
    EXPECT_TRUE(s[3].body.empty());
    for (const Sent& m : s) {
        EXPECT_EQ(m.trans, other.getId()) << std::hex << m.type;
        EXPECT_EQ(m.tgt, kTarget);
    }
}

TEST_F(StdResourceOps, DetectxEvtsByTypesPairsEachTypeWithTheGroupOrItself) {
    tolk::staticList<unsigned int> types;
    types.realloc(2);
    *types.element(0) = 0x1230;
    *types.element(1) = 0x1231;
    res.DetectxEvts(types, 0, nullptr);
    res.DetectxEvts(types, 0x1230, nullptr);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x18u);
    EXPECT_EQ(s[0].trans, res.getId());
    EXPECT_EQ(s[0].body, concat({desc(host), {0,    0, 0, 2,    0,    0, 0x12, 0x30, 0,   0, 0x12,
                                              0x30, 0, 0, 0x12, 0x31, 0, 0,    0x12, 0x31}}));
    EXPECT_EQ(s[1].body, concat({desc(host), {0,    0, 0, 2,    0,    0, 0x12, 0x30, 0,   0, 0x12,
                                              0x30, 0, 0, 0x12, 0x31, 0, 0,    0x12, 0x30}}));
}

TEST_F(StdResourceOps, RtcOperationsUseTheObjectsOwnId) {
    res.ArmRTC(0x1230, 2);
    res.DisArmRTC(0x1230);
    res.DisarmAllRTCs();
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[0].type, 0x21u);
    EXPECT_EQ(s[0].body, (Bytes{0, 0, 0x12, 0x30, 0, 0, 0, 2}));
    EXPECT_EQ(s[1].type, 0x25u);
    EXPECT_EQ(s[2].type, 0x29u);
    for (const Sent& m : s) {
        EXPECT_EQ(m.trans, res.getId());
    }
}

TEST_F(StdResourceOps, CountedListsSendTheirLengthNotThePlaceholder) {
    tolk::staticList<StdResource::MsgGetxParms_t::Parms_t> none;
    res.GetxParms(none, nullptr);
    tolk::staticList<StdResource::MsgGetxParms_t::Parms_t> two;
    two.realloc(2);
    two.element(0)->Parm = 7;
    two.element(0)->Val = 1;
    two.element(1)->Parm = 8;
    two.element(1)->Val = 2;
    res.GetxParms(two, nullptr);
    tolk::staticList<StdResource::MsgSetVParm_t::Parms_t> vparms;
    res.SetVParm(vparms, nullptr);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[0].type, 0x14u);
    EXPECT_EQ(s[0].body, (Bytes{0, 0, 0, 0}));
    EXPECT_EQ(s[1].body, (Bytes{0, 0, 0, 2, 0, 0, 0, 7, 0, 0, 0, 1, 0, 0, 0, 8, 0, 0, 0, 2}));
    EXPECT_EQ(s[2].type, 0x2Fu);
    EXPECT_EQ(s[2].body, (Bytes{0, 0}));
}

TEST(StdResourceRequest, GetParmReturnsTheCompletionsValue) {
    FakeBoard board([](const Sent& s) {
        return std::vector<Answer>{{0x13, concat({Bytes(s.body), u32(0x55), u32(2), {'o', 'k'}})}};
    });
    auto queue = newQueue();
    StdResource res(kTarget, queue);
    StdResource::MsgGetParmCmplt_t answer;
    res.GetParm(0x1001, &answer);
    EXPECT_EQ(*answer.pNum, 0x1001u);
    EXPECT_EQ(*answer.pVal, 0x55u);
    ASSERT_EQ(answer.Text.length(), 2u);
    EXPECT_EQ(*answer.Text.element(1), 'k');
    EXPECT_EQ(board.sent()[0].body, (Bytes{0, 0, 0x10, 0x01}));
}

TEST(StdResourceRequest, RefusalRaisesUnexpectedMsgCarryingTheErrorBody) {
    FakeBoard board([](const Sent&) {
        return std::vector<Answer>{{0, concat({u32(0x12), u32(7), u32(0x1001), u32(3)})}};
    });
    auto queue = newQueue();
    StdResource res(kTarget, queue);
    try {
        res.GetParm(0x1001, nullptr);
        FAIL() << "no exception";
    } catch (const Addressable::UnexpectedMsg& e) {
        EXPECT_EQ(e.cmdType, 0x12u);
        ASSERT_NE(e.msg, nullptr);
        auto* error = dynamic_cast<StdResource::MsgError_t*>(e.msg->getBodyDef());
        ASSERT_NE(error, nullptr);
        StdResource::MsgError_t read;
        read.readMsg(e.msg, 0);
        EXPECT_EQ(*read.pErrorCode, 7u);
    }
}

TEST(StdResourceRequest, SilenceRaisesTimeoutWithTheTypes) {
    FakeBoard board([](const Sent&) { return std::vector<Answer>{}; });
    auto queue = newQueue();
    Quick<StdResource> res(kTarget, queue);
    try {
        res.ComTest(nullptr);
        FAIL() << "no exception";
    } catch (const Addressable::Timeout& e) {
        EXPECT_EQ(e.cmdType, 0x02u);
        std::string t = textOf(e);
        EXPECT_NE(t.find(" CmdMsgType: 0x2 RetMsgType: 0x3"), std::string::npos) << t;
    }
}

TEST(StdResourceRequest, OneWayCommandsReturnAfterTheErrorWaitAndRaiseOnRefusal) {
    FakeBoard board([](const Sent& s) {
        if (s.type == 0x01) {
            return std::vector<Answer>{{0, concat({u32(0x01), u32(9)})}};
        }
        return std::vector<Answer>{};
    });
    auto queue = newQueue();
    Quick<StdResource> res(kTarget, queue);
    res.Exit();
    EXPECT_THROW(res.Ack(), Addressable::UnexpectedMsg);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 2u);
    EXPECT_EQ(s[0].type, 0x06u);
    EXPECT_EQ(s[1].type, 0x01u);
}

TEST(StdResourceManager, OwnsAManagerAtTheBoardsFixedAddressUnlessToldNot) {
    auto queue = newQueue();
    StdResource with(kTarget, queue);
    ASSERT_NE(with.getResourceMgr(), nullptr);
    EXPECT_EQ(with.getResourceMgr()->getTgtDesc(), kResourceMgr);
    StdResource without(kTarget, queue, 0);
    EXPECT_EQ(without.getResourceMgr(), nullptr);
    EXPECT_THROW(without.use(0), StdResource::NoResourceMgr);
    StdResource copy(with);
    EXPECT_NE(copy.getResourceMgr(), with.getResourceMgr());
    EXPECT_NE(copy.getId(), with.getId());
    EXPECT_EQ(copy.getInUse() + copy.getEventsDetected() + copy.getFreeOnDestroy(), 0);
}

}  // namespace
