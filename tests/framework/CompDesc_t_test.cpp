#include "framework/CompDesc_t.h"

#include <gtest/gtest.h>

#include <sstream>

#include "framework/CompAttr_t.h"

namespace {

using tolk::CompDesc_t;

const CompDesc_t base(0x0102, 3, 4, 5, 6);

TEST(CompDesc, DiffersOnEachSingleField) {
    for (const CompDesc_t& other :
         {CompDesc_t(0x0202, 3, 4, 5, 6), CompDesc_t(0x0103, 3, 4, 5, 6),
          CompDesc_t(0x0102, 9, 4, 5, 6), CompDesc_t(0x0102, 3, 9, 5, 6),
          CompDesc_t(0x0102, 3, 4, 9, 6), CompDesc_t(0x0102, 3, 4, 5, 9)}) {
        EXPECT_FALSE(base == other) << other;
        EXPECT_TRUE(base != other) << other;
    }
}

TEST(CompDesc, EqualFieldsAreTheSameAddressAndAssignCopiesAll) {
    CompDesc_t c;
    c = base;
    EXPECT_TRUE(c == base);
    EXPECT_FALSE(c != base);
    CompDesc_t viaTk(base.getTKCompDesc());
    EXPECT_TRUE(viaTk == base);
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
    TKCompDesc d = CompDesc_t(5, 2, 3, 4, 1).getTKCompDesc();
    std::ostringstream os;
    os << d << " " << 10;
    EXPECT_EQ(os.str(), "0x1:0x2:0x3:0x4:0x5 10");
}

TEST(CompAttr, Prints) {
    std::ostringstream os;
    os << tolk::CompAttr_t(7, -3);
    EXPECT_EQ(os.str(), "{key 7 value -3}");
}

}  // namespace
