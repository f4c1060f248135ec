#include "framework/keyedList.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using List = tolk::keyedList<unsigned int, int>;

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

TEST(KeyedList, MissingKeyRaisesOutOfBoundsWithAllOnesIndex) {
    List l;
    l.set(1, 10);
    try {
        l.element(2u);
        FAIL();
    } catch (const List::OutOfBoundsError& e) {
        EXPECT_EQ(text(e), "list::OutOfBoundsError(Index: 4294967295)");
    }
    EXPECT_THROW(l.unset(2), List::OutOfBoundsError);
}

TEST(KeyedList, SecondSetHidesTheFirstUntilUnset) {
    List l;
    l.set(7, 1);
    l.set(7, 2);
    EXPECT_EQ(*l.element(7u), 2);
    l.unset(7);
    EXPECT_EQ(*l[7], 1);
    l.unset(7);
    EXPECT_THROW(l[7], List::OutOfBoundsError);
}

TEST(KeyedList, ElementGivesTheStoredValueForChange) {
    List l;
    l.set(1, 10);
    l.set(2, 20);
    *l[1] = 11;
    EXPECT_EQ(*l.element(1u), 11);
    EXPECT_EQ(*l.element(2u), 20);
    EXPECT_EQ(l.length(), 2u);
}

TEST(KeyedList, PrintsNewestFirst) {
    List l;
    EXPECT_EQ(text(l), "{}");
    l.set(1, 10);
    l.set(2, 20);
    EXPECT_EQ(text(l), "{2 20 1 10}");
}

TEST(KeyLink, Prints) {
    std::ostringstream os;
    os << tolk::keyLink<unsigned int, int>(3, -4);
    EXPECT_EQ(os.str(), "{Key: 3 Value: -4}");
}

}  // namespace
