// Every body of the catalogue: golden bytes for the records that the boards exchange, and for
// every body of the index the rules that no table may break (writes what it sizes, reads back
// what it wrote, copies deeply, survives truncated and hostile input).

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <memory>
#include <span>
#include <sstream>
#include <string>
#include <vector>

#include "Golden.h"
#include "catalogue/generated/cas_bodies.h"
#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/index.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Msg.h"
#include "framework/MsgBody.h"
#include "platform/tkhost/tkhost.h"

namespace golden {

inline std::uint8_t* bodyOf(tolk::Msg& m) {
    return reinterpret_cast<std::uint8_t*>(m.getMsgRef()) + TK_MSG_HEADER_SIZE;
}

// A message whose body is exactly these bytes.
inline std::unique_ptr<tolk::Msg> msgOf(const Bytes& b) {
    auto m = std::make_unique<tolk::Msg>(static_cast<unsigned int>(b.size()));
    if (!b.empty()) {
        std::memcpy(bodyOf(*m), b.data(), b.size());
    }
    return m;
}

inline std::string text(const tolk::MsgBody& b) {
    std::ostringstream os;
    b.toStream(&os);
    return os.str();
}

// Filled into a message before a body writes it; the byte behind the body must keep it.
inline constexpr std::uint8_t kCanary = 0xA5;

struct Canaried {
    Bytes bytes;           // the body's bytes as written, GetByteSize of them
    unsigned int size;     // GetByteSize
    unsigned int written;  // writeMsg's result
    bool canaryKept;       // the byte behind GetByteSize is untouched
};

// Sizes the message by GetByteSize and writes the body into it, as a sender does, but one byte
// longer and filled with the canary, so that a body writing past its size, or leaving a gap,
// shows in the bytes.
inline Canaried encodeCanaried(tolk::MsgBody& body) {
    Canaried c;
    c.size = body.GetByteSize();
    tolk::Msg m(c.size + 1);
    std::memset(bodyOf(m), kCanary, c.size + 1);
    c.written = body.writeMsg(&m, 0);
    const std::uint8_t* p = bodyOf(m);
    c.bytes = Bytes(p, p + c.size);
    c.canaryKept = p[c.size] == kCanary;
    return c;
}

}  // namespace golden

using namespace golden;
using tolk::MsgBody;
using tolk::staticList;
using tolk::cat::CatalogueEntry;
using tolk::cat::kCatalogue;
using tolk::cat::kCatalogueSize;

