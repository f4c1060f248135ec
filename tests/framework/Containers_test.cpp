#include <gtest/gtest.h>

#include <sstream>
#include <vector>

#include "framework/String.h"
#include "framework/keyedList.h"
#include "framework/linkedList.h"
#include "framework/staticList.h"

namespace {

using tolk::linkedList;
using tolk::staticList;
using Error = linkedList<int>::OutOfBoundsError;

template <class T>
std::string text(const T& obj) {
    std::ostringstream os;
    os << obj;
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

TEST(LinkedList, InsertPutsFirstLastOrBeforeAndBeyondTheLengthRaises) {
    linkedList<int> l = make({1, 2, 3});
    for (auto [at, value] : {std::pair{0u, 0}, {4u, 9}, {2u, 5}}) {
        int v = value;
        l.insert(at, v);
    }
    EXPECT_EQ(values(l), (std::vector<int>{0, 1, 5, 2, 3, 9}));
    int v = 3;
    try {
        l.insert(7, v);
        FAIL();
    } catch (const Error& e) {
        EXPECT_EQ(text(e), "list::OutOfBoundsError(Index: 7)");
    }
    EXPECT_EQ(l.length(), 6u);
    EXPECT_THROW(l.value(6), Error);
}

TEST(LinkedList, RemoveReturnsTheValueAndOutOfRangeRaises) {
    linkedList<int> l = make({10, 20, 30});
    EXPECT_EQ(l.remove(1), 20);
    EXPECT_EQ(values(l), (std::vector<int>{10, 30}));
    EXPECT_THROW(l.remove(2), Error);
    l.remove(0);
    l.remove(0);
    EXPECT_THROW(l.element(0), Error);
    l.append(7);
    EXPECT_EQ(*l.element(0), 7);
}

TEST(LinkedList, ElementWalksBothWaysFromACursorThatFollowsInsertAndRemove) {
    linkedList<int> l = make({0, 1, 2, 3, 4, 5, 6, 7});
    l.remove(7);
    for (unsigned int i : {5u, 2u, 6u, 0u, 3u, 3u, 1u, 4u, 6u}) {
        EXPECT_EQ(*l.element(i), static_cast<int>(i));
    }
    EXPECT_THROW(l.element(7), Error);
    int v = 42;
    l.insert(2, v);
    EXPECT_EQ(*l.element(3), 2);
    l.remove(0);
    EXPECT_EQ(*l.element(1), 42);
    l.remove(3);
    EXPECT_EQ(*l[2], 2);
    EXPECT_EQ(values(l), (std::vector<int>{1, 42, 2, 4, 5, 6}));
}

TEST(LinkedList, AssignmentCopiesInOrderAndPrints) {
    linkedList<int> a = make({1, 2, 3});
    linkedList<int> b = make({9});
    b = a;
    a.remove(0);
    EXPECT_EQ(values(b), (std::vector<int>{1, 2, 3}));
    EXPECT_EQ(text(make({})), "{}");
    EXPECT_EQ(text(make({4, 5})), "{4 5}");
}

staticList<int> filled(unsigned int n) {
    staticList<int> l;
    l.realloc(n);
    for (unsigned int i = 0; i < n; ++i) {
        *l[i] = static_cast<int>(100 + i);
    }
    return l;
}

// Through each length in turn: the array is kept while the new length lies between half the
// capacity and the capacity, else replaced by one of exactly the new length that takes over only
// the current elements. A kept array still holds what lay beyond a shorter length; a new one holds
// zeros there.
TEST(StaticList, ReallocKeepsOrReplacesTheArrayByTheHalfCapacityRule) {
    const struct {
        std::vector<unsigned int> lengths;
        bool keepsArray;  // on the last step
        unsigned int capacityAfter;
        unsigned int held;  // leading elements that still hold their first values
    } rows[] = {{{1, 0}, true, 1, 0},       {{4, 0}, false, 0, 0}, {{10, 5}, true, 10, 5},
                {{10, 4}, false, 4, 4},     {{3, 7}, false, 7, 3}, {{4, 4}, true, 4, 4},
                {{9, 4}, true, 9, 4},       {{9, 3}, false, 3, 3}, {{10, 6, 8}, true, 10, 8},
                {{10, 5, 20}, false, 20, 5}};
    for (const auto& c : rows) {
        SCOPED_TRACE(testing::PrintToString(c.lengths));
        staticList<int> l = filled(c.lengths[0]);
        const int* before = nullptr;
        for (std::size_t step = 1; step < c.lengths.size(); ++step) {
            before = l.data();
            l.realloc(c.lengths[step]);
        }
        EXPECT_EQ(l.length(), c.lengths.back());
        EXPECT_EQ(l.getCapacity(), c.capacityAfter);
        EXPECT_EQ(l.data() == before, c.keepsArray);
        for (unsigned int i = 0; i < l.length(); ++i) {
            EXPECT_EQ(*l[i], i < c.held ? static_cast<int>(100 + i) : 0) << "element " << i;
        }
    }
}

TEST(StaticList, ImpossibleSizeRaisesAllocationErrorAndKeepsTheList) {
    staticList<unsigned int> l;
    l.realloc(2);
    *l[0] = 7;
    try {
        l.realloc(0xFFFFFFFFu);
        FAIL() << "no exception";
    } catch (const tolk::Exception& e) {
        EXPECT_EQ(text(e), "list::AllocationError(ReqSize: 4294967295)");
        EXPECT_NE(nullptr, dynamic_cast<const staticList<unsigned int>::AllocationError*>(&e));
    }
    EXPECT_EQ(l.length(), 2u);
    EXPECT_EQ(*l[0], 7u);
}

TEST(StaticList, CopiesAreDeepAndPrintWithOneBlank) {
    staticList<int> a = filled(4);
    a.realloc(3);  // spare room that a copy must not take over
    staticList<int> b(a);
    *a[0] = -1;
    EXPECT_EQ(text(b), "{100 101 102}");
    // Through a reference: clang rejects a written-out `a = a` (-Wself-assign-overloaded).
    const staticList<int>& self = a;
    a = self;
    EXPECT_EQ(*a.element(0), -1);
    EXPECT_EQ(a[2] - a[0], 2);
    EXPECT_EQ(text(staticList<int>()), "{}");
    staticList<unsigned char> bytes;
    bytes.realloc(2);
    *bytes[1] = 255;
    EXPECT_EQ(text(bytes), "{0 255}");
}

TEST(String, IsAStaticListOfCharWithItsTerminatorPrintedInBraces) {
    EXPECT_EQ(tolk::string("").length(), 1u);
    EXPECT_EQ(text(tolk::string("")), "{}");
    tolk::string a("one");
    EXPECT_EQ(a.length(), 4u);
    EXPECT_EQ(*a[3], '\0');
    tolk::string b(a);
    *a[0] = 'x';
    EXPECT_STREQ(b.c_str(), "one");
    tolk::string c;
    c = a;
    EXPECT_EQ(text(c), "{xne}");
    tolk::staticList<char>& l = c;
    l.realloc(3);
    EXPECT_EQ(text(c), "{xne}");
}

using Keyed = tolk::keyedList<unsigned int, int>;

TEST(KeyedList, SecondSetHidesTheFirstUntilUnset) {
    Keyed l;
    l.set(7, 1);
    l.set(7, 2);
    l.set(8, 20);
    EXPECT_EQ(text(l), "{8 20 7 2 7 1}");
    *l[8] = 21;
    EXPECT_EQ(*l.element(7u), 2);
    l.unset(7);
    EXPECT_EQ(*l[7], 1);
    EXPECT_EQ(*l[8], 21);
    l.unset(7);
    EXPECT_EQ(l.length(), 1u);
    try {
        l.element(7u);
        FAIL();
    } catch (const Keyed::OutOfBoundsError& e) {
        EXPECT_EQ(text(e), "list::OutOfBoundsError(Index: 4294967295)");
    }
    EXPECT_THROW(l.unset(7), Keyed::OutOfBoundsError);
    EXPECT_EQ(text(Keyed()), "{}");
    EXPECT_EQ(text(tolk::keyLink<unsigned int, int>(3, -4)), "{Key: 3 Value: -4}");
}

}  // namespace
