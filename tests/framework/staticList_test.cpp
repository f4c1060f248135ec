#include "framework/staticList.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using tolk::staticList;

template <class T>
std::string text(const T& obj) {
    std::ostringstream os;
    os << obj;
    return os.str();
}

staticList<int> filled(unsigned int n) {
    staticList<int> l;
    l.realloc(n);
    for (unsigned int i = 0; i < n; ++i) {
        *l[i] = static_cast<int>(100 + i);
    }
    return l;
}

struct ReallocCase {
    unsigned int start;
    unsigned int to;
    bool keepsArray;
    unsigned int capacityAfter;
};

class StaticListRealloc : public ::testing::TestWithParam<ReallocCase> {};

TEST_P(StaticListRealloc, KeepsOrReplacesTheArrayByTheHalfCapacityRule) {
    const ReallocCase& c = GetParam();
    staticList<int> l = filled(c.start);
    const int* before = l.data();
    l.realloc(c.to);
    EXPECT_EQ(l.length(), c.to);
    EXPECT_EQ(l.getCapacity(), c.capacityAfter);
    EXPECT_EQ(l.data() == before, c.keepsArray);
    for (unsigned int i = 0; i < std::min(c.start, c.to); ++i) {
        EXPECT_EQ(*l[i], static_cast<int>(100 + i)) << "element " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(Rule, StaticListRealloc,
                         ::testing::Values(ReallocCase{1, 0, true, 1}, ReallocCase{4, 0, false, 0},
                                           ReallocCase{10, 5, true, 10},
                                           ReallocCase{10, 4, false, 4},
                                           ReallocCase{3, 7, false, 7}, ReallocCase{4, 4, true, 4},
                                           ReallocCase{9, 4, true, 9},
                                           ReallocCase{9, 3, false, 3}));

TEST(StaticList, GrowingFromLengthThreeKeepsTheThreeElements) {
    staticList<int> l = filled(3);
    l.realloc(7);
    EXPECT_EQ(*l[0], 100);
    EXPECT_EQ(*l[1], 101);
    EXPECT_EQ(*l[2], 102);
}

TEST(StaticList, ShrinkInPlaceThenGrowKeepsWhatTheArrayHeld) {
    staticList<int> l = filled(10);
    l.realloc(6);
    l.realloc(10);
    EXPECT_EQ(*l[9], 109);
}

TEST(StaticList, CopyAfterShrinkCopiesOnlyTheLength) {
    staticList<int> l = filled(10);
    l.realloc(6);
    l.realloc(8);  // within the kept array: no copy, length grows
    staticList<int> c;
    c = l;
    EXPECT_EQ(c.length(), 8u);
    EXPECT_EQ(*c[7], 107);
}

TEST(StaticList, NewArrayCopiesOnlyTheOldLengthNotTheCapacity) {
    staticList<int> l = filled(10);
    l.realloc(5);   // array kept, elements 5..9 still hold 105..109
    l.realloc(20);  // new array: only 5 elements come along
    EXPECT_EQ(*l[4], 104);
    EXPECT_EQ(*l[5], 0);
}

TEST(StaticList, ImpossibleSizeRaisesAllocationErrorAndKeepsTheList) {
    staticList<unsigned int> l;
    l.realloc(2);
    *l[0] = 7;
    try {
        l.realloc(0xFFFFFFFFu);
        FAIL() << "no exception";
    } catch (const staticList<unsigned int>::AllocationError& e) {
        EXPECT_EQ(text(e), "list::AllocationError(ReqSize: 4294967295)");
        EXPECT_EQ(e.reqSize, 0xFFFFFFFFu);
    }
    EXPECT_EQ(l.length(), 2u);
    EXPECT_EQ(*l[0], 7u);
}

TEST(StaticList, AllocationErrorIsATolkException) {
    staticList<char> l;
    EXPECT_THROW(l.realloc(0xFFFFFFF0u), tolk::Exception);
}

TEST(StaticList, PrintsElementsWithOneBlank) {
    staticList<int> l = filled(3);
    EXPECT_EQ(text(l), "{100 101 102}");
    staticList<int> empty;
    EXPECT_EQ(text(empty), "{}");
    staticList<unsigned char> bytes;
    bytes.realloc(2);
    *bytes[0] = 0;
    *bytes[1] = 255;
    EXPECT_EQ(text(bytes), "{0 255}");
}

TEST(StaticList, AssignmentAndCopyAreDeep) {
    staticList<int> a = filled(4);
    staticList<int> b(a);
    *a[0] = -1;
    EXPECT_EQ(*b[0], 100);
    EXPECT_EQ(b.length(), 4u);
    // Through a reference: clang rejects a written-out `a = a` (-Wself-assign-overloaded).
    const staticList<int>& self = a;
    a = self;
    EXPECT_EQ(*a[0], -1);
}

TEST(StaticList, ElementAndIndexGiveTheSameAddress) {
    staticList<int> a = filled(4);
    EXPECT_EQ(a.element(3), a[3]);
    EXPECT_EQ(a[3] - a[0], 3);
}

}  // namespace
