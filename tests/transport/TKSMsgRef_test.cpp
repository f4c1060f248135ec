#include "transport/TKSMsgRef.h"

#include <gtest/gtest.h>

#include <cstring>

#include "CompDesc.h"

namespace {

TEST(TKSMsgRef, CopiesShareTheBlockAndCloneCopiesSizePlus48Bytes) {
    TKSMsgRef a(5u);
    TKSMsgRef b = a;
    TKSMsgRef c;
    c = a;
    EXPECT_EQ(a.getMsgRef(), b.getMsgRef());
    EXPECT_EQ(a.getMsgRef(), c.getMsgRef());
    a.setMsgType(9);
    std::memcpy(tkMsgBody(a.getMsgRef()), "\x01\x02\x03\x04\x05", 5);
    // The room behind the body travels with a whole copy too.
    reinterpret_cast<unsigned char*>(a.getMsgRef())[5 + 47] = 0xEE;
    TKSMsgRef d = a.clone();
    ASSERT_NE(a.getMsgRef(), d.getMsgRef());
    EXPECT_EQ(0, std::memcmp(a.getMsgRef(), d.getMsgRef(), 5 + 48));
    a.free();
    d.free();
}

TEST(TKSMsgRef, ReallocAllocatesOrResizesAndFailureCarriesTheSize) {
    TKSMsgRef r;
    r.realloc(3);
    ASSERT_NE(nullptr, r.getMsgRef());
    EXPECT_EQ(3u, r.getSize());
    r.realloc(300);
    EXPECT_EQ(300u, r.getSize());
    try {
        r.realloc(0xFFFFFFF0u);
        FAIL() << "no AllocationError";
    } catch (const TKSMsgRef::AllocationError& e) {
        EXPECT_EQ(0xFFFFFFF0u, e.getSize());
    }
    EXPECT_EQ(300u, r.getSize());
    r.free();
    EXPECT_THROW(TKSMsgRef(0xFFFFFFF0u), TKSMsgRef::AllocationError);
}

TEST(TKSMsgRefDeathTest, HeaderAccessOnAnEmptyHandleStops) {
    TKSMsgRef r;
    EXPECT_DEATH(r.getMsgType(), "msgref");
    EXPECT_DEATH(r.setTrans(1), "TKSMsgRef");
}

TEST(TKCompDescEquality, DiffersOnEachOfTheFiveFields) {
    TKCompDesc base = compDesc(1, 2, 3, 4, 5);
    EXPECT_EQ(base, compDesc(1, 2, 3, 4, 5));
    EXPECT_NE(base, compDesc(9, 2, 3, 4, 5));
    EXPECT_NE(base, compDesc(1, 9, 3, 4, 5));
    EXPECT_NE(base, compDesc(1, 2, 9, 4, 5));
    EXPECT_NE(base, compDesc(1, 2, 3, 9, 5));
    EXPECT_NE(base, compDesc(1, 2, 3, 4, 9));
    TKCompDesc padded = base;
    padded.reserved0 = 0x77;
    EXPECT_EQ(base, padded);
}

}  // namespace
