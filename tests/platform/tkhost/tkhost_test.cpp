#include "platform/tkhost/tkhost.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "CompDesc.h"
#include "Golden.h"
#include "platform/tkhost/tkhost_switch.h"

namespace {

using golden::Bytes;
using namespace std::chrono_literals;

// The first golden.size() bytes at p against golden.
::testing::AssertionResult BytesAt(const unsigned char* p, const Bytes& golden) {
    return golden::SameBytes(Bytes(p, p + golden.size()), golden);
}

struct Block {
    TKMsg32Bit* m = nullptr;
    explicit Block(unsigned int size) { EXPECT_EQ(TK_OK, tkMsgAllocate(size, &m)); }
    ~Block() { tkMsgFree(m); }
    unsigned char* body() const { return tkMsgBody(m); }
    unsigned char* raw() const { return reinterpret_cast<unsigned char*>(m); }
};

TEST(TkMsgBlock, FieldsFillTheGoldenHeaderAndTheSizeIsReadOnly) {
    static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "golden bytes are little-endian");
    Block b(3);
    unsigned int trans = 0x1123456;  // its top bits are lost, the tag byte is kept
    unsigned char tag = 0x5A;
    unsigned int type = 0x01020304;
    TKCompDesc src = compDesc(0x1122, 0x33, 0x44, 0x55, 0x66);
    TKCompDesc tgt = compDesc(0x7788, 0x99, 0xAA, 0xBB, 0xCC);
    ASSERT_EQ(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_TAG, &tag));
    ASSERT_EQ(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_TRANS, &trans));
    ASSERT_EQ(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_TYPE, &type));
    ASSERT_EQ(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_SRC, &src));
    ASSERT_EQ(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_TGT, &tgt));
    EXPECT_TRUE(
        BytesAt(b.raw(), {0x5A, 0x56, 0x34, 0x12, 0x04, 0x03, 0x02, 0x01, 0x22, 0x11, 0x33, 0x44,
                          0x88, 0x77, 0x99, 0xAA, 0x66, 0x55, 0xCC, 0xBB, 0x03, 0x00, 0x00, 0x00}));
    tkMsgFieldGet(b.m, TK_FIELD_TRANS, &trans);
    tkMsgFieldGet(b.m, TK_FIELD_TAG, &tag);
    EXPECT_EQ(0x123456u, trans);
    EXPECT_EQ(0x5A, tag);
    unsigned int size = 100;
    EXPECT_NE(TK_OK, tkMsgFieldPut(b.m, TK_FIELD_SIZE, &size));
    tkMsgFieldGet(b.m, TK_FIELD_SIZE, &size);
    EXPECT_EQ(3u, size);
}

TEST(TkMsgBlock, ReallocateKeepsPrefixAndZeroesTheRestAndTooLargeFails) {
    TKMsg32Bit* m = nullptr;
    ASSERT_EQ(TK_OK, tkMsgAllocate(4, &m));
    std::memcpy(tkMsgBody(m), "\x01\x02\x03\x04", 4);
    m->type = 77;
    ASSERT_EQ(TK_OK, tkMsgReallocate(2, &m));
    EXPECT_EQ(2u, m->size);
    ASSERT_EQ(TK_OK, tkMsgReallocate(6, &m));
    EXPECT_EQ(77u, m->type);
    EXPECT_TRUE(BytesAt(tkMsgBody(m), {0x01, 0x02, 0x00, 0x00, 0x00, 0x00}));
    TKMsg32Bit* before = m;
    EXPECT_NE(TK_OK, tkMsgReallocate(0xFFFFFFFFu, &m));
    EXPECT_EQ(before, m);
    EXPECT_EQ(6u, m->size);
    tkMsgFree(m);
    m = reinterpret_cast<TKMsg32Bit*>(0x1);
    EXPECT_NE(TK_OK, tkMsgAllocate(0xFFFFFFFFu, &m));
    EXPECT_EQ(nullptr, m);
}

// The host library hands an offset of 0 back as it was; the framework's first-field rule
// depends on it.
TEST(TkVarField, AZeroOffsetComesBackUnadvanced) {
    Block b(4);
    std::uint32_t v = 0x0A0B0C0D;
    unsigned int offset = 0;
    ASSERT_EQ(TK_OK, tkMsgVarFieldPut(b.m, 1, &offset, 0x380000u, &v));
    EXPECT_EQ(0u, offset);
    EXPECT_TRUE(BytesAt(b.body(), {0x0A, 0x0B, 0x0C, 0x0D}));
    v = 0;
    ASSERT_EQ(TK_OK, tkMsgVarFieldGet(b.m, 1, &offset, 0x380000u, &v));
    EXPECT_EQ(0u, offset);
    EXPECT_EQ(0x0A0B0C0Du, v);
}

