#include "framework/Msg.h"

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>

#include "framework/MsgDefault_t.h"
#include "framework/tolk.h"
#include "transport/TKSMsgRef.h"

namespace {

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

TEST(Msg, CopyIsDeepAndHasNoDefinition) {
    std::unique_ptr<Msg> m(sample());
    text(*m);
    Msg c(*m);
    EXPECT_EQ(c.getBodyDef(), nullptr);
    EXPECT_NE(c.getMsgRef(), m->getMsgRef());
    EXPECT_EQ(text(c), text(*m));
    tkMsgBody(c.getMsgRef())[0] = 9;
    EXPECT_EQ(tkMsgBody(m->getMsgRef())[0], 1);
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

TEST(Msg, ReallocKeepsTheHeader) {
    Msg m(2u);
    m.setMsgType(0x20);
    m.realloc(10);
    EXPECT_EQ(m.getSize(), 10u);
    EXPECT_EQ(m.getMsgType(), 0x20u);
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

}  // namespace
