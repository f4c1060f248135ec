// Call control records byte for byte, with the sizes that the boards expect.

#include <gtest/gtest.h>

#include "Golden.h"
#include "catalogue/generated/tsc_bodies.h"

using namespace golden;
using tolk::staticList;
using tolk::TSC_Bodies;
using tolk::cat::ValueWord;

namespace {

staticList<char> text(const char* s) {
    staticList<char> l;
    unsigned int n = static_cast<unsigned int>(std::strlen(s)) + 1;
    l.realloc(n);
    std::memcpy(l.data(), s, n);
    return l;
}

TEST(TSCBodies, MakeCallWithEmptyAddressesIs257Bytes) {
    auto dest = text("");
    auto orig = text("");
    unsigned char progress = 0;
    staticList<TSC_Bodies::MsgMakeCall_t::KVSet_t> kv;
    TSC_Bodies::MsgMakeCall_t body(dest, orig, progress, kv);
    Bytes g;
    zeros(g, 257);
    Encoded e = encode(body);
    EXPECT_EQ(e.size, 257u);
    EXPECT_EQ(e.written, 257u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(TSCBodies, MakeCallCarriesAddressesAndProgress) {
    auto dest = text("5551234");
    auto orig = text("5551212");
    unsigned char progress = 1;
    staticList<TSC_Bodies::MsgMakeCall_t::KVSet_t> kv;
    TSC_Bodies::MsgMakeCall_t body(dest, orig, progress, kv);
    Bytes g;
    chars(g, "5551234", 128);
    chars(g, "5551212", 128);
    u8(g, 1);
    EXPECT_TRUE(SameBytes(encode(body).bytes, g));
}

TEST(TSCBodies, AddressOf130CharactersSendsItsFirst128) {
    std::string s(130, 'x');
    s[127] = 'y';
    s[128] = 'z';
    auto dest = text(s.c_str());
    unsigned int id = 9;
    auto orig = text("");
    TSC_Bodies::MsgRedirectCall_t body(id, dest);
    (void)orig;
    Bytes g;
    u32(g, 9);
    g.insert(g.end(), s.begin(), s.begin() + 128);
    Encoded e = encode(body);
    EXPECT_EQ(e.size, 132u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(TSCBodies, DropCallWithoutKeysIs8Bytes) {
    unsigned int id = 5, reason = 0xE;
    staticList<TSC_Bodies::MsgDropCall_t::KVSet_t> kv;
    TSC_Bodies::MsgDropCall_t body(id, reason, kv);
    Bytes g = {0, 0, 0, 5, 0, 0, 0, 0x0E};
    Encoded e = encode(body);
    EXPECT_EQ(e.size, 8u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(TSCBodies, CountedListsSendTheirRealLength) {
    unsigned char count = 0xFF;
    staticList<TSC_Bodies::MsgAttach_t::MediaInfo_t> media;
    media.realloc(3);
    for (unsigned int i = 0; i < 3; ++i) {
        media[i]->ComponentType = 18 + i;
        media[i]->InstDesc = tolk::CompDesc_t(static_cast<unsigned short>(i + 1), 2, 1, 18, 0);
    }
    TSC_Bodies::MsgAttach_t body(count, media);
    Bytes g = {3};
    for (unsigned int i = 0; i < 3; ++i) {
        u32(g, 18 + i);
        u16(g, static_cast<std::uint16_t>(i + 1));
        g.insert(g.end(), {2, 1, 18, 0});
    }
    EXPECT_TRUE(SameBytes(encode(body).bytes, g));
    EXPECT_EQ(count, 3) << "the caller's count is overwritten through the reference";

    unsigned int id = 0, type = 7, len = 0xFFFFFFFF;
    staticList<unsigned char> data;
    data.realloc(2);
    *data[0] = 0xAB;
    *data[1] = 0xCD;
    TSC_Bodies::MsgSendISDN_t isdn(id, type, len, data);
    Bytes g2;
    u32(g2, 0);
    u32(g2, 7);
    u32(g2, 2);
    g2.insert(g2.end(), {0xAB, 0xCD});
    EXPECT_TRUE(SameBytes(encode(isdn).bytes, g2));
}

TEST(TSCBodies, EventSizes) {
    Bytes b;
    u32(b, 0x1230);
    u32(b, 0x1234);
    u32(b, 77);
    u32(b, 5);
    u32(b, 3);
    u32(b, 0xE);
    TSC_Bodies::EvtCallState_t st;
    auto m = msgOf(b);
    EXPECT_EQ(st.readMsg(m.get(), 0), 24u);
    EXPECT_EQ(st.CallId, 5u);
    EXPECT_EQ(st.CallState, 3u);
    EXPECT_EQ(st.Reason, 0xEu);
    EXPECT_EQ(st.GetByteSize(), 24u);
    EXPECT_EQ(golden::text(st),
              "{EvtGroup 4656 Type 4660 Timestamp 77 CallId 5 CallState 3 Reason 14}");
    EXPECT_EQ(TSC_Bodies::EvtChanState_t().GetByteSize(), 16u);
    EXPECT_EQ(TSC_Bodies::EvtTrace_t().GetByteSize(), 16u);
    EXPECT_EQ(TSC_Bodies::EvtGCExtension_t().GetByteSize(), 280u);
}

TEST(TSCBodies, CallInfoEventValueFollowsType) {
    Bytes b;
    u32(b, 0x1200);
    u32(b, 0x1204);  // a text type
    u32(b, 1);
    u32(b, 2);
    u32(b, 3);
    chars(b, "5551212", 128);
    TSC_Bodies::EvtCallInfo_t ev;
    auto m = msgOf(b);
    EXPECT_EQ(ev.readMsg(m.get(), 0), 148u);
    EXPECT_EQ(ev.GetByteSize(), 148u);
    ASSERT_NE(ev.Value, 0u);
    EXPECT_STREQ(reinterpret_cast<staticList<char>*>(ev.Value)->data(), "5551212");
    EXPECT_TRUE(SameBytes(encode(ev).bytes, b));

    Bytes n;
    u32(n, 0x1200);
    u32(n, 0x1202);  // a number type
    u32(n, 1);
    u32(n, 2);
    u32(n, 3);
    u32(n, 0xDEAD);
    TSC_Bodies::EvtCallInfo_t num;
    auto m2 = msgOf(n);
    EXPECT_EQ(num.readMsg(m2.get(), 0), 24u);
    EXPECT_EQ(num.Value, 0xDEADu);
    EXPECT_EQ(num.GetByteSize(), 24u);
    EXPECT_EQ(golden::text(num),
              "{EvtGroup 4608 Type 4610 Timestamp 1 CallId 2 InfoId 3 Value 57005}");
}

TEST(TSCBodies, IsdnElementsRunToTheEnd) {
    Bytes b;
    u32(b, 0x121D);
    u32(b, 0x121D);
    u32(b, 1);
    u32(b, 2);
    u32(b, 2);
    u8(b, 5);
    b.insert(b.end(), {0xA1, 0x70, 0x02, 0x41, 0x42});
    TSC_Bodies::EvtISDNCallInfoSet_t ev;
    auto m = msgOf(b);
    EXPECT_EQ(ev.readMsg(m.get(), 0), b.size());
    ASSERT_GT(ev.Data.length(), 2u) << "the run is sized to the bytes left";
    EXPECT_EQ(ev.Data[0]->IEId, 0xA1);
    EXPECT_EQ(ev.Data[0]->GetByteSize(), 1u);
    EXPECT_EQ(ev.Data[1]->IEId, 0x70);
    EXPECT_EQ(ev.Data[1]->Length, 2u);
    EXPECT_EQ(golden::text(*ev.Data[1]), "{IEId 112 Length 2 Value {65 66}}");
    EXPECT_EQ(golden::text(*ev.Data[0]), "{IEId 161 Length {} Value {}}");
    EXPECT_EQ(golden::text(*ev.Data[2]), "{IEId 0 Length 0 Value NULL}");
}

using KV = TSC_Bodies::MsgDropCall_t::KVSet_t;
using Rec = KV::Value_Key_0x1203_t;

TEST(TSCBodies, KeyZeroIs8BytesWhateverByteLengthSays) {
    KV kv;
    kv.Key = 0;
    kv.ByteLength = 40;
    EXPECT_EQ(kv.GetByteSize(), 8u);
    Bytes g;
    u32(g, 0);
    u32(g, 40);
    Encoded e = encode(kv);
    EXPECT_TRUE(SameBytes(e.bytes, g));
}

TEST(TSCBodies, Key1203ListGetsOneTerminator) {
    Bytes b;
    u32(b, 0x1203);
    u32(b, 0);
    u32(b, 7);         // Id
    u32(b, 0x380000);  // one u32
    u32(b, 99);
    u32(b, 8);         // Id
    u32(b, 0x201000);  // three bytes
    b.insert(b.end(), {1, 2, 3});
    u32(b, 0);
    u32(b, 0);  // terminator
    KV kv;
    auto m = msgOf(b);
    EXPECT_EQ(kv.readMsg(m.get(), 0), b.size());
    auto* l = reinterpret_cast<staticList<Rec>*>(kv.Value);
    ASSERT_EQ(l->length(), 2u);
    EXPECT_EQ((*l)[0]->Value, 99u);
    EXPECT_EQ(golden::text(*(*l)[1]), "{Id 8 Type 2101248 Value {1 2 3}}");
    // Written back: one terminator, not two, whether or not the list holds one.
    Encoded e = encode(kv);
    EXPECT_TRUE(SameBytes(Bytes(e.bytes.begin(), e.bytes.begin() + e.written), b));
    l->realloc(3);
    (*l)[2]->Id = 0;
    (*l)[2]->Type = 0;
    Encoded e2 = encode(kv);
    EXPECT_TRUE(SameBytes(Bytes(e2.bytes.begin(), e2.bytes.begin() + e2.written), b));
}

TEST(TSCBodies, Key1203WithoutAListSendsATerminator) {
    KV kv;
    kv.Key = 0x1203;
    kv.ByteLength = 0;
    Bytes g;
    u32(g, 0x1203);
    u32(g, 0);
    u32(g, 0);
    u32(g, 0);
    Encoded e = encode(kv);
    EXPECT_EQ(e.size, 16u);
    EXPECT_EQ(e.written, 16u);
    EXPECT_TRUE(SameBytes(e.bytes, g));
    KV back;
    auto m = msgOf(g);
    EXPECT_EQ(back.readMsg(m.get(), 0), 16u);
    EXPECT_EQ(golden::text(back), "{Key 4611 ByteLength 0 Value {}}");
}

TEST(TSCBodies, Key1203WithoutTerminatorStopsAtTheEnd) {
    Bytes b;
    u32(b, 0x1203);
    u32(b, 0);
    for (int i = 0; i < 3; ++i) {
        u32(b, 5);
        u32(b, 0x380000);
        u32(b, 1);
    }
    KV kv;
    auto m = msgOf(b);
    EXPECT_EQ(kv.readMsg(m.get(), 0), b.size());
    EXPECT_EQ(reinterpret_cast<staticList<Rec>*>(kv.Value)->length(), 3u);
}

TEST(TSCBodies, HugeByteLengthIsCappedByTheMessage) {
    Bytes b;
    u32(b, 0x1201);
    u32(b, 0xFFFFFFFF);
    b.insert(b.end(), {9, 8, 7});
    KV kv;
    auto m = msgOf(b);
    EXPECT_EQ(kv.readMsg(m.get(), 0), 11u);
    EXPECT_EQ(golden::text(kv), "{Key 4609 ByteLength 4294967295 Value {9 8 7}}");
}

TEST(TSCBodies, CallInfoTextAndShapedValues) {
    Bytes b;
    u32(b, 5);  // text item
    u8(b, 1);
    u32(b, 0);
    u16(b, 3);
    b.insert(b.end(), {'a', 'b', 'c'});
    TSC_Bodies::MsgGetCallInfoCmplt_t::CallInfo_t ci;
    auto m = msgOf(b);
    EXPECT_EQ(ci.readMsg(m.get(), 0), 14u);
    EXPECT_EQ(ci.GetByteSize(), 14u);
    EXPECT_EQ(golden::text(ci), "{InfoId 5 State 1 Type 0 Length 3 Value {a b c}}");

    Bytes s;
    u32(s, 4);  // shaped: two u16
    u8(s, 0);
    u32(s, 0x280800);
    u16(s, 0);
    u16(s, 0x1234);
    u16(s, 0x5678);
    TSC_Bodies::MsgGetCallInfoCmplt_t::CallInfo_t v;
    auto m2 = msgOf(s);
    EXPECT_EQ(v.readMsg(m2.get(), 0), 15u);
    EXPECT_EQ(v.GetByteSize(), 19u) << "four bytes an element whatever the width";
    EXPECT_EQ(golden::text(v), "{InfoId 4 State 0 Type 2623488 Length 0 Value {4660 22136}}");
}

}  // namespace