namespace {

const CatalogueEntry* entryOf(const std::string& qualified) {
    for (unsigned int i = 0; i < kCatalogueSize; ++i) {
        if (std::string(kCatalogue[i].cls) + "::" + kCatalogue[i].name == qualified) {
            return &kCatalogue[i];
        }
    }
    return nullptr;
}

Bytes desc(std::uint16_t instance, std::uint8_t board, std::uint8_t proc, std::uint8_t comp) {
    return concat({u16(instance), {board, proc, comp, 0}});
}

// A body read from `bytes` takes `consumed` of them (all if 0), prints `text` (unless null),
// sizes itself `size` (`consumed` if 0), and writes the bytes it consumed back, exactly,
// unless `writesBack` is false.
struct Golden {
    const char* body;
    Bytes bytes;
    const char* text = nullptr;
    unsigned int consumed = 0;
    unsigned int size = 0;
    bool writesBack = true;
};

Bytes words256() {
    Bytes b = words({1, 0x3FF800});  // u32, 256 elements
    for (unsigned int i = 0; i < 256; ++i) {
        b = concat({b, u32(i)});
    }
    return b;
}

const Golden kGolden[] = {
    // Standard messages.
    {"StdResource::MsgAck_t", {}, "{}"},
    {"StdResource::MsgError_t", words({0x12, 0x55, 0x1601, 3}),
     "{ErrorMsg 18 ErrorCode 85 Data {Num 5633 Val 3}}"},
    {"StdResource::MsgError_t", words({0x13, 1, 7, 8}), "{ErrorMsg 19 ErrorCode 1 Data {7 8}}"},
    {"StdResource::MsgError_t", concat({words({0x1600, 2}), {0xAA, 0xBB, 0xCC}}),
     "{ErrorMsg 5632 ErrorCode 2 Data {}}", 8},
    {"StdResource::MsgGetParmCmplt_t", words({0x1601, 4, 50}),
     "{Num 5633 Val 4 TextSize 50 Text {}}"},
    {"StdResource::MsgDetectEvt_t", concat({desc(5, 1, 2, 3), u32(0x1230), u32(0x1230)}),
     "{RetAddr {Node 0 Board 1 Processor 2 Component 3 Instance 5} EvtType 4656 "
     "EvtGroup 4656}"},
    {"StdResource::MsgGetxParms_t", words({1, 0x10, 0x20}), "{Count 1 Parms {{Parm 16 Val 32}}}"},
    {"StdResource::MsgGetVParmCmplt_t", concat({u16(1), u32(0x10), u32(0x20)}),
     "{Count 1 Parms {{Parm 16 Val 32}}}"},
    // Call control.
    {"TSC::MsgMakeCall_t", concat({text("5551234", 128), text("5551212", 128), {1}})},
    {"TSC::MsgDropCall_t", words({5, 0xE}), "{CallId 5 Reason 14 KVSet {}}"},
    {"TSC::MsgSendISDN_t", concat({words({0, 7, 2}), {0xAB, 0xCD}}),
     "{CallId 0 MessageType 7 DataLength 2 Data {171 205}}"},
    {"TSC::MsgAttach_t", concat({{1}, u32(18), desc(1, 2, 1, 18)}),
     "{Count 1 MediaInfo {{ComponentType 18 InstDesc {Node 0 Board 2 Processor 1 Component 18 "
     "Instance 1}}}}"},
    {"TSC::EvtCallState_t", words({0x1230, 0x1234, 77, 5, 3, 0xE}),
     "{EvtGroup 4656 Type 4660 Timestamp 77 CallId 5 CallState 3 Reason 14}"},
    {"TSC::EvtCallInfo_t",  // a text type
     concat({words({0x1200, 0x1204, 1, 2, 3}), text("5551212", 128)})},
    {"TSC::EvtCallInfo_t",  // a number type
     words({0x1200, 0x1202, 1, 2, 3, 0xDEAD}),
     "{EvtGroup 4608 Type 4610 Timestamp 1 CallId 2 InfoId 3 Value 57005}"},
    // The run of elements is sized to the 5 bytes left: 2 read, 3 left default.
    {"TSC::EvtISDNCallInfoSet_t",
     concat({words({0x121D, 0x121D, 1, 2, 2}), {5, 0xA1, 0x70, 2, 0x41, 0x42}}),
     "{EvtGroup 4637 Type 4637 Timestamp 1 CallId 2 Count 2 MessageType 5 Data {{IEId 161 "
     "Length {} Value {}} {IEId 112 Length 2 Value {65 66}} {IEId 0 Length 0 Value NULL} {IEId 0 "
     "Length 0 Value NULL} {IEId 0 Length 0 Value NULL}}}",
     0, 32, false},
    {"TSC::MsgDropCall_t::KVSet_t", words({0, 40}), "{Key 0 ByteLength 40 Value {}}"},
    {"TSC::MsgDropCall_t::KVSet_t",
     concat({words({0x1203, 0, 7, 0x380000, 99, 8, 0x201000}), {1, 2, 3}, words({0, 0})}),
     "{Key 4611 ByteLength 0 Value {{Id 7 Type 3670016 Value 99} {Id 8 Type 2101248 Value {1 2 "
     "3}}}}",
     0, 8 + 12 + 8 + 12 + 8},
    {"TSC::MsgDropCall_t::KVSet_t", words({0x1203, 0, 0, 0}), "{Key 4611 ByteLength 0 Value {}}"},
    // No terminator: the records stop at the end of the message; written back, one is added.
    {"TSC::MsgDropCall_t::KVSet_t", words({0x1203, 0, 5, 0x380000, 1, 5, 0x380000, 1}),
     "{Key 4611 ByteLength 0 Value {{Id 5 Type 3670016 Value 1} {Id 5 Type 3670016 Value 1}}}", 0,
     40, false},
    {"TSC::MsgDropCall_t::KVSet_t", concat({words({0x1201, 0xFFFFFFFF}), {9, 8, 7}}),
     "{Key 4609 ByteLength 4294967295 Value {9 8 7}}"},
    {"TSC::MsgGetCallInfoCmplt_t::CallInfo_t",
     concat({u32(5), {1}, u32(0), u16(3), {'a', 'b', 'c'}}),
     "{InfoId 5 State 1 Type 0 Length 3 Value {a b c}}"},
    // A shaped value counts four bytes an element in the size, whatever its width.
    {"TSC::MsgGetCallInfoCmplt_t::CallInfo_t",
     concat({u32(4), {0}, u32(0x280800), u16(0), u16(0x1234), u16(0x5678)}),
     "{InfoId 4 State 0 Type 2623488 Length 0 Value {4660 22136}}", 0, 19},
    // Line control.
    {"LCON::Std_MsgSetVParm_t::Parms_t", words({0x1601, 0x380000, 4}),
     "{Parm 5633 FieldDef 3670016 Val 4}"},
    {"LCON::Std_MsgSetVParm_t::Parms_t", concat({words({7, 0x203800}), {1, 2, 3, 4, 5, 6, 7, 8}}),
     "{Parm 7 FieldDef 2111488 Val {1 2 3 4 5 6 7 8}}"},
    {"LCON::Std_MsgGetVParmCmplt_t::Parms_t", words256()},
    {"LCON::MsgGetMetricsCmplt_t", words({0x1616, 2, 900, 30, 0, 10, 20, 1, 11, 21}),
     "{Type 5654 Count 2 IntervalInfo {IntervalTotal 900 CurrentIntervalTimer 30} Metrics "
     "{{MetricsId 0 CurrentValue 10 PreviousValue 20} {MetricsId 1 CurrentValue 11 "
     "PreviousValue 21}}}"},
    {"LCON::MsgGetMetricsCmplt_t", words({3, 2, 0, 10, 1, 11}),
     "{Type 3 Count 2 IntervalInfo {} Metrics {{MetricsId 0 CurrentValue 10} {MetricsId 1 "
     "CurrentValue 11}}}"},
    {"LCON::Evt_0x1611_t", words({0x1611, 2, 9}), "{Label 5649 Type 2 Reason 9}"},
    {"LCON::Evt_0x1600_t", concat({words({0x1600, 3}), {1}}), "{Label 5632 Type 3 State 1}"},
    // Resource manager, clusters, signalling.
    {"ResourceMgr::CompMultipleResult_t::comps_t",
     concat({desc(3, 1, 1, 18), u32(0), u32(18), u32(0xFFFFFFFF), u32(0)}),
     "{compDesc {Node 0 Board 1 Processor 1 Component 18 Instance 3} attrs {{key 0 value 18}}}"},
    {"ResourceMgr::CompMultipleResult_t::comps_t",
     concat({desc(3, 1, 1, 18), u32(0xFFFFFFFF), u32(0)}),
     "{compDesc {Node 0 Board 1 Processor 1 Component 18 Instance 3} attrs {}}"},
    {"Cluster::ClusterSlotAssign_t",
     concat({desc(1, 1, 1, 0), u32(0x4201), {2, 1, 0x7F}, u16(3), u16(0x104)}),
     "{ClustDesc {Node 0 Board 1 Processor 1 Component 0 Instance 1} portId 16897 width 2 "
     "encoding 1 idlePattern 127 slotIds {3 260}}"},
    {"CAS::MsgGenerateSignal_t", concat({u32(1), u16(0), {0}}),
     "{SignalId 1 Count 0 Format 0 SignalList {}}"},
    // Count travels as it stands; format 2 makes the list characters.
    {"CAS::MsgGenerateSignal_t", concat({u32(1), u16(9), {2, 'A', 'B'}}),
     "{SignalId 1 Count 9 Format 2 SignalList {A B}}"},
};

TEST(GoldenBody, ReadsPrintsSizesAndWritesItsBytes) {
    for (const Golden& g : kGolden) {
        SCOPED_TRACE(testing::Message() << g.body << " row " << &g - kGolden);
        const CatalogueEntry* e = entryOf(g.body);
        ASSERT_NE(e, nullptr);
        const unsigned int consumed =
            g.consumed ? g.consumed : static_cast<unsigned int>(g.bytes.size());
        std::unique_ptr<MsgBody> b(e->make());
        auto m = msgOf(g.bytes);
        EXPECT_EQ(b->readMsg(m.get(), 0), consumed);
        if (g.text != nullptr) {
            EXPECT_EQ(text(*b), g.text);
        }
        EXPECT_EQ(b->GetByteSize(), g.size ? g.size : consumed);
        // A copy owns what it holds: it prints and writes the same after the original is gone.
        std::unique_ptr<MsgBody> copy(e->copy(*b));
        const std::string original = text(*b);
        b.reset();
        EXPECT_EQ(text(*copy), original);
        if (g.writesBack) {
            Canaried c = encodeCanaried(*copy);
            EXPECT_TRUE(c.canaryKept);
            EXPECT_EQ(c.written, consumed);
            Bytes want(g.bytes.begin(), g.bytes.begin() + consumed);
            EXPECT_TRUE(SameBytes(Bytes(c.bytes.begin(), c.bytes.begin() + c.written), want));
        }
    }
}

// Bodies built on the caller's variables write what those hold and read into them.
TEST(ReferenceBodies, WriteTheCallersValuesAndReadIntoThem) {
    // Fixed runs send their first n, grown with zeros when shorter.
    std::string s(130, 'x');
    s[127] = 'y';
    staticList<char> dest;
    dest.realloc(131);
    std::memcpy(dest.data(), s.c_str(), 131);
    unsigned int id = 9;
    tolk::TSC_Bodies::MsgRedirectCall_t redirect(id, dest);
    Canaried r = encodeCanaried(redirect);
    EXPECT_EQ(r.size, 132u);
    EXPECT_TRUE(r.canaryKept);
    EXPECT_TRUE(SameBytes(r.bytes, concat({u32(9), Bytes(s.begin(), s.begin() + 128)})));
    staticList<char> proto;
    proto.realloc(2);
    *proto[0] = 'P';
    *proto[1] = 0;
    tolk::LCON_Bodies::MsgTSPSetProtocol_t setProto(proto);
    EXPECT_TRUE(SameBytes(encodeCanaried(setProto).bytes, text("P", 32)));

    // A counted list sends its real length, and the caller's count takes it.
    using Std = tolk::StdResource_Bodies;
    unsigned int count = 0xFFFFFFFF;
    staticList<Std::MsgGetxParms_t::Parms_t> parms;
    Std::MsgGetxParms_t get(count, parms);
    EXPECT_TRUE(SameBytes(encodeCanaried(get).bytes, words({0})));
    EXPECT_EQ(count, 0u);
    auto m = msgOf(words({1, 0x10, 0x20}));
    (void)get.readMsg(m.get(), 0);
    EXPECT_EQ(count, 1u);
    ASSERT_EQ(parms.length(), 1u);
    EXPECT_EQ(parms[0]->Val, 0x20u);
    EXPECT_EQ(get.Count, 0u) << "the body's own fields are untouched";

    unsigned int errMsg = 0x1214, code = 4;
    tolk::cat::ValueWord none = 0;
    Std::MsgError_t err(errMsg, code, none);
    EXPECT_EQ(text(err), "{ErrorMsg 4628 ErrorCode 4 Data NULL}");
    EXPECT_EQ(err.GetByteSize(), 8u);
}

TEST(ReferenceBodies, KeyValueListEndsInExactlyOneTerminator) {
    using KV = tolk::TSC_Bodies::MsgDropCall_t::KVSet_t;
    KV kv;
    kv.Key = 0x1203;
    Canaried none = encodeCanaried(kv);
    EXPECT_TRUE(SameBytes(none.bytes, words({0x1203, 0, 0, 0})))
        << "no list at all still ends in a terminator";
    auto m = msgOf(words({0x1203, 0, 7, 0x380000, 99, 0, 0}));
    (void)kv.readMsg(m.get(), 0);
    auto* l = reinterpret_cast<staticList<KV::Value_Key_0x1203_t>*>(kv.Value);
    ASSERT_EQ(l->length(), 1u);
    l->realloc(2);  // a terminator of the caller's own
    Canaried c = encodeCanaried(kv);
    EXPECT_TRUE(SameBytes(Bytes(c.bytes.begin(), c.bytes.begin() + c.written),
                          words({0x1203, 0, 7, 0x380000, 99, 0, 0})));
}

// ---- every body of the index ----

// Records whose size counts four bytes for every element of a shaped value, whatever its
// width, and the bodies that hold them: their size may exceed what they write.
bool generousSize(const std::string& name) {
    return name.find("CallInfo") != std::string::npos || name.find("KVSet") != std::string::npos ||
           name == "MsgAnswerCall_t" || name == "MsgDropCall_t" || name == "MsgMakeCall_t" ||
           name == "MsgRejectCall_t" || name == "MsgDial_t" || name == "MsgProceedCall_t";
}

// Varied values, small counts up front, descriptors of every shape.
Bytes pattern(std::size_t n) {
    Bytes b(n);
    for (std::size_t i = 0; i < n; ++i) {
        b[i] = static_cast<std::uint8_t>(i < 12 ? i & 3 : (i * 37 + 11) ^ (i >> 3));
    }
    return b;
}

bool endsInBodyRun(const CatalogueEntry& e) {
    if (e.desc == nullptr || e.desc->count == 0) {
        return false;
    }
    const tolk::cat::Field& last = e.desc->fields[e.desc->count - 1];
    return last.kind == tolk::cat::Kind::TrailingList && !last.list->scalars;
}

std::unique_ptr<MsgBody> readFrom(const CatalogueEntry& e, const Bytes& bytes) {
    std::unique_ptr<MsgBody> b(e.make());
    auto m = msgOf(bytes);
    (void)b->readMsg(m.get(), 0);
    return b;
}

TEST(EveryBody, WritesWhatItSizesAndReadsItBack) {
    for (const CatalogueEntry& e : std::span(kCatalogue, kCatalogueSize)) {
        SCOPED_TRACE(std::string(e.cls) + "::" + e.name);
        auto a = readFrom(e, pattern(200));
        Canaried first = encodeCanaried(*a);
        EXPECT_TRUE(first.canaryKept);
        if (generousSize(e.name)) {
            EXPECT_LE(first.written, first.size);
        } else {
            EXPECT_EQ(first.written, first.size) << text(*a);
        }
        auto b = readFrom(e, Bytes(first.bytes.begin(), first.bytes.begin() + first.written));
        std::string ta = text(*a), tb = text(*b);
        if (endsInBodyRun(e)) {
            // A run of records without a count is sized to the bytes left: the copy holds the
            // records read, then default ones, so only the part before the run must match.
            std::string label = std::string(" ") + e.desc->fields[e.desc->count - 1].label;
            EXPECT_EQ(ta.substr(0, ta.find(label)), tb.substr(0, tb.find(label)));
            continue;
        }
        EXPECT_EQ(ta, tb);
        Canaried second = encodeCanaried(*b);
        EXPECT_TRUE(SameBytes(second.bytes, first.bytes));
        std::unique_ptr<MsgBody> copy(e.copy(*b));
        b.reset();
        EXPECT_EQ(text(*copy), ta);
        EXPECT_TRUE(SameBytes(encodeCanaried(*copy).bytes, first.bytes));
    }
}

TEST(EveryBody, SurvivesEveryPrefixAndHostileCounts) {
    for (const CatalogueEntry& e : std::span(kCatalogue, kCatalogueSize)) {
        SCOPED_TRACE(std::string(e.cls) + "::" + e.name);
        Bytes full = encodeCanaried(*readFrom(e, pattern(200))).bytes;
        // Every prefix that ends in the leading fields or in the tail; in between lies a run of
        // like elements, where a cut every 13th byte lands, element after element, at each
        // offset of one.
        constexpr std::size_t kEdge = 256;
        for (std::size_t n = 0; n < full.size();
             n += n < kEdge || n + kEdge >= full.size() ? 1 : 13) {
            std::string t =
                text(*readFrom(e, Bytes(full.begin(), full.begin() + static_cast<long>(n))));
            ASSERT_EQ(t.substr(0, 1), "{");
        }
        // All ones: every count at its maximum, every descriptor at 256 elements.
        EXPECT_LE(encodeCanaried(*readFrom(e, Bytes(64, 0xFF))).written, 64u * 64u + 1024u);
    }
}

}  // namespace
