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

std::vector<unsigned int> MediaTypes(BoardManager& manager, unsigned int trunk,
                                     unsigned int channel) {
    vx7diag::MediaList media = manager.GetMediaResources(trunk, channel);
    std::vector<unsigned int> types;
    for (unsigned int i = 0; i < media.length(); ++i) {
        types.push_back(media.element(i)->ComponentType);
    }
    return types;
}

bool SameAddress(const tolk::CompDesc_t& got, const farm::Address& want) {
    return got.instance == want.instance && got.board == want.board &&
           got.component == want.component;
}

class DefaultFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm(""); }
};

TEST_F(DefaultFarm, BoardsAreWalkedTrunkByTrunk) {
    testsupport::LogCapture out;
    BoardManager digital(1);
    ASSERT_NE(digital.GetBoard(), nullptr);
    EXPECT_EQ(digital.GetBoardName(), "VX7/T1-2");
    EXPECT_EQ(digital.GetSerialNumber(), "VX7-0001");
    EXPECT_EQ(digital.GetBoardType(), BoardManager::DIGITAL_BOARD);
    BoardManager analog(3);
    EXPECT_EQ(analog.GetBoardType(), BoardManager::ANALOG_BOARD);
    // The analog walk ends on the board's refusal, which is no failure to log.
    EXPECT_EQ(out.Text().find("UnexpectedMsg"), std::string::npos) << out.Text();

    struct Case {
        BoardManager* manager;
        unsigned int trunk;
        int channels, trunkType, signaling;
    };
    for (Case c :
         {Case{&digital, 1, 24, 1, 4}, Case{&digital, 2, 24, 1, 4}, Case{&digital, 0, 0, -1, -1},
          Case{&digital, 3, 0, -1, -1}, Case{&digital, 65, 0, -1, -1}, Case{&analog, 1, 4, 4, 4},
          Case{&analog, 2, 4, 4, 4}, Case{&analog, 3, 0, -1, -1}}) {
        SCOPED_TRACE(std::to_string(c.manager->GetBoardType()) + " trunk " +
                     std::to_string(c.trunk));
        EXPECT_EQ(c.manager->GetNumberOfTrunks(), 2);
        EXPECT_EQ(c.manager->GetNumChannelsOnTrunk(c.trunk), c.channels);
        EXPECT_EQ(c.manager->GetTrunkType(c.trunk), c.trunkType);
        EXPECT_EQ(c.manager->GetSignalingType(c.trunk), c.signaling);
    }
    // Fixed routing: no voice resources to look up on any line.
    EXPECT_FALSE(digital.IsFlexibleRoutingEnabled());
    EXPECT_FALSE(digital.IsFlexibleRoutingEnabled(1, 1));
    EXPECT_EQ(digital.GetVoiceChannelCount(), 0);
    EXPECT_EQ(digital.GetTelephonyVoiceChannel(1, 1), nullptr);
    EXPECT_TRUE(MediaTypes(digital, 1, 24).empty());
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
        EXPECT_TRUE(SameAddress(roc->GetCluster()->getTgtDesc(),
                                farm::rocClusterAddress(2, static_cast<int>(channel))))
            << channel;
    }
    for (auto [trunk, channel] : std::vector<std::pair<unsigned int, unsigned int>>{
             {1, 0}, {1, 24}, {1, 32}, {2, 1}, {0, 1}, {0xFFFFFFFF, 0xFFFFFFFF}}) {
        EXPECT_EQ(manager.GetTelephonyVoiceChannel(trunk, channel), nullptr)
            << trunk << "." << channel;
        EXPECT_TRUE(MediaTypes(manager, trunk, channel).empty());
    }
}

TEST_F(DefaultFarm, PartialVoiceAUGivesMediaInTableOrder) {
    BoardManager manager(2);
    // SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, CALLERID: no R2 MF on this board.
    EXPECT_EQ(MediaTypes(manager, 1, 5), (std::vector<unsigned int>{7, 8, 8, 5, 10, 41}));
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 5)->GetMediaCount(), 6);
    vx7diag::MediaList media = manager.GetMediaResources(1, 5);
    ASSERT_EQ(media.length(), 6u);
    EXPECT_TRUE(
        SameAddress(media.element(0)->InstDesc, farm::mediaAddress(2, 5, farm::Media::SigDet)));
}

TEST_F(DefaultFarm, BoardTheMapDoesNotListGivesAnEmptyManager) {
    BoardManager manager(9);
    EXPECT_EQ(manager.GetBoard(), nullptr);
    EXPECT_FALSE(manager.HasBoardName());
    EXPECT_EQ(manager.GetBoardName(), "");
    EXPECT_EQ(manager.GetNumberOfTrunks(), 0);
    EXPECT_EQ(manager.GetBoardType(), 0);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_TRUE(MediaTypes(manager, 1, 1).empty());
}

TEST_F(DefaultFarm, RefusedParameterQueriesMeanAnUnknownBoardWithFixedRouting) {
    Refuse(0x12);
    testsupport::LogCapture out;
    BoardManager manager(2);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 0);
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 1), nullptr);
}

class FlexibleFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm("flexible.toml"); }
    static void TearDownTestSuite() { UseFarm(""); }
};

// The second trunk continues the voice channels; the media list follows the attribute order,
// not the farm's; the fixed board beside it has no voice resources.
TEST_F(FlexibleFarm, VoiceChannelsAcrossTrunks) {
    BoardManager manager(7);
    ASSERT_TRUE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 5);
    EXPECT_EQ(manager.GetVoiceChannelNumber(1, 3), 3u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 1), 4u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 2), 5u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 3), 0u);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 2), nullptr);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 1), manager.GetTelephonyVoiceChannel(1, 1));
    // SIGDETADDR, TONEGENADDR, CALLERIDADDR.
    EXPECT_EQ(MediaTypes(manager, 2, 2), (std::vector<unsigned int>{7, 5, 41}));

    BoardManager fixed(8);
    EXPECT_FALSE(fixed.IsFlexibleRoutingEnabled());
    EXPECT_EQ(fixed.GetVoiceChannelCount(), 0);
    EXPECT_EQ(fixed.GetTelephonyVoiceChannel(1, 1), nullptr);
}

}  // namespace
