#include "platform/farm/Farm.h"

#include <gtest/gtest.h>

#include <bit>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <tuple>

#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/FarmParser.h"
#include "platform/tkhost/tkhost.h"

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

const std::string kFarms = LINEPROBE_FARMS_DIR;

class ActiveFarmTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ::unsetenv(kFarmEnvironment);
        resetActiveFarm();
    }
    void TearDown() override { SetUp(); }
};

TEST_F(ActiveFarmTest, BuiltinIsDefaultTomlByteForByte) {
    std::ifstream in(kFarms + "/default.toml", std::ios::binary);
    std::stringstream file;
    file << in.rdbuf();
    EXPECT_EQ(builtinFarmText(), file.str());

    std::string e1, e2;
    auto builtin = parseFarm(builtinFarmText(), kBuiltinFarmSource, e1);
    auto shipped = loadFarmFile(kFarms + "/default.toml", e2);
    ASSERT_TRUE(builtin) << e1;
    ASSERT_TRUE(shipped) << e2;
    EXPECT_EQ(*builtin, *shipped);
}

TEST_F(ActiveFarmTest, UnsetOrEmptyMeansTheBuiltinFarm) {
    for (const char* value : {static_cast<const char*>(nullptr), ""}) {
        if (value != nullptr) {
            ::setenv(kFarmEnvironment, value, 1);
            resetActiveFarm();
        }
        FarmLoad load = activeFarm();
        ASSERT_TRUE(load.farm) << load.error;
        EXPECT_EQ(load.source, kBuiltinFarmSource);
        EXPECT_EQ(load.farm->systemName, "vx7-demo");
    }
}

TEST_F(ActiveFarmTest, VariableNamesAnotherFileReadAgainOnlyAfterAReset) {
    FarmLoad first = activeFarm();
    ::setenv(kFarmEnvironment, (kFarms + "/flexible.toml").c_str(), 1);
    EXPECT_EQ(activeFarm().farm, first.farm);
    resetActiveFarm();
    FarmLoad load = activeFarm();
    ASSERT_TRUE(load.farm) << load.error;
    EXPECT_EQ(load.source, kFarms + "/flexible.toml");
    EXPECT_EQ(load.farm->systemName, "vx7-flex");
}

TEST_F(ActiveFarmTest, BrokenFileGivesNoFarmAndItsLineOnce) {
    ::setenv(kFarmEnvironment, (kFarms + "/absent.toml").c_str(), 1);
    ::testing::internal::CaptureStderr();
    FarmLoad load = activeFarm();
    activeFarm();  // reported once, not at every use
    std::string printed = ::testing::internal::GetCapturedStderr();
    EXPECT_FALSE(load.farm);
    const std::string line =
        kFarms + "/absent.toml: cannot read the farm file: No such file or directory";
    EXPECT_EQ(load.error, line);
    EXPECT_EQ(printed, line + "\n");
}

Farm load(const char* file) {
    std::string error;
    auto f = loadFarmFile(std::string(LINEPROBE_FARMS_DIR) + "/" + file, error);
    EXPECT_TRUE(f) << error;
    return f ? *f : Farm{};
}

std::tuple<int, int, int, int, int> fields(const Address& a) {
    return {a.instance, a.board, a.processor, a.component, a.node};
}