TEST(TkVarField, ReadPastTheEndYieldsZeros) {
    Block b(4);
    std::memcpy(b.body(), "\x01\x02\x03\x04", 4);
    std::uint32_t v = 0xFFFFFFFF;
    unsigned int offset = 2;
    ASSERT_EQ(TK_OK, tkMsgVarFieldGet(b.m, 1, &offset, 0x380000u, &v));
    EXPECT_EQ(0x03040000u, v);
    EXPECT_EQ(6u, offset);

    unsigned char chars[128];
    std::memset(chars, 0x77, sizeof chars);
    offset = 0xFFFFFF00u;
    ASSERT_EQ(TK_OK, tkMsgVarFieldGet(b.m, 1, &offset, 0x53F800u, chars));
    for (unsigned char c : chars) {
        EXPECT_EQ(0, c);
    }
}

TEST(TkVarField, WritePastTheEndIsRefusedWhole) {
    Block b(6);
    std::uint16_t first = 0xAAAA;
    std::uint32_t second = 0xBBBBBBBB;
    unsigned int offset = 1;
    EXPECT_EQ(TK_ERR_RANGE,
              tkMsgVarFieldPut(b.m, 2, &offset, 0x280000u, &first, 0x380000u, &second));
    EXPECT_EQ(1u, offset);
    // Neither the body nor the room behind it was touched.
    for (unsigned int i = 0; i < 6 + 24; ++i) {
        EXPECT_EQ(0, b.body()[i]) << "byte " << i;
    }
    offset = 0xFFFFFFFEu;
    EXPECT_EQ(TK_ERR_RANGE, tkMsgVarFieldPut(b.m, 1, &offset, 0x380000u, &second));
    // An exact fit at the end is written.
    offset = 2;
    EXPECT_EQ(TK_OK, tkMsgVarFieldPut(b.m, 1, &offset, 0x380000u, &second));
    EXPECT_TRUE(BytesAt(b.body(), {0, 0, 0xBB, 0xBB, 0xBB, 0xBB}));
}

// An open queue bound to the host address the switch gives it, whatever address was asked for;
// closed with the object.
struct BoundQueue {
    TKQueueHandle q = tkQueueOpen();
    TKCompDesc addr = compDesc(1, 2, 3, 4, 5);
    BoundQueue() {
        EXPECT_NE(TK_ERR_NO_DESCRIPTORS, q);
        EXPECT_EQ(TK_OK, tkQueueBind(q, &addr));
    }
    ~BoundQueue() { tkQueueClose(q); }
};

class TkSwitch : public ::testing::Test {
  protected:
    void SetUp() override {
        tkSwitchDetachBoards();
        tkSwitchResetUndeliverableCount();
        tkSwitchSetQueueLimit(0);
    }
    void TearDown() override {
        tkSwitchDetachBoards();
        tkSwitchSetQueueLimit(0);
    }
    static TKMsg32Bit* blockTo(TKCompDesc tgt, unsigned int type) {
        TKMsg32Bit* m = nullptr;
        tkMsgAllocate(0, &m);
        tkMsgFieldPut(m, TK_FIELD_TGT, &tgt);
        m->type = type;
        return m;
    }
};

struct Captured {
    std::vector<TKMsg32Bit*> blocks;
};

void capture(void* ctx, TKMsg32Bit* m) {
    static_cast<Captured*>(ctx)->blocks.push_back(m);
}

TEST_F(TkSwitch, BindGivesDistinctHostAddresses) {
    BoundQueue a, b;
    const TKCompDesc da = a.addr;
    const TKCompDesc db = b.addr;
    EXPECT_NE(a.q, b.q);
    EXPECT_NE(0, da.instance);
    EXPECT_NE(da.instance, db.instance);
    EXPECT_EQ(0xFF, da.board);
    EXPECT_EQ(0, da.processor + da.component + da.node);
    EXPECT_TRUE(tkSwitchIsHostAddress(da));
    EXPECT_TRUE(tkSwitchIsBound(da));
    EXPECT_FALSE(tkSwitchIsHostAddress(compDesc(5, 1, 1, 0, 0)));
    TKCompDesc again = da;
    EXPECT_EQ(TK_ERR_ALREADY_BOUND, tkQueueBind(a.q, &again));
}

