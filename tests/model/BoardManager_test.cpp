#include "model/BoardManager.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "LogCapture.h"
#include "SimFixture.h"
#include "model/Board.h"
#include "model/Guarded.h"
#include "platform/farm/Addresses.h"

namespace {

using vx7diag::BoardManager;

class DefaultFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm(""); }
};

TEST_F(DefaultFarm, DigitalBoardWithFixedRouting) {
    BoardManager manager(1);
    ASSERT_NE(manager.GetBoard(), nullptr);
    EXPECT_EQ(manager.GetBoardName(), "VX7/T1-2");
    EXPECT_EQ(manager.GetSerialNumber(), "VX7-0001");
    EXPECT_EQ(manager.GetBoardType(), BoardManager::DIGITAL_BOARD);
    EXPECT_EQ(manager.GetNumberOfTrunks(), 2);
    for (unsigned int trunk : {1u, 2u}) {
        EXPECT_EQ(manager.GetNumChannelsOnTrunk(trunk), 24);
        EXPECT_EQ(manager.GetTrunkType(trunk), 1);
        EXPECT_EQ(manager.GetSignalingType(trunk), 4);
    }
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled(1, 1));
    EXPECT_EQ(manager.GetVoiceChannelCount(), 0);
    for (unsigned int trunk : {1u, 2u, 64u}) {
        for (unsigned int channel : {1u, 24u, 31u}) {
            EXPECT_EQ(manager.GetTelephonyVoiceChannel(trunk, channel), nullptr);
            EXPECT_EQ(manager.GetMediaResources(trunk, channel).length(), 0u);
        }
    }
}

TEST_F(DefaultFarm, UnknownTrunkHasNoChannelsAndNoTypes) {
    BoardManager manager(1);
    for (unsigned int trunk : {0u, 3u, 64u, 65u}) {
        EXPECT_EQ(manager.GetNumChannelsOnTrunk(trunk), 0);
        EXPECT_EQ(manager.GetTrunkType(trunk), -1);
        EXPECT_EQ(manager.GetSignalingType(trunk), -1);
    }
}

TEST_F(DefaultFarm, AnalogBoardIsWalkedLineByLine) {
    BoardManager manager(3);
    EXPECT_EQ(manager.GetBoardType(), BoardManager::ANALOG_BOARD);
    EXPECT_EQ(manager.GetNumberOfTrunks(), 2);
    for (unsigned int trunk : {1u, 2u}) {
        EXPECT_EQ(manager.GetNumChannelsOnTrunk(trunk), 4);
        EXPECT_EQ(manager.GetTrunkType(trunk), 4);
        EXPECT_EQ(manager.GetSignalingType(trunk), 4);
    }
    EXPECT_EQ(manager.GetNumChannelsOnTrunk(3), 0);
}

TEST_F(DefaultFarm, AnalogWalkEndsOnTheRefusalWithoutLoggingIt) {
    testsupport::LogCapture out;
    BoardManager manager(3);
    EXPECT_EQ(manager.GetNumberOfTrunks(), 2);
    EXPECT_EQ(out.Text().find("UnexpectedMsg"), std::string::npos) << out.Text();
}

// The walk's end is told from a failure by the answer: only a refusal means "no such line".
TEST_F(DefaultFarm, OnlyARefusedSearchFindsNothing) {
    tolk::Board board(3);
    EXPECT_TRUE(vx7diag::FoundOrRefused([&] { return board.findClustByLCON(2); }).has_value());
    EXPECT_FALSE(vx7diag::FoundOrRefused([&] { return board.findClustByLCON(3); }).has_value());

    Silence(0x800053);
    try {
        vx7diag::FoundOrRefused([&] { return board.findClustByLCON(3); });
        ADD_FAILURE() << "a search nobody answered counted as refused";
    } catch (const vx7diag::BoardFailure& e) {
        EXPECT_NE(std::string(e.what()).find("Timeout"), std::string::npos) << e.what();
    }
}

TEST_F(DefaultFarm, FlexibleRoutingMapsVoiceChannelsInOrder) {
    BoardManager manager(2);
    EXPECT_TRUE(manager.IsFlexibleRoutingEnabled(1, 1));
    EXPECT_EQ(manager.GetTelephonyMediaRoutingMode(7, 7), 1);
    EXPECT_EQ(manager.GetNumberOfTrunks(), 1);
    EXPECT_EQ(manager.GetNumChannelsOnTrunk(1), 23);
    EXPECT_EQ(manager.GetSignalingType(1), 5);
    EXPECT_EQ(manager.GetVoiceChannelCount(), 23);
    for (unsigned int channel = 1; channel <= 23; ++channel) {
        EXPECT_EQ(manager.GetVoiceChannelNumber(1, channel), channel);
        vx7diag::ROCCluster* roc = manager.GetTelephonyVoiceChannel(1, channel);
        ASSERT_NE(roc, nullptr) << channel;
        farm::Address expected = farm::rocClusterAddress(2, static_cast<int>(channel));
        tolk::CompDesc_t got = roc->GetCluster()->getTgtDesc();
        EXPECT_EQ(got.instance, expected.instance);
        EXPECT_EQ(got.board, expected.board);
        EXPECT_EQ(got.component, expected.component);
    }
}