TEST(Addresses, FixedServicesChannelLineAndVoiceResources) {
    EXPECT_EQ(fields(boardAddress(3)), std::make_tuple(0, 3, 0, 0, 0));
    EXPECT_EQ(fields(resourceMgrAddress(3)), std::make_tuple(5, 3, 1, 0, 0));
    EXPECT_EQ(fields(clusterMgrAddress(32)), std::make_tuple(8, 32, 1, 0, 0));
    EXPECT_EQ(fields(channelClusterAddress(1, 2, 5)), std::make_tuple(69, 1, 1, 2, 0));
    EXPECT_EQ(fields(channelComponentAddress(1, 1, 23, kTSC)), std::make_tuple(55, 1, 1, 18, 0));
    EXPECT_EQ(fields(channelComponentAddress(1, 64, 31, kCAS)), std::make_tuple(2079, 1, 1, 20, 0));
    EXPECT_EQ(fields(lineClusterAddress(2, 1)), std::make_tuple(0x1001, 2, 1, 2, 0));
    EXPECT_EQ(fields(lconAddress(2, 64)), std::make_tuple(64, 2, 1, 22, 0));
    EXPECT_EQ(fields(rocClusterAddress(2, 23)), std::make_tuple(0x2017, 2, 1, 2, 0));
    EXPECT_EQ(fields(mediaAddress(2, 3, Media::SigDet)), std::make_tuple(3, 2, 1, 7, 0));
    EXPECT_EQ(fields(mediaAddress(2, 3, Media::SigBufDtmf)), std::make_tuple(3, 2, 1, 8, 0));
    EXPECT_EQ(fields(mediaAddress(2, 3, Media::SigBufMf)), std::make_tuple(0x1003, 2, 1, 8, 0));
    EXPECT_EQ(fields(mediaAddress(2, 3, Media::R2Mfp)), std::make_tuple(3, 2, 1, 66, 0));
}

TEST(Addresses, TKCompDescBytesAreTheHostLibrarysRecord) {
    Address a{0x1234, 0x21, 0x01, 0x16, 0x07};
    auto bytes = encodeTKCompDesc(a);
    const std::array<unsigned char, 8> little = {0x34, 0x12, 0x21, 0x00, 0x01, 0x16, 0x07, 0x00};
    const std::array<unsigned char, 8> big = {0x12, 0x34, 0x21, 0x00, 0x01, 0x16, 0x07, 0x00};
    EXPECT_EQ(bytes, std::endian::native == std::endian::little ? little : big);
    EXPECT_EQ(decodeTKCompDesc(bytes.data()), a);
    // The unused bytes 3 and 7 are ignored on the way in.
    bytes[3] = 0xEE;
    bytes[7] = 0xEE;
    EXPECT_EQ(decodeTKCompDesc(bytes.data()), a);
    // The same bytes as the host library's own record.
    TKCompDesc tk{};
    tk.instance = 0x2017;
    tk.board = 2;
    tk.processor = 1;
    tk.component = 2;
    tk.node = 0;
    std::array<unsigned char, 8> raw{};
    static_assert(sizeof tk == raw.size());
    std::memcpy(raw.data(), &tk, sizeof tk);
    EXPECT_EQ(encodeTKCompDesc(rocClusterAddress(2, 23)), raw);
}

// Every resource of a farm, by the addresses the plan gives it.
std::vector<std::pair<Address, Resource>> everything(const Farm& f) {
    std::vector<std::pair<Address, Resource>> all;
    for (const auto& b : f.boards) {
        const unsigned id = b.logicalId;
        all.push_back({boardAddress(id), {ResourceKind::Board, id}});
        all.push_back({resourceMgrAddress(id), {ResourceKind::ResourceMgr, id}});
        all.push_back({clusterMgrAddress(id), {ResourceKind::ClusterMgr, id}});
        for (const auto& t : b.trunks) {
            all.push_back(
                {lineClusterAddress(id, t.number), {ResourceKind::LineCluster, id, t.number}});
            all.push_back({lconAddress(id, t.number), {ResourceKind::Lcon, id, t.number}});
            for (int c = 1; c <= t.channels; ++c) {
                all.push_back({channelClusterAddress(id, t.number, c),
                               {ResourceKind::ChannelCluster, id, t.number, c}});
                for (std::uint8_t type : {kTSC, kCHP, kCAS}) {
                    Resource r{ResourceKind::ChannelComponent, id, t.number, c};
                    r.component = type;
                    all.push_back({channelComponentAddress(id, t.number, c, type), r});
                }
                int v = voiceChannelOf(b, t.number, c);
                if (v == 0) {
                    continue;
                }
                all.push_back(
                    {rocClusterAddress(id, v), {ResourceKind::RocCluster, id, t.number, c, v}});
                for (Media m : b.media) {
                    Resource r{ResourceKind::Media, id, t.number, c, v};
                    r.media = m;
                    all.push_back({mediaAddress(id, v, m), r});
                }
            }
        }
    }
    return all;
}

