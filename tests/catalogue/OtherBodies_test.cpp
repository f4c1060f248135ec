// Standard, resource manager, cluster and signalling records byte for byte.

#include <gtest/gtest.h>

#include "Golden.h"
#include "catalogue/generated/cas_bodies.h"
#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/resourcemgr_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"

using namespace golden;
using tolk::staticList;

namespace {

using Std = tolk::StdResource_Bodies;

TEST(StdResourceBodies, ErrorOnParameterCommandReadsNumAndVal) {
    Bytes g;
    u32(g, 0x12);
    u32(g, 0x55);
    u32(g, 0x1601);
    u32(g, 3);
    Std::MsgError_t e;
    auto m = msgOf(g);
    EXPECT_EQ(e.readMsg(m.get(), 0), 16u);
    EXPECT_EQ(golden::text(e), "{ErrorMsg 18 ErrorCode 85 Data {Num 5633 Val 3}}");
    EXPECT_EQ(e.GetByteSize(), 16u);
    EXPECT_TRUE(SameBytes(encode(e).bytes, g));
}

TEST(StdResourceBodies, ErrorOnOtherCommandReadsWords) {
    Bytes g;
    u32(g, 0x13);
    u32(g, 1);
    u32(g, 7);
    u32(g, 8);
    Std::MsgError_t e;
    auto m = msgOf(g);
    EXPECT_EQ(e.readMsg(m.get(), 0), 16u);
    EXPECT_EQ(golden::text(e), "{ErrorMsg 19 ErrorCode 1 Data {7 8}}");
    EXPECT_EQ(e.GetByteSize(), 16u);

    Bytes three = {0, 0, 0x16, 0, 0, 0, 0, 2, 0xAA, 0xBB, 0xCC};
    Std::MsgError_t s;
    auto m2 = msgOf(three);
    (void)s.readMsg(m2.get(), 0);
    EXPECT_EQ(golden::text(s), "{ErrorMsg 5632 ErrorCode 2 Data {}}");
    EXPECT_EQ(s.GetByteSize(), 8u);
}

TEST(StdResourceBodies, ErrorWithoutDataPrintsNull) {
    unsigned int msg = 0x1214, code = 4;
    tolk::cat::ValueWord data = 0;
    Std::MsgError_t e(msg, code, data);
    EXPECT_EQ(golden::text(e), "{ErrorMsg 4628 ErrorCode 4 Data NULL}");
    EXPECT_EQ(e.GetByteSize(), 8u);
}

TEST(StdResourceBodies, GetParmTextTakesItsLengthFromTheMessage) {
    Bytes g;
    u32(g, 0x1601);
    u32(g, 4);
    u32(g, 50);
    Std::MsgGetParmCmplt_t c;
    auto m = msgOf(g);
    EXPECT_EQ(c.readMsg(m.get(), 0), 12u);
    EXPECT_EQ(c.Text.length(), 0u);
    EXPECT_EQ(golden::text(c), "{Num 5633 Val 4 TextSize 50 Text {}}");
}

TEST(StdResourceBodies, ReferenceBodyWritesAndReadsCallerVariables) {
    unsigned int count = 0xFFFFFFFF;
    staticList<Std::MsgGetxParms_t::Parms_t> parms;
    Std::MsgGetxParms_t body(count, parms);
    Bytes g = {0, 0, 0, 0};
    EXPECT_TRUE(SameBytes(encode(body).bytes, g)) << "empty list: Count 0 and nothing behind";
    EXPECT_EQ(count, 0u);

    Bytes r;
    u32(r, 1);
    u32(r, 0x10);
    u32(r, 0x20);
    auto m = msgOf(r);
    (void)body.readMsg(m.get(), 0);
    EXPECT_EQ(count, 1u);
    ASSERT_EQ(parms.length(), 1u);
    EXPECT_EQ(parms[0]->Val, 0x20u);
    EXPECT_EQ(body.Count, 0u) << "the own storage is untouched";
}

TEST(StdResourceBodies, DetectEventText) {
    tolk::CompDesc_t addr(5, 1, 2, 3, 4);
    unsigned int type = 0x1230, group = 0x1230;
    Std::MsgDetectEvt_t d(addr, type, group);
    EXPECT_EQ(golden::text(d),
              "{RetAddr {Node 4 Board 1 Processor 2 Component 3 Instance 5} EvtType 4656 "
              "EvtGroup 4656}");
    Bytes g = {0, 5, 1, 2, 3, 4};
    u32(g, 0x1230);
    u32(g, 0x1230);
    EXPECT_TRUE(SameBytes(encode(d).bytes, g));
    EXPECT_EQ(golden::text(Std::MsgAck_t()), "{}");
}

TEST(ResourceMgrBodies, CompsRecordsEndInOneTerminator) {
    using R = tolk::ResourceMgr_Bodies::CompMultipleResult_t;
    Bytes g = {1, 0, 9, 1, 1, 18, 0};
    g.insert(g.end(), {0, 3, 1, 1, 18, 0});
    u32(g, 0);
    u32(g, 18);
    u32(g, 0xFFFFFFFF);
    u32(g, 0);
    R r;
    auto m = msgOf(g);
    EXPECT_EQ(r.readMsg(m.get(), 0), g.size());
    ASSERT_GE(r.comps.length(), 1u);
    EXPECT_EQ(r.comps[0]->attrs.length(), 1u);
    EXPECT_EQ(r.comps[0]->attrs[0]->value, 18);
    R::comps_t c(*r.comps[0]);
    EXPECT_EQ(c.GetByteSize(), 22u);
    c.attrs.realloc(0);
    Bytes t = {0, 3, 1, 1, 18, 0};
    u32(t, 0xFFFFFFFF);
    u32(t, 0);
    EXPECT_TRUE(SameBytes(encode(c).bytes, t)) << "a terminator of its own";
}

TEST(ClusterBodies, SlotAssignWidthIsTheListLength) {
    tolk::CompDesc_t cl(1, 1, 1, 0, 0);
    unsigned int port = 0x4201;
    unsigned char width = 0, enc = 1, idle = 0x7F;
    staticList<unsigned short> slots;
    tolk::Cluster_Bodies::ClusterSlotAssign_t body(cl, port, width, enc, idle, slots);
    Bytes g = {0, 1, 1, 1, 0, 0};
    u32(g, 0x4201);
    g.insert(g.end(), {0, 1, 0x7F});
    EXPECT_TRUE(SameBytes(encode(body).bytes, g));
    slots.realloc(2);
    *slots[0] = 3;
    *slots[1] = 0x104;
    g[10] = 2;
    u16(g, 3);
    u16(g, 0x104);
    EXPECT_TRUE(SameBytes(encode(body).bytes, g));
}

TEST(CASBodies, DialIsAlways132Bytes) {
    unsigned int id = 3;
    staticList<char> digits;
    digits.realloc(4);
    std::memcpy(digits.data(), "123", 4);
    tolk::CAS_Bodies::MsgDial_t d(id, digits);
    Bytes g;
    u32(g, 3);
    chars(g, "123", 128);
    Encoded e = encode(d);
    EXPECT_EQ(e.size, 132u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(CASBodies, GenerateSignalKeepsTheCallersCount) {
    unsigned int id = 1;
    unsigned short count = 0;
    unsigned char format = 0;
    staticList<unsigned char> empty;
    auto w = reinterpret_cast<tolk::cat::ValueWord>(&empty);
    tolk::CAS_Bodies::MsgGenerateSignal_t g0(id, count, format, w);
    Bytes g = {0, 0, 0, 1, 0, 0, 0};
    Encoded e = encode(g0);
    EXPECT_EQ(e.size, 7u);
    EXPECT_TRUE(SameBytes(e.bytes, g));

    staticList<char> sig;
    sig.realloc(2);
    *sig[0] = 'A';
    *sig[1] = 'B';
    count = 9;
    format = 2;
    w = reinterpret_cast<tolk::cat::ValueWord>(&sig);
    tolk::CAS_Bodies::MsgGenerateSignal_t g1(id, count, format, w);
    Bytes h = {0, 0, 0, 1, 0, 9, 2, 'A', 'B'};
    EXPECT_TRUE(SameBytes(encode(g1).bytes, h));
    EXPECT_EQ(count, 9) << "Count travels as the caller set it";
}

}  // namespace
