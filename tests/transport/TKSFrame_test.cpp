#include "transport/TKSFrame.h"

#include <gtest/gtest.h>

#include <cstring>

#include "CompDesc.h"
#include "ScriptedRelay.h"

namespace {

using golden::Bytes;

class MemorySource : public TKSByteSource {
  public:
    explicit MemorySource(Bytes b) : bytes(std::move(b)) {}
    int readExact(void* dst, std::size_t n) override {
        if (bytes.size() - pos < n) {
            pos = bytes.size();
            return -1;
        }
        std::memcpy(dst, bytes.data() + pos, n);
        pos += n;
        return 0;
    }

  private:
    Bytes bytes;
    std::size_t pos = 0;
};

TKMsg32Bit* sampleBlock(unsigned int bodySize) {
    TKMsg32Bit* b = nullptr;
    tkMsgAllocate(bodySize, &b);
    b->transTag = (0x123456u << 8) | 0x5Au;
    b->type = 0x1214;
    TKCompDesc src = compDesc(0x0102, 3, 4, 5, 6), tgt = compDesc(0x0708, 9, 10, 11, 12);
    tkMsgFieldPut(b, TK_FIELD_SRC, &src);
    tkMsgFieldPut(b, TK_FIELD_TGT, &tgt);
    for (unsigned int i = 0; i < bodySize; ++i) {
        tkMsgBody(b)[i] = static_cast<unsigned char>(0xAB + i);
    }
    return b;
}

Bytes encoded(unsigned int bodySize) {
    TKMsg32Bit* b = sampleBlock(bodySize);
    Bytes out;
    EXPECT_TRUE(tksEncodeMessageFrame(b, out));
    tkMsgFree(b);
    return out;
}

const Bytes kSampleHeaderWords = {
    0x00, 0x00, 0x00, 0x5A,  // tag
    0x00, 0x12, 0x34, 0x56,  // transaction id
    0x00, 0x00, 0x12, 0x14,  // type
    0x00, 0x00, 0x00, 0x06,  // source node
    0x00, 0x00, 0x00, 0x03,  // source board
    0x00, 0x00, 0x00, 0x04,  // source processor
    0x00, 0x00, 0x00, 0x0C,  // target node
    0x00, 0x00, 0x00, 0x09,  // target board
    0x00, 0x00, 0x00, 0x0A,  // target processor
    0x00, 0x00, 0x01, 0x02,  // source instance
    0x00, 0x00, 0x00, 0x05,  // source component
    0x00, 0x00, 0x07, 0x08,  // target instance
    0x00, 0x00, 0x00, 0x0B,  // target component
};

TEST(TKSFrame, MessageFrameIsGoldenAndReadsBackIntoTheSameBlock) {
    TKMsg32Bit* b = sampleBlock(2);
    Bytes out;
    ASSERT_TRUE(tksEncodeMessageFrame(b, out));
    Bytes golden = {0x00, 0x00, 0x03, 0xE9, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00,
                    0x00, 0x38, 0x00, 0x00, 0x00, 0x02, 0x00, 0x00, 0x00, 0x00};
    golden.insert(golden.end(), kSampleHeaderWords.begin(), kSampleHeaderWords.end());
    golden.insert(golden.end(), {0x00, 0x00, 0x00, 0x02, 0xAB, 0xAC});
    EXPECT_TRUE(golden::SameBytes(out, golden));
    msg_t m = tksMakeMessageFrame(b);
    EXPECT_TRUE(golden::SameBytes(tksEncodeFrame(m), golden));
    free_msg(m);
    // The tag in the low byte of the first word comes back too, not only the transaction id.
    MemorySource src(golden);
    ASSERT_EQ(TKS_READ_OK, tksReadFrame(src, m));
    TKMsg32Bit* back = tksBlockFromFrame(m);
    free_msg(m);
    ASSERT_NE(nullptr, back);
    EXPECT_EQ(0, std::memcmp(b, back, TK_MSG_HEADER_SIZE + 2));
    tkMsgFree(back);
    tkMsgFree(b);
    // An empty body still has its size word: 76 bytes.
    EXPECT_EQ(76u, encoded(0).size());
}

TEST(TKSFrame, OpenAndAssignedBodiesAreGolden) {
    TKSOpenRequest req;
    req.addr = compDesc(0x0506, 2, 3, 4, 1);
    req.maxRetMsgSize = 512;
    req.depth = 5;
    const Bytes open =
        golden::WrittenInto(TKS_OPEN_BODY_BYTES, [&](std::uint8_t* p) { tksEncodeOpen(req, p); });
    EXPECT_TRUE(golden::SameBytes(open, {0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3, 0, 0,
                                         0, 4, 0, 0, 5, 6, 0, 0, 2, 0, 0, 0, 0, 5}));

    Bytes assigned = golden::WrittenInto(TKS_ASSIGNED_BODY_BYTES,
                                         [&](std::uint8_t* p) { tksEncodeAssigned(req.addr, p); });
    EXPECT_TRUE(
        golden::SameBytes(assigned, {0, 0, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3, 0, 0, 0, 4, 0, 0, 5, 6}));
    msg_t m;
    m.type = TKS_FRAME_ASSIGNED;
    m.size = TKS_ASSIGNED_BODY_BYTES;
    m.body = assigned.data();
    TKCompDesc back{};
    ASSERT_TRUE(tksDecodeAssigned(m, back));
    EXPECT_EQ(0x0506, back.instance);
    EXPECT_EQ(1, back.node);
    m.size = 16;
    EXPECT_FALSE(tksDecodeAssigned(m, back));
}

TEST(TKSFrame, CloseFramesAreHeadersOnly) {
    Bytes close = golden::words({0x7D0, 0, 0, 0, 0});
    msg_t m;
    m.type = TKS_FRAME_CLOSE;
    EXPECT_TRUE(golden::SameBytes(tksEncodeFrame(m), close));
    close[3] = 0xD1;
    m.type = TKS_FRAME_CLOSE_ACK;
    EXPECT_TRUE(golden::SameBytes(tksEncodeFrame(m), close));
}

TEST(TKSFrame, WordSwapIsBigEndian) {
    unsigned int words[2] = {0x01020304, 0xA0B0C0D0};
    Bytes wire = golden::WrittenInto(8, [&](std::uint8_t* p) { TKS_htonU32(p, words, 8); });
    EXPECT_TRUE(golden::SameBytes(wire, {1, 2, 3, 4, 0xA0, 0xB0, 0xC0, 0xD0}));
    unsigned int back[2] = {0, 0};
    TKS_ntohU32(back, wire.data(), 8);
    EXPECT_EQ(words[0], back[0]);
    EXPECT_EQ(words[1], back[1]);
}

// A message frame with the given parts, as it stands in memory after reading.
struct MessageFrame {
    Bytes body, ex;
    msg_t m;
    MessageFrame(Bytes b, std::uint32_t exSize) : body(std::move(b)), ex(exSize + 1, 0x33) {
        m.type = TKS_FRAME_MESSAGE;
        m.size = static_cast<std::uint32_t>(body.size());
        m.ex_size = exSize;
        m.body = body.data();
        m.ex = ex.data();
    }
};

TEST(TKSFrame, PartsOver102400AreRefusedOnSending) {
    EXPECT_FALSE(tksEncodeFrame(MessageFrame(Bytes(102400), 0).m).empty());
    EXPECT_FALSE(tksEncodeFrame(MessageFrame(Bytes(), 102400).m).empty());
    EXPECT_TRUE(tksEncodeFrame(MessageFrame(Bytes(102401), 0).m).empty());
    EXPECT_TRUE(tksEncodeFrame(MessageFrame(Bytes(), 102401).m).empty());
}

TEST(TKSFrameRead, EveryTruncationFailsWithoutAPartialFrame) {
    const Bytes good = encoded(5);
    for (std::size_t cut = 0; cut < good.size(); ++cut) {
        MemorySource src(Bytes(good.begin(), good.begin() + cut));
        msg_t m;
        EXPECT_EQ(TKS_READ_FAILED, tksReadFrame(src, m)) << "cut at " << cut;
        EXPECT_EQ(nullptr, m.body);
        EXPECT_EQ(nullptr, m.ex);
    }
}

TEST(TKSFrameRead, MalformedBodyIsNotTurnedIntoABlock) {
    // Body size, extra size and the header's last word, the count of extra bytes.
    const std::uint32_t cases[][3] = {
        {0, 0, 0}, {10, 0, 0}, {60, 4, 4}, {56, 4, 1000}, {56, 100, 4}};
    for (const auto& [size, exSize, count] : cases) {
        Bytes body(std::min<std::uint32_t>(size, 52), 0);
        if (size >= 56) {
            body = golden::concat({body, golden::u32(count)});
            body.resize(size, 0);
        }
        EXPECT_EQ(nullptr, tksBlockFromFrame(MessageFrame(body, exSize).m))
            << size << " " << exSize;
    }
}

}  // namespace
