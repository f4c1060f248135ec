#include "catalogue/lcon/LCON.h"

#include <gtest/gtest.h>

#include "OpSupport.h"

namespace {

using tolk::LCON;

class LCONOps : public ::testing::Test {
  protected:
    FakeBoard board;
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    tolk::TmpInstance found{kTarget, queue};
    Quick<LCON> lcon{static_cast<const tolk::Instance&>(found)};

    Sent last() const { return board.sent().back(); }
};

TEST_F(LCONOps, DefaultsGoOutAsTheirDefaultValues) {
    lcon.SetLineState(1, nullptr);
    EXPECT_EQ(last().type, 0x1610u);
    EXPECT_EQ(last().body, concat({u32(1), u32(0), u32(0)}));
    lcon.GetMetrics(0x20, nullptr);
    EXPECT_EQ(last().type, 0x160Au);
    EXPECT_EQ(last().body, concat({u32(0x20), {1}}));
    lcon.TSPSetLineState(2);
    EXPECT_EQ(last().type, 0x1612u);
    EXPECT_EQ(last().body, concat({u32(2), u32(0)}));
    lcon.StopAlarm(0x160B);
    EXPECT_EQ(last().type, 0x1613u);
    EXPECT_EQ(last().body, u32(0x160B));
}

TEST_F(LCONOps, SetProtocolSendsTheFirst32Characters) {
    tolk::staticList<char> name;
    name.realloc(40);
    for (unsigned int i = 0; i < 40; ++i) {
        *name.element(i) = static_cast<char>('a' + i % 26);
    }
    lcon.SetProtocol(name, nullptr);
    Bytes expect;
    for (unsigned int i = 0; i < 32; ++i) {
        expect.push_back(static_cast<std::uint8_t>('a' + i % 26));
    }
    EXPECT_EQ(last().type, 0x1616u);
    EXPECT_EQ(last().body, expect);
    EXPECT_EQ(name.length(), 40u);
}

TEST_F(LCONOps, GetAlarmsSendsTheCountOfTheListAndReadsOneRecordPerAlarm) {
    FakeBoard answering([](const Sent&) {
        return std::vector<Answer>{{0x1603, concat({u32(2), u32(0x10), {1}, u32(0x11), {0}})}};
    });
    tolk::staticList<unsigned int> wanted;
    wanted.realloc(2);
    *wanted.element(0) = 0x10;
    *wanted.element(1) = 0x11;
    LCON::MsgGetAlarmsCmplt_t answer;
    lcon.GetAlarms(wanted, &answer);
    EXPECT_EQ(answering.sent()[0].body, concat({u32(2), u32(0x10), u32(0x11)}));
    ASSERT_EQ(answer.AlarmInfo.length(), 2u);
    EXPECT_EQ(answer.AlarmInfo.element(0)->State, 1);
    EXPECT_EQ(answer.AlarmInfo.element(1)->Type, 0x11u);
}

TEST_F(LCONOps, VParmOperationsUseTheStandardNumbersWithDescriptorCodedValues) {
    tolk::staticList<LCON::Std_MsgSetVParm_t::Parms_t> parms;
    parms.realloc(1);
    parms.element(0)->Parm = 0x31;
    parms.element(0)->FieldDef = 0x380000;
    parms.element(0)->Val = 9;
    lcon.SetVParm(parms, nullptr);
    EXPECT_EQ(last().type, 0x2Fu);
    EXPECT_EQ(last().body, concat({{0, 1}, u32(0x31), u32(0x380000), u32(9)}));
}

TEST(LCONHandlers, ConstructionRegistersANullHandlerForTheLineStateCompletion) {
    FakeBoard board([](const Sent& s) {
        if (s.type == 0x1610) {
            return std::vector<Answer>{{0x1611, {}}};
        }
        return std::vector<Answer>{};
    });
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    Quick<LCON> lcon(static_cast<const tolk::Instance&>(found));
    testing::internal::CaptureStderr();
    lcon.StartSetLineState(1);
    // A further one-way command leaves time for the dropped completion to pass the reader.
    lcon.StopAlarm(1);
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err.find("Unregistered MsgType"), std::string::npos) << err;
    EXPECT_EQ(board.count(), 2u);
}

}  // namespace
