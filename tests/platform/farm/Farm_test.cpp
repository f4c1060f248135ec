#include "platform/farm/Farm.h"

#include <gtest/gtest.h>

#include <string>
#include <tuple>

namespace farm {
namespace {

class AddToNumber : public ::testing::TestWithParam<std::tuple<const char*, int, const char*>> {};

TEST_P(AddToNumber, KeepsTheWidthAndRefusesOverflow) {
    auto [first, offset, expected] = GetParam();
    EXPECT_EQ(addToNumber(first, offset), expected);
}

INSTANTIATE_TEST_SUITE_P(
    Numbers, AddToNumber,
    ::testing::Values(std::make_tuple("5551212", 0, "5551212"),
                      std::make_tuple("5551212", 22, "5551234"), std::make_tuple("0099", 1, "0100"),
                      std::make_tuple("0000", 9, "0009"), std::make_tuple("999", 0, "999"),
                      std::make_tuple("999", 1, ""), std::make_tuple("1", 8, "9"),
                      std::make_tuple("1", 9, ""), std::make_tuple("12a", 1, ""),
                      std::make_tuple("", 0, ""), std::make_tuple("5", -1, "")));

TEST(Media, NamesAttributesAndComponentTypes) {
    struct Row {
        Media media;
        const char* name;
        const char* attribute;
        int type;
    };
    const Row rows[] = {
        {Media::SigDet, "SIGDET", "SIGDETADDR", 7},
        {Media::SigBufDtmf, "SIGBUF_DTMF", "SIGBUFADDR_DTMF", 8},
        {Media::SigBufMf, "SIGBUF_MF", "SIGBUFADDR_MF", 8},
        {Media::ToneGen, "TONEGEN", "TONEGENADDR", 5},
        {Media::CallAnalysis, "CALLANALYSIS", "CALLANALYSISADDR", 10},
        {Media::R2Mfp, "R2MFP", "R2MFPADDR", 66},
        {Media::CallerId, "CALLERID", "CALLERIDADDR", 41},
    };
    for (const auto& r : rows) {
        SCOPED_TRACE(r.name);
        EXPECT_EQ(mediaName(r.media), r.name);
        EXPECT_STREQ(mediaAttribute(r.media), r.attribute);
        EXPECT_EQ(mediaComponentType(r.media), r.type);
        EXPECT_EQ(mediaFromName(r.name), r.media);
    }
    EXPECT_FALSE(mediaFromName("sigdet"));
    EXPECT_FALSE(mediaFromName("SIGDETADDR"));
}

Farm twoTrunks() {
    Farm f;
    Board b;
    b.logicalId = 4;
    b.trunks.push_back(Trunk{1, 3, 1, Signaling::CAS, "100"});
    b.trunks.push_back(Trunk{2, 2, 1, Signaling::CCS, ""});
    f.boards.push_back(b);
    return f;
}

TEST(Farm, LooksUpBoardsAndTrunksByNumber) {
    Farm f = twoTrunks();
    ASSERT_NE(f.board(4), nullptr);
    EXPECT_EQ(f.board(0), nullptr);
    EXPECT_EQ(f.board(5), nullptr);
    const Board& b = *f.board(4);
    EXPECT_EQ(b.trunk(0), nullptr);
    ASSERT_NE(b.trunk(2), nullptr);
    EXPECT_EQ(b.trunk(2)->signaling, Signaling::CCS);
    EXPECT_EQ(b.trunk(3), nullptr);
}

TEST(Farm, NumberOfAChannelFollowsItsTrunk) {
    Farm f = twoTrunks();
    EXPECT_EQ(f.numberOf({4, 1, 1}), "100");
    EXPECT_EQ(f.numberOf({4, 1, 3}), "102");
    EXPECT_EQ(f.numberOf({4, 1, 4}), "");  // beyond the trunk
    EXPECT_EQ(f.numberOf({4, 1, 0}), "");
    EXPECT_EQ(f.numberOf({4, 2, 1}), "");  // trunk without numbers
    EXPECT_EQ(f.numberOf({5, 1, 1}), "");
}

TEST(Farm, VoiceChannelsOnlyUnderFlexibleRouting) {
    Farm f = twoTrunks();
    Board& b = f.boards.front();
    EXPECT_EQ(b.voiceChannelCount(), 0);
    b.routing = Routing::Flexible;
    EXPECT_EQ(b.voiceChannelCount(), 5);
}

}  // namespace
}  // namespace farm