TEST_F(TkSwitch, TargetMustMatchAllFiveFields) {
    BoundQueue bound;
    const TKQueueHandle a = bound.q;
    const TKCompDesc da = bound.addr;
    // Boards attached and detached again take none of the near misses.
    Captured cap;
    tkSwitchAttachBoards(capture, &cap);
    tkSwitchDetachBoards();
    std::vector<TKCompDesc> near = {da, da, da, da, da};
    near[0].instance ^= 0x100;
    near[1].board = 0xFE;
    near[2].processor = 1;
    near[3].component = 1;
    near[4].node = 1;
    for (const TKCompDesc& d : near) {
        ASSERT_EQ(TK_OK, tkMsgWrite(a, blockTo(d, 1), 0));
    }
    EXPECT_EQ(5u, tkSwitchUndeliverableCount());
    tkQueueUnbind(a, da);
    TKMsg32Bit* got = nullptr;
    EXPECT_EQ(TK_ERR_CLOSED, tkMsgRead(a, 0, &got));
    EXPECT_EQ(nullptr, got);
}

TEST_F(TkSwitch, UndeliverableBlocksAreCountedAndARefusedWriteLeavesTheBlockWithTheCaller) {
    EXPECT_NE(TK_OK, tkSwitchDeliver(blockTo(compDesc(0xFFFF, 0xFF, 0, 0, 0), 1)));
    EXPECT_EQ(1u, tkSwitchUndeliverableCount());
    TKMsg32Bit* m = blockTo(compDesc(1, 1, 1, 1, 1), 1);
    EXPECT_NE(TK_OK, tkMsgWrite(-5, m, 0));
    EXPECT_EQ(1u, m->type);  // still ours: ASan would flag a use after free
    tkMsgFree(m);
}

TEST_F(TkSwitch, CloseFreesPendingBlocksAndUnbinds) {
    TKQueueHandle a = tkQueueOpen();
    TKCompDesc da{};
    ASSERT_EQ(TK_OK, tkQueueBind(a, &da));
    ASSERT_EQ(TK_OK, tkMsgWrite(a, blockTo(da, 1), 0));
    ASSERT_EQ(TK_OK, tkQueueClose(a));
    EXPECT_FALSE(tkSwitchIsBound(da));
    TKMsg32Bit* got = nullptr;
    EXPECT_NE(TK_OK, tkMsgRead(a, 0, &got));
    EXPECT_NE(TK_OK, tkQueueClose(a));
}

// Blocking reads, woken from other threads.

TEST(TkSwitchBlocking, CloseOrUnbindWakesABlockedReader) {
    for (bool close : {true, false}) {
        BoundQueue a;
        std::atomic<int> status{-1};
        std::thread reader([&] {
            TKMsg32Bit* m = nullptr;
            status = tkMsgRead(a.q, 0, &m);
            tkMsgFree(m);
        });
        std::this_thread::sleep_for(20ms);
        if (close) {
            tkQueueClose(a.q);
        } else {
            tkQueueUnbind(a.q, a.addr);
        }
        reader.join();
        EXPECT_EQ(TK_ERR_CLOSED, status.load()) << (close ? "close" : "unbind");
    }
}

// The reader finds the queue empty now and then and waits: a write that did not wake it would
// hang the test.
TEST(TkSwitchBlocking, ManyWritersOneReaderLoseNothing) {
    BoundQueue a;
    constexpr int kWriters = 4, kEach = 500;
    std::vector<std::thread> writers;
    for (int w = 0; w < kWriters; ++w) {
        writers.emplace_back([&] {
            for (int i = 0; i < kEach; ++i) {
                TKMsg32Bit* m = nullptr;
                tkMsgAllocate(0, &m);
                tkMsgFieldPut(m, TK_FIELD_TGT, &a.addr);
                tkMsgWrite(a.q, m, 0);
            }
        });
    }
    int got = 0;
    while (got < kWriters * kEach) {
        TKMsg32Bit* m = nullptr;
        ASSERT_EQ(TK_OK, tkMsgRead(a.q, 0, &m));
        tkMsgFree(m);
        ++got;
    }
    for (auto& t : writers) {
        t.join();
    }
    EXPECT_EQ(kWriters * kEach, got);
}

}  // namespace