TEST_F(DefaultFarm, PartialVoiceAUGivesMediaInTableOrder) {
    BoardManager manager(2);
    vx7diag::MediaList media = manager.GetMediaResources(1, 5);
    // SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, CALLERID: no R2 MF on this board.
    std::vector<unsigned int> types;
    for (unsigned int i = 0; i < media.length(); ++i) {
        types.push_back(media.element(i)->ComponentType);
    }
    EXPECT_EQ(types, (std::vector<unsigned int>{7, 8, 8, 5, 10, 41}));
    ASSERT_EQ(media.length(), 6u);
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 5)->GetMediaCount(), 6);
    farm::Address sigdet = farm::mediaAddress(2, 5, farm::Media::SigDet);
    EXPECT_EQ(media.element(0)->InstDesc.instance, sigdet.instance);
    EXPECT_EQ(media.element(0)->InstDesc.component, sigdet.component);
}

TEST_F(DefaultFarm, VoiceLookupsOutsideTheChannelsFindNothing) {
    BoardManager manager(2);
    struct Case {
        unsigned int trunk, channel;
    };
    for (Case c : {Case{1, 0}, Case{1, 24}, Case{1, 31}, Case{1, 32}, Case{2, 1}, Case{65, 1},
                   Case{0, 1}, Case{0xFFFFFFFF, 0xFFFFFFFF}}) {
        EXPECT_EQ(manager.GetTelephonyVoiceChannel(c.trunk, c.channel), nullptr)
            << c.trunk << "." << c.channel;
        EXPECT_EQ(manager.GetMediaResources(c.trunk, c.channel).length(), 0u);
    }
}

TEST_F(DefaultFarm, BoardTheMapDoesNotListGivesAnEmptyManager) {
    BoardManager manager(9);
    EXPECT_EQ(manager.GetBoard(), nullptr);
    EXPECT_FALSE(manager.HasBoardName());
    EXPECT_EQ(manager.GetBoardName(), "");
    EXPECT_EQ(manager.GetNumberOfTrunks(), 0);
    EXPECT_EQ(manager.GetBoardType(), 0);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetMediaResources(1, 1).length(), 0u);
}

TEST_F(DefaultFarm, RefusedParameterQueriesMeanAnUnknownBoardWithFixedRouting) {
    Refuse(0x12);
    testsupport::LogCapture out;
    BoardManager manager(2);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 0);
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 1), nullptr);
}

class GapsFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm("gaps.toml"); }
    static void TearDownTestSuite() { UseFarm(""); }
};

TEST_F(GapsFarm, BoardsKeepTheirLogicalNumbers) {
    BoardManager edge(32);
    EXPECT_EQ(edge.GetSerialNumber(), "GAP-0032");
    EXPECT_EQ(edge.GetNumChannelsOnTrunk(1), 30);
    BoardManager zero(0);
    EXPECT_EQ(zero.GetSerialNumber(), "GAP-0000");
    EXPECT_EQ(zero.GetSignalingType(1), 6);
    BoardManager missing(1);
    EXPECT_EQ(missing.GetBoard(), nullptr);
}

}  // namespace

namespace {

class FlexibleFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm("flexible.toml"); }
    static void TearDownTestSuite() { UseFarm(""); }
};

TEST_F(FlexibleFarm, SecondTrunkContinuesTheVoiceChannels) {
    BoardManager manager(7);
    ASSERT_TRUE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 5);
    EXPECT_EQ(manager.GetVoiceChannelNumber(1, 3), 3u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 1), 4u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 2), 5u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 3), 0u);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 2), nullptr);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 1), manager.GetTelephonyVoiceChannel(1, 1));
}

TEST_F(FlexibleFarm, MediaListFollowsTheAttributeOrderNotTheFarms) {
    BoardManager manager(7);
    vx7diag::MediaList media = manager.GetMediaResources(2, 2);
    std::vector<unsigned int> types;
    for (unsigned int i = 0; i < media.length(); ++i) {
        types.push_back(media.element(i)->ComponentType);
    }
    // SIGDETADDR, TONEGENADDR, CALLERIDADDR.
    EXPECT_EQ(types, (std::vector<unsigned int>{7, 5, 41}));
}

TEST_F(FlexibleFarm, FixedBoardBesideItHasNoVoiceResources) {
    BoardManager manager(8);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 0);
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 1), nullptr);
}

}  // namespace
