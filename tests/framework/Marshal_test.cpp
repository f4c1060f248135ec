// Messages and the marshalling of their bodies: the header and its print, a body's fields as
// the library's field calls move them (chunks, widths, first-field rule), and reads of short or
// hostile blocks that stay inside them.

#include "framework/Marshal.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <iomanip>
#include <memory>
#include <sstream>

#include "FieldCallLog.h"
#include "framework/CompAttr_t.h"
#include "framework/CompDesc_t.h"
#include "framework/Msg.h"
#include "framework/MsgDefault_t.h"
#include "framework/MsgEvtDetected_t.h"
#include "framework/tolk.h"
#include "transport/TKSMsgRef.h"

namespace {

using tolk::CompDesc_t;
using tolk::Msg;
using tolk::staticList;
using Bytes = std::vector<unsigned char>;

Bytes body(Msg& m) {
    const unsigned char* b = tkMsgBody(m.getMsgRef());
    return Bytes(b, b + m.getSize());
}

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

std::string hex(const Bytes& b) {
    std::ostringstream os;
    for (unsigned char c : b) {
        os << std::hex << std::setw(2) << std::setfill('0') << static_cast<int>(c) << ' ';
    }
    return os.str();
}

void fillBody(Msg& m, const Bytes& bytes) {
    ASSERT_EQ(m.getSize(), bytes.size());
    std::memcpy(tkMsgBody(m.getMsgRef()), bytes.data(), bytes.size());
}

class MarshalTest : public ::testing::Test {
  protected:
    void SetUp() override { fieldCalls().clear(); }
};

TEST_F(MarshalTest, FirstFieldFixedArrayAddsElementWidthTimesCount) {
    Msg m(128);
    staticList<char> addr;
    addr.realloc(3);
    std::memcpy(addr.data(), "555", 3);
    EXPECT_EQ(tolk::putFixed(&m, 0, 10, 128, addr, true), 128u);
    EXPECT_EQ(addr.length(), 128u);
    ASSERT_EQ(fieldCalls().size(), 1u);
    EXPECT_EQ(fieldCalls()[0].descs, std::vector<unsigned int>{0x53F800});
}

TEST_F(MarshalTest, ByteListsMoveInChunksOfAtMost255) {
    // Elements, then the descriptor and the offset of each chunk's field call.
    const struct {
        unsigned int n;
        std::vector<unsigned int> descs, offsets;
    } rows[] = {{1, {0x200000}, {4}},
                {255, {0x27F000}, {4}},
                {256, {0x200000, 0x27F000}, {4, 5}},
                {510, {0x27F000, 0x27F000}, {4, 259}},
                {511, {0x200000, 0x27F000, 0x27F000}, {4, 5, 260}},
                {300, {0x216000, 0x27F000}, {4, 49}}};
    for (const auto& c : rows) {
        SCOPED_TRACE(c.n);
        fieldCalls().clear();
        staticList<unsigned char> l;
        l.realloc(c.n);
        for (unsigned int i = 0; i < c.n; ++i) {
            *l[i] = static_cast<unsigned char>(i * 7);
        }
        Msg m(4 + c.n);
        EXPECT_EQ(tolk::putList(&m, 4, 4, l, false), 4 + c.n);
        ASSERT_EQ(fieldCalls().size(), c.descs.size());
        for (std::size_t i = 0; i < c.descs.size(); ++i) {
            EXPECT_EQ(fieldCalls()[i], (FieldCall{true, c.offsets[i], {c.descs[i]}})) << i;
        }
        Bytes b = body(m);
        EXPECT_EQ(Bytes(b.begin() + 4, b.end()), Bytes(l.data(), l.data() + c.n));
        fieldCalls().clear();
        staticList<unsigned char> r;
        EXPECT_EQ(tolk::getList(&m, 4, 4, r, c.n, false), 4 + c.n);
        EXPECT_EQ(fieldCalls().size(), c.descs.size());
        EXPECT_EQ(Bytes(r.data(), r.data() + r.length()), Bytes(l.data(), l.data() + c.n));
    }
}

TEST_F(MarshalTest, WordListsUseTheirFullChunkDescriptors) {
    staticList<unsigned int> w;
    w.realloc(256);
    staticList<unsigned short> h;
    h.realloc(256);
    staticList<char> c;
    c.realloc(256);
    staticList<signed char> s;
    s.realloc(256);
    Msg m(256 * 4 + 256 * 2 + 256 + 256);
    unsigned int off = tolk::putList(&m, 0, 7, w, true);
    off = tolk::putList(&m, off, 5, h, false);
    off = tolk::putList(&m, off, 10, c, false);
    off = tolk::putList(&m, off, 0, s, false);
    EXPECT_EQ(off, m.getSize());
    std::vector<unsigned int> descs;
    for (auto& call : fieldCalls()) {
        descs.push_back(call.descs[0]);
    }
    EXPECT_EQ(descs, (std::vector<unsigned int>{0x380000, 0x3FF000, 0x280000, 0x2FF000, 0x500000,
                                                0x57F000, 0x000000, 0x07F000}));
}

TEST_F(MarshalTest, ElementTypeNarrowerThanTheCodeIsRefused) {
    staticList<unsigned char> l;
    l.realloc(4);
    Msg m(16);
    EXPECT_THROW(tolk::putList(&m, 0, 7, l, true), tolk::Exception);
    EXPECT_TRUE(fieldCalls().empty());
}

TEST_F(MarshalTest, ListOrFixedArrayOfNoneMovesNothingAndOneBeyond256IsRefused) {
    Msg m(512);
    staticList<unsigned char> l;
    EXPECT_EQ(tolk::putList(&m, 8, 4, l, false), 8u);
    EXPECT_EQ(tolk::getList(&m, 8, 4, l, 0, true), 8u);
    EXPECT_EQ(tolk::putFixed(&m, 4, 4, 0, l, false), 4u);
    EXPECT_EQ(tolk::getFixed(&m, 4, 4, 0, l, false), 4u);
    EXPECT_EQ(l.length(), 0u);
    EXPECT_TRUE(fieldCalls().empty());
    // 256 still fits one descriptor (count bits all ones); 257 would be cut to one element.
    EXPECT_EQ(tolk::getFixed(&m, 4, 4, 256, l, false), 260u);
    ASSERT_EQ(fieldCalls().size(), 1u);
    EXPECT_EQ(fieldCalls()[0].descs, std::vector<unsigned int>{0x27F800});
    EXPECT_THROW(tolk::putFixed(&m, 4, 4, 257, l, false), tolk::Exception);
    EXPECT_THROW(tolk::getFixed(&m, 4, 4, 257, l, false), tolk::Exception);
    EXPECT_EQ(fieldCalls().size(), 1u);
}

TEST_F(MarshalTest, CompDescWritesItsFourByteFieldsInOneCall) {
    tolk::CompDesc_t d(0x1234, 2, 3, 18, 5);
    Msg m(6);
    m.write(&d, 0);
    ASSERT_EQ(fieldCalls().size(), 2u);
    EXPECT_EQ(fieldCalls()[0].descs, std::vector<unsigned int>{0x280000});
    EXPECT_EQ(fieldCalls()[1].descs,
              (std::vector<unsigned int>{0x200000, 0x200000, 0x200000, 0x200000}));
}

TEST_F(MarshalTest, MsgDefaultReadsAllThatIsLeftAndWritesItsList) {
    Msg m(5);
    fillBody(m, {9, 8, 7, 6, 5});
    tolk::MsgDefault_t d;
    EXPECT_EQ(m.read(&d, 2), 5u);
    ASSERT_EQ(d.GetByteSize(), 3u);
    EXPECT_EQ(*d.bytes()[0], 7);
    tolk::MsgDefault_t all;
    EXPECT_EQ(m.read(&all, 0), 5u);
    EXPECT_EQ(all.GetByteSize(), 5u);
    tolk::MsgDefault_t none;
    EXPECT_EQ(m.read(&none, 9), 9u);
    EXPECT_EQ(none.GetByteSize(), 0u);
    // Made on the caller's list, it writes that list and its copies are its own.
    staticList<unsigned char> bytes;
    bytes.realloc(3);
    *bytes[0] = 1;
    *bytes[1] = 2;
    *bytes[2] = 3;
    tolk::MsgDefault_t mine(bytes);
    Msg out(mine.GetByteSize());
    EXPECT_EQ(out.write(&mine, 0), 3u);
    EXPECT_EQ(hex(body(out)), hex({1, 2, 3}));
    tolk::MsgDefault_t copy(mine);
    *bytes[0] = 99;
    EXPECT_EQ(*copy.bytes()[0], 1);
}

// A body with a count, a counted list of u16 and a trailing list of contained attributes.
class Shaped : public tolk::MsgBody {
  public:
    unsigned int writeMsg(Msg* m, unsigned int off) override {
        count = static_cast<unsigned char>(items.length());
        off = tolk::putFirst(m, off, 0x200000, &count);
        off = tolk::putList(m, off, 5, items, false);
        return tolk::putBodies(m, off, attrs);
    }
    unsigned int readMsg(Msg* m, unsigned int off) override {
        off = tolk::getFirst(m, off, 0x200000, &count);
        off = tolk::getList(m, off, 5, items, count, false);
        return tolk::getTrailingBodies(m, off, attrs);
    }
    unsigned int GetByteSize() override { return 1 + 2 * items.length() + 8 * attrs.length(); }
    unsigned char count = 0;
    staticList<unsigned short> items;
    staticList<tolk::CompAttr_t> attrs;
};

TEST_F(MarshalTest, CountedAndTrailingBodyListsRoundTrip) {
    Shaped s;
    s.items.realloc(2);
    *s.items[0] = 0xBEEF;
    *s.items[1] = 0x0001;
    s.attrs.realloc(2);
    *s.attrs[0] = tolk::CompAttr_t(1, 2);
    *s.attrs[1] = tolk::CompAttr_t(3, -1);
    Msg m(s.GetByteSize());
    EXPECT_EQ(m.write(&s, 0), 21u);
    EXPECT_EQ(hex(body(m)), hex({0x02, 0xBE, 0xEF, 0x00, 0x01, 0, 0,    0,    1,    0,   0,
                                 0,    2,    0,    0,    0,    3, 0xFF, 0xFF, 0xFF, 0xFF}));
    Shaped r;
    EXPECT_EQ(m.read(&r, 0), 21u);
    EXPECT_EQ(r.count, 2);
    ASSERT_EQ(r.items.length(), 2u);
    EXPECT_EQ(*r.items[0], 0xBEEF);
    // Sized by the bytes left (16) as an upper bound; two elements read, the rest default.
    ASSERT_EQ(r.attrs.length(), 16u);
    EXPECT_EQ(r.attrs[1]->value, -1);
    EXPECT_EQ(r.attrs[2]->key, 0u);
}

TEST_F(MarshalTest, CountBeyondTheMessageReadsZerosNotPastTheBlock) {
    Msg m(3);
    fillBody(m, {200, 0x12, 0x34});
    Shaped r;
    EXPECT_EQ(m.read(&r, 0), 401u);
    ASSERT_EQ(r.items.length(), 200u);
    EXPECT_EQ(*r.items[0], 0x1234);
    EXPECT_EQ(*r.items[199], 0);
    EXPECT_EQ(r.attrs.length(), 0u);
}

// Every prefix of a good body, read as a message of its own: what is there decodes as sent,
// what is missing reads as zeros, and nothing is read outside the block (ASan).
TEST(BodyPrefixes, ReadAsSentOrAsZeros) {
    const struct {
        tolk::MsgBody* (*make)();
        Bytes whole;
        std::size_t fixedSize;  // bytes the body always writes back; 0: as many as it read
    } rows[] = {{[]() -> tolk::MsgBody* { return new CompDesc_t(); }, {0x12, 0x34, 5, 6, 7, 8}, 6},
                {[]() -> tolk::MsgBody* { return new tolk::CompAttr_t(); },
                 {0, 0, 0x10, 0x01, 0xFF, 0xFF, 0xFF, 0xFE},
                 8},
                {[]() -> tolk::MsgBody* { return new tolk::MsgEvtDetected_t(); },
                 {0, 0, 0x12, 0x30, 9, 8, 7},
                 4},
                {[]() -> tolk::MsgBody* { return new tolk::MsgDefault_t(); }, {1, 2, 3, 4, 5}, 0}};
    for (const auto& c : rows) {
        for (std::size_t k = 0; k < c.whole.size(); ++k) {
            SCOPED_TRACE(testing::Message() << hex(c.whole) << "cut to " << k);
            Msg in(static_cast<unsigned int>(k));
            if (k != 0) {
                std::memcpy(tkMsgBody(in.getMsgRef()), c.whole.data(), k);
            }
            std::unique_ptr<tolk::MsgBody> b(c.make());
            in.read(b.get(), 0);
            Msg out(b->GetByteSize());
            out.write(b.get(), 0);
            Bytes expected(c.whole.begin(), c.whole.begin() + static_cast<long>(k));
            expected.resize(std::max(k, c.fixedSize), 0);
            EXPECT_EQ(hex(body(out)), hex(expected));
        }
    }
}

// ---- messages ----

Msg* sample() {
    Msg* m = new Msg(3u);
    tolk::CompDesc_t src(5, 1, 1, 0, 0);
    tolk::CompDesc_t tgt(0x10, 2, 3, 18, 4);
    m->setMsgType(0x1214);
    m->setSrcAddr(src);
    m->setTgtAddr(tgt);
    m->setTrans(10001);
    unsigned char* b = tkMsgBody(m->getMsgRef());
    b[0] = 1;
    b[1] = 0x20;
    b[2] = 255;
    return m;
}

TEST(Msg, PrintsHeaderAndBodyAsBytes) {
    std::unique_ptr<Msg> m(sample());
    std::ostringstream os;
    os << 12 << " ";
    os << *m;
    os << " " << 12;
    EXPECT_EQ(os.str(),
              "12 {MsgType: 0x1214 Source: {Node 0 Board 0x1 Processor 0x1 Component 0 Instance "
              "0x5} Target: {Node 0x4 Board 0x2 Processor 0x3 Component 0x12 Instance 0x10} Size: "
              "3 Trans: 10001 Body: {ByteData {0x1 0x20 0xff }}} 12");
}

TEST(Msg, PrintingLeavesAByteDefinitionThatTheSecondPrintRefills) {
    std::unique_ptr<Msg> m(sample());
    EXPECT_EQ(m->getBodyDef(), nullptr);
    std::string first = text(*m);
    auto* def = dynamic_cast<tolk::MsgDefault_t*>(m->getBodyDef());
    ASSERT_NE(def, nullptr);
    EXPECT_EQ(def->GetByteSize(), 3u);
    tkMsgBody(m->getMsgRef())[0] = 7;
    std::string second = text(*m);
    EXPECT_EQ(m->getBodyDef(), def);
    EXPECT_EQ(def->GetByteSize(), 3u);
    EXPECT_EQ(*def->bytes()[0], 7);
    EXPECT_NE(first, second);
    EXPECT_NE(second.find("{ByteData {0x7 0x20 0xff }}"), std::string::npos);
}

TEST(Msg, CopyIsDeepAndHasNoDefinitionAndReallocKeepsTheHeader) {
    std::unique_ptr<Msg> m(sample());
    text(*m);
    Msg c(*m);
    EXPECT_EQ(c.getBodyDef(), nullptr);
    EXPECT_NE(c.getMsgRef(), m->getMsgRef());
    EXPECT_EQ(text(c), text(*m));
    tkMsgBody(c.getMsgRef())[0] = 9;
    EXPECT_EQ(tkMsgBody(m->getMsgRef())[0], 1);
    c.realloc(10);
    EXPECT_EQ(c.getSize(), 10u);
    EXPECT_EQ(c.getMsgType(), 0x1214u);
}

TEST(Msg, AdoptsABlockAndAnEmptiedSlotFreesNothing) {
    TKSMsgRef ref(4u);
    ref.setMsgType(0x77);
    {
        Msg m(&ref);
        EXPECT_EQ(m.getMsgType(), 0x77u);
        EXPECT_EQ(m.getSize(), 4u);
    }
    // The block is gone with the Msg (ASan would report a leak otherwise); a Msg whose slot was
    // emptied leaves its block to whoever took it.
    TKSMsgRef kept;
    {
        Msg m(2u);
        kept = *m.getTKMsgRef();
        *m.getTKMsgRef() = TKSMsgRef();
    }
    EXPECT_EQ(kept.getSize(), 2u);
    kept.free();
}

TEST(UniqueIds, CountUpFromTheirOwnBase) {
    unsigned int a = tolk::getUniqueTransId();
    unsigned int b = tolk::getUniqueTransId();
    EXPECT_GE(a, 10000u);
    EXPECT_EQ(b, a + 1);
    unsigned int o = tolk::getUniqueObjId();
    EXPECT_GE(o, 1000u);
    EXPECT_EQ(tolk::getUniqueObjId(), o + 1);
}

const CompDesc_t kBase(0x0102, 3, 4, 5, 6);

TEST(CompDesc, DiffersOnEachSingleField) {
    for (const CompDesc_t& other :
         {CompDesc_t(0x0202, 3, 4, 5, 6), CompDesc_t(0x0103, 3, 4, 5, 6),
          CompDesc_t(0x0102, 9, 4, 5, 6), CompDesc_t(0x0102, 3, 9, 5, 6),
          CompDesc_t(0x0102, 3, 4, 9, 6), CompDesc_t(0x0102, 3, 4, 5, 9)}) {
        EXPECT_FALSE(kBase == other) << other;
        EXPECT_TRUE(kBase != other) << other;
    }
    CompDesc_t c;
    c = kBase;
    EXPECT_TRUE(c == kBase);
    EXPECT_FALSE(c != kBase);
    EXPECT_TRUE(CompDesc_t(kBase.getTKCompDesc()) == kBase);
}

TEST(CompDesc, ClosedFormPrintsHexJoinedAndRestoresFlags) {
    std::ostringstream os;
    os << CompDesc_t(5, 2, 3, 4, 1).getTKCompDesc() << " " << 10 << " " << tolk::CompAttr_t(7, -3);
    EXPECT_EQ(os.str(), "0x1:0x2:0x3:0x4:0x5 10 {key 7 value -3}");
}

}  // namespace
