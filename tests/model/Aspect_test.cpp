#include "model/Aspect.h"

#include <gtest/gtest.h>

namespace {

class Loud : public vx7diag::Aspect {
  public:
    explicit Loud(int v) : volume(v) {}
    int volume;
};

class Quiet : public vx7diag::Aspect {};

TEST(Aspect, SameClassComparesEqualWhateverItsFields) {
    Loud a(1);
    Loud b(99);
    EXPECT_TRUE(a == b);
    EXPECT_FALSE(a < b);
}

TEST(Aspect, DifferentClassesCompareUnequalAndLess) {
    Loud a(1);
    Quiet q;
    vx7diag::Aspect& base = q;
    EXPECT_FALSE(a == base);
    EXPECT_TRUE(a < base);
    EXPECT_TRUE(base < a);
}

TEST(Aspect, BaseHasNoText) {
    Quiet q;
    EXPECT_EQ(q.ToZLG(), nullptr);
}

}  // namespace
