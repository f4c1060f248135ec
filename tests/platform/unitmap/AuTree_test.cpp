#include "platform/unitmap/AuTree.h"

#include <gtest/gtest.h>

#include "platform/farm/FarmParser.h"

namespace unitmap {
namespace {

farm::Farm parse(const std::string& text) {
    std::string error;
    auto f = farm::parseFarm(text, "t.toml", error);
    EXPECT_TRUE(f) << error;
    return f ? *f : farm::Farm{};
}

std::vector<UM_AUID> handles(const std::vector<const Au*>& aus) {
    std::vector<UM_AUID> out;
    for (const Au* au : aus) {
        out.push_back(au->handle);
    }
    return out;
}

unsigned type(const AuTree& t, UM_AUID h) {
    const Attribute* a = t.find(h)->attribute(kType);
    return a ? a->number : 0;
}

TEST(AuTree, HandlesFollowTreeOrder) {
    // One flexible board with two lines and 5 channels: two voice groups of 4 and 1.
    AuTree t(
        parse("system_name = \"s\"\n"
              "[[board]]\nlogical_id = 6\nname = \"a\"\nserial = \"b\"\nrouting = \"flexible\"\n"
              "[[board.trunk]]\nchannels = 3\ntype = 1\nsignaling = \"CAS\"\n"
              "[[board.trunk]]\nchannels = 2\ntype = 1\nsignaling = \"CAS\"\n"
              "[[board]]\nlogical_id = 2\nname = \"c\"\nserial = \"d\"\n"));
    EXPECT_EQ(t.host(), 1u);
    EXPECT_EQ(t.find(1)->children, (std::vector<UM_AUID>{2, 12}));
    EXPECT_EQ(t.find(2)->children, (std::vector<UM_AUID>{3, 4, 5, 10}));
    EXPECT_EQ(t.find(5)->children, (std::vector<UM_AUID>{6, 7, 8, 9}));
    EXPECT_EQ(t.find(10)->children, (std::vector<UM_AUID>{11}));
    EXPECT_TRUE(t.find(12)->children.empty());
    EXPECT_EQ(t.find(13), nullptr);
    EXPECT_EQ(t.find(0), nullptr);
    const unsigned types[] = {0, 0, 503, 503, 501, 502, 502, 502, 502, 501, 502, 0};
    for (UM_AUID h = 1; h <= 12; ++h) {
        EXPECT_EQ(type(t, h), types[h - 1]) << h;
    }
    EXPECT_EQ(handles(t.below(1)), (std::vector<UM_AUID>{2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12}));
    EXPECT_EQ(handles(t.below(5)), (std::vector<UM_AUID>{6, 7, 8, 9}));
    EXPECT_TRUE(t.below(11).empty());
    EXPECT_TRUE(t.below(99).empty());
}

TEST(AuTree, VoiceAuListsClusterThenMediaInMapOrder) {
    AuTree t(
        parse("system_name = \"s\"\n"
              "[[board]]\nlogical_id = 6\nname = \"a\"\nserial = \"b\"\n"
              "routing = \"flexible\"\nmedia = [\"CALLERID\", \"SIGBUF_MF\"]\n"
              "[[board.trunk]]\nchannels = 1\ntype = 1\nsignaling = \"CAS\"\n"));
    const Au* voice = t.find(5);
    ASSERT_NE(voice, nullptr);
    std::vector<std::string> names;
    for (const auto& a : voice->attributes) {
        names.push_back(a.name);
    }
    EXPECT_EQ(names,
              (std::vector<std::string>{"TYPE", "CLUSTERADDR", "SIGBUFADDR_MF", "CALLERIDADDR"}));
    EXPECT_EQ(voice->attribute("CALLERIDADDR")->address,
              farm::mediaAddress(6, 1, farm::Media::CallerId));
}

}  // namespace
}  // namespace unitmap
