#include "framework/Msg.h"

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>

#include "framework/CompAttr_t.h"
#include "framework/CompDesc_t.h"

#include "framework/MsgDefault_t.h"
#include "framework/tolk.h"
#include "transport/TKSMsgRef.h"

namespace {

using tolk::CompDesc_t;
using tolk::Msg;

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

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

const CompDesc_t base(0x0102, 3, 4, 5, 6);

TEST(CompDesc, DiffersOnEachSingleField) {
    for (const CompDesc_t& other :
         {CompDesc_t(0x0202, 3, 4, 5, 6), CompDesc_t(0x0103, 3, 4, 5, 6),
          CompDesc_t(0x0102, 9, 4, 5, 6), CompDesc_t(0x0102, 3, 9, 5, 6),
          CompDesc_t(0x0102, 3, 4, 9, 6), CompDesc_t(0x0102, 3, 4, 5, 9)}) {
        EXPECT_FALSE(base == other) << other;
        EXPECT_TRUE(base != other) << other;
    }
    CompDesc_t c;
    c = base;
    EXPECT_TRUE(c == base);
    EXPECT_FALSE(c != base);
    EXPECT_TRUE(CompDesc_t(base.getTKCompDesc()) == base);
}

TEST(CompDesc, PrintsInTheStreamsBase) {
    std::ostringstream os;
    os << CompDesc_t(5, 2, 3, 4, 1);
    EXPECT_EQ(os.str(), "{Node 1 Board 2 Processor 3 Component 4 Instance 5}");
    std::ostringstream hx;
    hx << std::hex << CompDesc_t(0x1F, 0x20, 0, 18, 10);
    EXPECT_EQ(hx.str(), "{Node a Board 20 Processor 0 Component 12 Instance 1f}");
}

TEST(CompDesc, ClosedFormPrintsHexJoinedAndRestoresFlags) {
    std::ostringstream os;
    os << CompDesc_t(5, 2, 3, 4, 1).getTKCompDesc() << " " << 10 << " " << tolk::CompAttr_t(7, -3);
    EXPECT_EQ(os.str(), "0x1:0x2:0x3:0x4:0x5 10 {key 7 value -3}");
}

}  // namespace
