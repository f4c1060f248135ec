#include "framework/linkedList.h"

#include <gtest/gtest.h>

#include <sstream>
#include <vector>

namespace {

using tolk::linkedList;
using Error = linkedList<int>::OutOfBoundsError;

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

linkedList<int> make(std::vector<int> v) {
    linkedList<int> l;
    for (int x : v) {
        l.append(x);
    }
    return l;
}

std::vector<int> values(const linkedList<int>& l) {
    std::vector<int> out;
    for (unsigned int i = 0; i < l.length(); ++i) {
        out.push_back(l.value(i));
    }
    return out;
}

TEST(LinkedList, InsertPutsFirstLastOrBefore) {
    linkedList<int> l = make({1, 2, 3});
    int v = 0;
    l.insert(0, v);
    v = 9;
    l.insert(4, v);
    v = 5;
    l.insert(2, v);
    EXPECT_EQ(values(l), (std::vector<int>{0, 1, 5, 2, 3, 9}));
}

TEST(LinkedList, InsertBeyondLengthRaisesWithTheIndex) {
    linkedList<int> l = make({1, 2});
    int v = 3;
    try {
        l.insert(3, v);
        FAIL();
    } catch (const Error& e) {
        EXPECT_EQ(text(e), "list::OutOfBoundsError(Index: 3)");
    }
    EXPECT_EQ(l.length(), 2u);
}

TEST(LinkedList, RemoveReturnsTheValueAndOutOfRangeRaises) {
    linkedList<int> l = make({10, 20, 30});
    EXPECT_EQ(l.remove(1), 20);
    EXPECT_EQ(values(l), (std::vector<int>{10, 30}));
    EXPECT_THROW(l.remove(2), Error);
}

TEST(LinkedList, ElementIsRightForEveryIndexAfterRemovingTheLast) {
    linkedList<int> l = make({1, 2, 3, 4, 5});
    l.remove(4);
    for (unsigned int i = 0; i < 4; ++i) {
        EXPECT_EQ(*l.element(i), static_cast<int>(i + 1));
    }
    for (unsigned int i = 4; i-- > 0;) {
        EXPECT_EQ(*l[i], static_cast<int>(i + 1));
    }
}

TEST(LinkedList, ElementWalksBothWaysFromTheCursor) {
    linkedList<int> l = make({0, 1, 2, 3, 4, 5, 6});
    const unsigned int order[] = {5, 2, 6, 0, 3, 3, 1, 4};
    for (unsigned int i : order) {
        EXPECT_EQ(*l.element(i), static_cast<int>(i));
    }
    EXPECT_THROW(l.element(7), Error);
}

TEST(LinkedList, CursorFollowsInsertAndRemove) {
    linkedList<int> l = make({0, 1, 2, 3});
    int v = 42;
    l.insert(2, v);
    EXPECT_EQ(*l.element(3), 2);
    l.remove(0);
    EXPECT_EQ(*l.element(1), 42);
    l.remove(3);
    EXPECT_EQ(*l.element(2), 2);
    EXPECT_EQ(values(l), (std::vector<int>{1, 42, 2}));
}

TEST(LinkedList, RemovingEverythingLeavesAnEmptyUsableList) {
    linkedList<int> l = make({1});
    l.remove(0);
    EXPECT_EQ(l.length(), 0u);
    EXPECT_THROW(l.element(0), Error);
    l.append(7);
    EXPECT_EQ(*l.element(0), 7);
}

TEST(LinkedList, ValueDoesNotMoveTheCursorAndChecksBounds) {
    linkedList<int> l = make({1, 2, 3});
    EXPECT_EQ(l.value(2), 3);
    EXPECT_THROW(l.value(3), Error);
}

TEST(LinkedList, AssignmentCopiesInOrder) {
    linkedList<int> a = make({1, 2, 3});
    linkedList<int> b = make({9});
    b = a;
    a.remove(0);
    EXPECT_EQ(values(b), (std::vector<int>{1, 2, 3}));
}

TEST(LinkedList, Prints) {
    EXPECT_EQ(text(make({})), "{}");
    EXPECT_EQ(text(make({4, 5})), "{4 5}");
}

}  // namespace
