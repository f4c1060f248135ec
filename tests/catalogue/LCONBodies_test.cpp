// Line control records: descriptor-shaped parameters, metrics, the protocol string.

#include <gtest/gtest.h>

#include "Golden.h"
#include "catalogue/generated/lcon_bodies.h"

using namespace golden;
using tolk::LCON_Bodies;
using tolk::staticList;

namespace {

TEST(LCONBodies, VParmOfOneNumberIs12Bytes) {
    LCON_Bodies::Std_MsgSetVParm_t::Parms_t p;
    p.Parm = 0x1601;
    p.FieldDef = 0x380000;
    p.Val = 4;
    Bytes g;
    u32(g, 0x1601);
    u32(g, 0x380000);
    u32(g, 4);
    Encoded e = encode(p);
    EXPECT_EQ(e.size, 12u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
    EXPECT_EQ(golden::text(p), "{Parm 5633 FieldDef 3670016 Val 4}");
}

TEST(LCONBodies, VParmOfEightBytesIs16Bytes) {
    Bytes g;
    u32(g, 7);
    u32(g, 0x203800);
    g.insert(g.end(), {1, 2, 3, 4, 5, 6, 7, 8});
    LCON_Bodies::Std_MsgSetVParm_t::Parms_t p;
    auto m = msgOf(g);
    EXPECT_EQ(p.readMsg(m.get(), 0), 16u);
    EXPECT_EQ(p.GetByteSize(), 16u);
    EXPECT_EQ(golden::text(p), "{Parm 7 FieldDef 2111488 Val {1 2 3 4 5 6 7 8}}");
    LCON_Bodies::Std_MsgSetVParm_t::Parms_t copy(p);
    EXPECT_TRUE(SameBytes(encode(copy).bytes, g));
}

TEST(LCONBodies, DescriptorOf256ElementsMovesInTwoChunks) {
    Bytes g;
    u32(g, 1);
    u32(g, 0x3FF800);  // type 7, 256 elements
    for (unsigned int i = 0; i < 256; ++i) {
        u32(g, i);
    }
    LCON_Bodies::Std_MsgGetVParmCmplt_t::Parms_t p;
    auto m = msgOf(g);
    EXPECT_EQ(p.readMsg(m.get(), 0), g.size());
    EXPECT_TRUE(SameBytes(encode(p).bytes, g));
}

TEST(LCONBodies, MetricsSizeDependsOnType) {
    Bytes g;
    u32(g, 0x1616);
    u32(g, 2);
    u32(g, 900);
    u32(g, 30);
    for (unsigned int i = 0; i < 2; ++i) {
        u32(g, i);
        u32(g, 10 + i);
        u32(g, 20 + i);
    }
    LCON_Bodies::MsgGetMetricsCmplt_t m1;
    auto msg = msgOf(g);
    EXPECT_EQ(m1.readMsg(msg.get(), 0), 40u);
    EXPECT_EQ(m1.GetByteSize(), 40u);
    EXPECT_TRUE(SameBytes(encode(m1).bytes, g));
    EXPECT_EQ(golden::text(m1),
              "{Type 5654 Count 2 IntervalInfo {IntervalTotal 900 CurrentIntervalTimer 30} "
              "Metrics {{MetricsId 0 CurrentValue 10 PreviousValue 20} "
              "{MetricsId 1 CurrentValue 11 PreviousValue 21}}}");

    Bytes s;
    u32(s, 3);
    u32(s, 2);
    for (unsigned int i = 0; i < 2; ++i) {
        u32(s, i);
        u32(s, 10 + i);
    }
    LCON_Bodies::MsgGetMetricsCmplt_t m2;
    auto msg2 = msgOf(s);
    EXPECT_EQ(m2.readMsg(msg2.get(), 0), 24u);
    EXPECT_EQ(m2.GetByteSize(), 24u);
    EXPECT_EQ(golden::text(m2),
              "{Type 3 Count 2 IntervalInfo {} Metrics {{MetricsId 0 CurrentValue 10} "
              "{MetricsId 1 CurrentValue 11}}}");
}

TEST(LCONBodies, ProtocolStringIsCutAt32) {
    staticList<char> s;
    s.realloc(41);
    for (unsigned int i = 0; i < 40; ++i) {
        *s[i] = static_cast<char>('A' + i % 26);
    }
    *s[40] = 0;
    LCON_Bodies::MsgTSPSetProtocol_t body(s);
    Encoded e = encode(body);
    EXPECT_EQ(e.size, 32u);
    Bytes g(s.data(), s.data() + 32);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(LCONBodies, LineEventsReadFromTheGroupWord) {
    Bytes g;
    u32(g, 0x1611);
    u32(g, 2);
    u32(g, 9);
    LCON_Bodies::Evt_0x1611_t ev;
    auto m = msgOf(g);
    EXPECT_EQ(ev.readMsg(m.get(), 0), 12u);
    EXPECT_EQ(golden::text(ev), "{Label 5649 Type 2 Reason 9}");
    Bytes a;
    u32(a, 0x1600);
    u32(a, 3);
    u8(a, 1);
    LCON_Bodies::Evt_0x1600_t al;
    auto m2 = msgOf(a);
    EXPECT_EQ(al.readMsg(m2.get(), 0), 9u);
    EXPECT_EQ(golden::text(al), "{Label 5632 Type 3 State 1}");
}

}  // namespace
