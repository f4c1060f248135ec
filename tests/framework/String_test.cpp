#include "framework/String.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

std::string text(const tolk::virtualObject& o) {
    std::ostringstream os;
    os << o;
    return os.str();
}

TEST(String, LengthCountsTheTerminator) {
    EXPECT_EQ(tolk::string("").length(), 1u);
    tolk::string s("abc");
    EXPECT_EQ(s.length(), 4u);
    EXPECT_EQ(*s[3], '\0');
}

TEST(String, PrintsTextInBraces) {
    EXPECT_EQ(text(tolk::string("5551212")), "{5551212}");
    EXPECT_EQ(text(tolk::string("")), "{}");
}

TEST(String, CopyIsIndependent) {
    tolk::string a("one");
    tolk::string b(a);
    *a[0] = 'x';
    EXPECT_STREQ(b.c_str(), "one");
    tolk::string c;
    c = a;
    EXPECT_STREQ(c.c_str(), "xne");
}

TEST(String, WorksAsAStaticListOfChar) {
    tolk::string s("ab");
    tolk::staticList<char>& l = s;
    l.realloc(2);
    EXPECT_EQ(text(s), "{ab}");
}

}  // namespace