class AddressPlan : public ::testing::TestWithParam<const char*> {};

TEST_P(AddressPlan, EveryResourceHasItsOwnAddressAndResolvesBack) {
    Farm f = load(GetParam());
    std::set<std::tuple<int, int, int, int, int>> seen;
    for (const auto& [address, resource] : everything(f)) {
        EXPECT_TRUE(seen.insert(fields(address)).second)
            << "address used twice: instance " << address.instance << " component "
            << int(address.component);
        auto back = resolve(f, address);
        ASSERT_TRUE(back) << "instance " << address.instance << " component "
                          << int(address.component);
        EXPECT_EQ(*back, resource);
    }
}

INSTANTIATE_TEST_SUITE_P(Farms, AddressPlan,
                         ::testing::Values("default.toml", "flexible.toml", "gaps.toml"));

TEST(AddressPlan, ResolvesNothingTheFarmLacks) {
    Farm f = load("default.toml");
    const Address none[] = {
        Address{5, 1, 1, 0, 1},                   // another node
        resourceMgrAddress(4),                    // no board 4
        Address{6, 1, 1, 0, 0},                   // no service at instance 6
        Address{1, 1, 0, 0, 0},                   // board address with an instance
        Address{5, 1, 2, 0, 0},                   // processor 2
        channelComponentAddress(1, 3, 1, kTSC),   // board 1 has two trunks
        channelComponentAddress(1, 1, 25, kTSC),  // 24 channels
        channelComponentAddress(1, 1, 0, kTSC),   // channels count from 1
        channelComponentAddress(3, 1, 5, kCHP),   // analog lines have 4
        lconAddress(1, 0),
        lconAddress(1, 3),
        lineClusterAddress(3, 3),
        rocClusterAddress(1, 1),  // fixed routing: no voice resources
        rocClusterAddress(2, 0),
        rocClusterAddress(2, 24),          // 23 channels on board 2
        mediaAddress(2, 1, Media::R2Mfp),  // board 2 has no R2 MF receivers
        mediaAddress(2, 24, Media::SigDet),
        Address{0x1001, 2, 1, 7, 0},  // SIGDET has no second range
        Address{1, 1, 1, 99, 0},      // unknown component type
    };
    for (const auto& a : none) {
        EXPECT_FALSE(resolve(f, a)) << "instance " << a.instance << " board " << int(a.board)
                                    << " component " << int(a.component);
    }
}

TEST(AddressPlan, VoiceChannelsRunTrunkByTrunkChannelByChannel) {
    Farm f = load("flexible.toml");
    const Board& b = *f.board(7);
    const std::tuple<int, int, int> map[] = {{1, 1, 1}, {1, 2, 2}, {1, 3, 3}, {2, 1, 4}, {2, 2, 5}};
    for (auto [trunk, channel, voice] : map) {
        EXPECT_EQ(voiceChannelOf(b, trunk, channel), voice);
        EXPECT_EQ(channelOfVoice(b, voice), (ChannelRef{7, trunk, channel}));
    }
    EXPECT_EQ(voiceChannelOf(b, 1, 4), 0);
    EXPECT_EQ(voiceChannelOf(b, 3, 1), 0);
    EXPECT_FALSE(channelOfVoice(b, 0));
    EXPECT_FALSE(channelOfVoice(b, 6));
    EXPECT_EQ(voiceChannelOf(*f.board(8), 1, 1), 0);  // fixed routing
    EXPECT_FALSE(channelOfVoice(*f.board(8), 1));
}

}  // namespace
}  // namespace farm
