#include "platform/farm/Farm.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <tuple>

#include "CompDesc.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/FarmParser.h"
#include "platform/tkhost/tkhost.h"

namespace farm {
namespace {

const std::string kFarms = LINEPROBE_FARMS_DIR;

TEST(Farm, AddToNumberKeepsTheWidthAndRefusesOverflow) {
    struct {
        const char* first;
        int offset;
        const char* expected;
    } const cases[] = {
        {"5551212", 0, "5551212"},
        {"5551212", 22, "5551234"},
        {"0099", 1, "0100"},
        {"0000", 9, "0009"},
        {"999", 0, "999"},
        {"999", 1, ""},
        {"1", 8, "9"},
        {"1", 9, ""},
        {"12a", 1, ""},
        {"", 0, ""},
        {"5", -1, ""},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(addToNumber(c.first, c.offset), c.expected) << c.first << " + " << c.offset;
    }
}

TEST(Farm, LooksUpBoardsTrunksAndChannelNumbers) {
    Farm f;
    Board b;
    b.logicalId = 4;
    b.trunks.push_back(Trunk{1, 3, 1, Signaling::CAS, "100"});
    b.trunks.push_back(Trunk{2, 2, 1, Signaling::CCS, ""});
    f.boards.push_back(b);
    EXPECT_EQ(f.board(0), nullptr);
    EXPECT_EQ(f.board(5), nullptr);
    ASSERT_NE(f.board(4), nullptr);
    EXPECT_EQ(f.board(4)->trunk(0), nullptr);
    EXPECT_EQ(f.board(4)->trunk(2)->signaling, Signaling::CCS);
    EXPECT_EQ(f.board(4)->trunk(3), nullptr);
    EXPECT_EQ(f.numberOf({4, 1, 1}), "100");
    EXPECT_EQ(f.numberOf({4, 1, 3}), "102");
    EXPECT_EQ(f.numberOf({4, 1, 4}), "");  // beyond the trunk
    EXPECT_EQ(f.numberOf({4, 1, 0}), "");
    EXPECT_EQ(f.numberOf({4, 2, 1}), "");  // trunk without numbers
    EXPECT_EQ(f.numberOf({5, 1, 1}), "");
    // Voice channels only under flexible routing.
    EXPECT_EQ(b.voiceChannelCount(), 0);
    b.routing = Routing::Flexible;
    EXPECT_EQ(b.voiceChannelCount(), 5);
}

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

TEST_F(ActiveFarmTest, VariableNamesTheFileReadAgainOnlyAfterAResetAndEmptyMeansBuiltin) {
    FarmLoad first = activeFarm();  // unset
    ASSERT_TRUE(first.farm) << first.error;
    EXPECT_EQ(first.source, kBuiltinFarmSource);
    EXPECT_EQ(first.farm->systemName, "vx7-demo");
    ::setenv(kFarmEnvironment, (kFarms + "/flexible.toml").c_str(), 1);
    EXPECT_EQ(activeFarm().farm, first.farm);
    resetActiveFarm();
    FarmLoad load = activeFarm();
    ASSERT_TRUE(load.farm) << load.error;
    EXPECT_EQ(load.source, kFarms + "/flexible.toml");
    EXPECT_EQ(load.farm->systemName, "vx7-flex");
    ::setenv(kFarmEnvironment, "", 1);
    resetActiveFarm();
    EXPECT_EQ(activeFarm().source, kBuiltinFarmSource);
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
    auto f = loadFarmFile(kFarms + "/" + file, error);
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
    const TKCompDesc tk = compDesc(0x1234, 0x21, 0x01, 0x16, 0x07);
    std::array<unsigned char, 8> raw{};
    static_assert(sizeof tk == raw.size());
    std::memcpy(raw.data(), &tk, sizeof tk);
    const Address a{0x1234, 0x21, 0x01, 0x16, 0x07};
    auto bytes = encodeTKCompDesc(a);
    EXPECT_EQ(bytes, raw);
    // The unused bytes 3 and 7 are ignored on the way in.
    bytes[3] = 0xEE;
    bytes[7] = 0xEE;
    EXPECT_EQ(decodeTKCompDesc(bytes.data()), a);
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

TEST(AddressPlan, EveryResourceHasItsOwnAddressAndResolvesBack) {
    for (const char* file : {"default.toml", "flexible.toml", "gaps.toml"}) {
        SCOPED_TRACE(file);
        Farm f = load(file);
        std::set<std::tuple<int, int, int, int, int>> seen;
        for (const auto& [address, resource] : everything(f)) {
            SCOPED_TRACE(testing::Message() << "instance " << address.instance << " component "
                                            << int(address.component));
            EXPECT_TRUE(seen.insert(fields(address)).second) << "address used twice";
            EXPECT_EQ(resolve(f, address), resource);
        }
    }
}

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

// A valid start: a farm with one digital board, to which a case appends a trunk or more.
const std::string kHead =
    "system_name = \"s\"\n"  // line 1
    "[[board]]\n"            // line 2
    "logical_id = 1\n"       // line 3
    "name = \"n\"\n"         // line 4
    "serial = \"x\"\n";      // line 5
std::string casTrunk(const std::string& channels) {
    return "[[board.trunk]]\nchannels = " + channels + "\ntype = 1\nsignaling = \"CAS\"\n";
}
const std::string kCasTrunk = casTrunk("24");

std::string trunks(int n, const std::string& trunk) {
    std::string s;
    for (int i = 0; i < n; ++i) {
        s += trunk;
    }
    return s;
}

// A farm whose board, from line 3 on, is `rest`; one whose first trunk, from line 7 on, is `rest`;
// one whose flexible board goes on at line 7 with `rest`.
std::string board(const std::string& rest) {
    return "system_name = \"s\"\n[[board]]\n" + rest;
}
std::string trunk(const std::string& rest) {
    return kHead + "[[board.trunk]]\n" + rest;
}
std::string flexible(const std::string& rest) {
    return kHead + "routing = \"flexible\"\n" + rest;
}

TEST(FarmParser, RejectsWithOneLineNamingThePlace) {
    const std::pair<std::string, std::string> cases[] = {
        {"system_name = \"s\"\n[[board]\n",
         "2:9: Error while parsing table header: expected ']', saw '\\n'"},
        {"", "1:1: system_name is missing"},
        {"system_name = 5\n", "1:15: system_name must be a string"},
        {"system_name = \"\"\n", "1:15: system_name must be 1 to 255 characters"},
        {"system_name = \"" + std::string(256, 'a') + "\"\n",
         "1:15: system_name must be 1 to 255 characters"},
        {"system_name = \"s\"\nboards = 1\n", "2:1: unknown key \"boards\""},
        {"system_name = \"s\"\nboard = 3\n", "2:9: board must be an array of tables ([[board]])"},
        {board("name = \"n\"\nserial = \"x\"\n"), "2:1: logical_id is missing"},
        {board("logical_id = \"1\"\n"), "3:14: logical_id must be an integer"},
        {board("logical_id = 33\n"), "3:14: logical_id must be 0 to 32, not 33"},
        {board("logical_id = -1\n"), "3:14: logical_id must be 0 to 32, not -1"},
        {kHead + "[[board]]\nlogical_id = 1\n",
         "7:14: logical_id 1 is already used by the board at line 2"},
        {board("logical_id = 1\nserial = \"x\"\n"), "2:1: name is missing"},
        {board("logical_id = 1\nname = \"n\"\nserial = 7\n"), "5:10: serial must be a string"},
        {kHead + "serail = \"y\"\n", "6:1: unknown key \"serail\""},
        {kHead + "routing = \"dynamic\"\n",
         "6:11: routing must be \"fixed\" or \"flexible\", not \"dynamic\""},
        {kHead + "routing = 1\n", "6:11: routing must be \"fixed\" or \"flexible\""},
        {kHead + trunks(65, kCasTrunk), "262:1: a board has at most 64 trunks"},
        {kHead + "trunk = 1\n", "6:9: trunk must be an array of tables ([[board.trunk]])"},
        {kHead + casTrunk("32"), "7:12: channels must be 1 to 31, not 32"},
        {kHead + casTrunk("0"), "7:12: channels must be 1 to 31, not 0"},
        {kHead + casTrunk("2.5"), "7:12: channels must be an integer"},
        {trunk("type = 1\nsignaling = \"CAS\"\n"), "6:1: channels is missing"},
        {trunk("channels = 24\nsignaling = \"CAS\"\n"), "6:1: type is missing"},
        {trunk("channels = 24\ntype = 5\n"),
         "8:8: type must be 0 to 4 (below 4 digital, 4 analog), not 5"},
        {trunk("channels = 24\ntype = 1\nsignaling = \"ISDN\"\n"),
         "9:13: signaling must be \"CAS\", \"CCS\" or \"CLEAR\", not \"ISDN\""},
        {trunk("channels = 24\ntype = 1\n"), "6:1: signaling is missing"},
        {trunk("channel = 24\n"), "7:1: unknown key \"channel\""},
        {trunk("type = 4\nchannels = 8\n"), "8:12: an analog trunk (type 4) has 4 channels, not 8"},
        {trunk("type = 4\nsignaling = \"CCS\"\n"),
         "8:13: an analog trunk (type 4) uses CAS signaling, not \"CCS\""},
        {kHead + kCasTrunk + "[[board.trunk]]\ntype = 4\n",
         "11:8: a board's trunks are all analog (type 4) or all digital"},
        {kHead + kCasTrunk + "first_number = \"555-1212\"\n",
         "10:16: first_number must be 1 to 31 digits, not \"555-1212\""},
        {kHead + kCasTrunk + "first_number = 5551212\n",
         "10:16: first_number must be a string of digits"},
        {kHead + kCasTrunk + "first_number = \"9999990\"\n",
         "10:16: first_number 9999990 leaves no room for 24 channels of 7 digits"},
        {kHead + kCasTrunk + "first_number = \"100\"\n" + kCasTrunk + "first_number = \"120\"\n",
         "15:16: number 120 of channel 1.2.1 is already channel 1.1.21"},
        {kHead + "media = [\"SIGDET\"]\n", "6:9: media needs routing = \"flexible\""},
        {flexible("media = [\"SIGDET\", \"FAX\"]\n"),
         "7:20: media must name SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, R2MFP or "
         "CALLERID, not \"FAX\""},
        {flexible("media = [\"TONEGEN\", \"TONEGEN\"]\n"), "7:21: media lists TONEGEN twice"},
        {flexible("media = \"SIGDET\"\n"), "7:9: media must be a list of names"},
        {flexible(trunks(34, "[[board.trunk]]\nchannels = 31\ntype = 1\nsignaling = \"CCS\"\n")),
         "2:1: a flexible-routing board serves at most 1024 channels, this one has 1054"},
        {kHead + "routing = \"a\\nb\"\n",
         "6:11: routing must be \"fixed\" or \"flexible\", not \"a?b\""},
    };
    for (const auto& [text, message] : cases) {
        std::string error;
        EXPECT_FALSE(parseFarm(text, "t.toml", error).has_value()) << message;
        EXPECT_EQ(error, "t.toml:" + message);  // one line, so no line break in it
    }
}

TEST(FarmParser, ReadsEveryFieldOfABoardAndAcceptsTheLimits) {
    std::string error;
    auto f = parseFarm(kHead +
                           "routing = \"flexible\"\n"
                           "media = [\"CALLERID\", \"SIGDET\"]\n" +
                           kCasTrunk + "first_number = \"0100\"\n" +
                           "[[board.trunk]]\nchannels = 1\ntype = 0\nsignaling = \"CLEAR\"\n"
                           "[[board]]\nlogical_id = 32\nname = \"m\"\nserial = \"y\"\n"
                           "[[board.trunk]]\ntype = 4\n",
                       "t.toml", error);
    ASSERT_TRUE(f) << error;
    EXPECT_EQ(f->systemName, "s");
    ASSERT_EQ(f->boards.size(), 2u);
    const Board& b = f->boards[0];
    EXPECT_EQ(b.logicalId, 1u);
    EXPECT_EQ(b.name, "n");
    EXPECT_EQ(b.serial, "x");
    EXPECT_EQ(b.routing, Routing::Flexible);
    // Kept in the device map's order, not the file's.
    EXPECT_EQ(b.media, (std::vector<Media>{Media::SigDet, Media::CallerId}));
    EXPECT_EQ(b.trunks, (std::vector<Trunk>{{1, 24, 1, Signaling::CAS, "0100"},
                                            {2, 1, 0, Signaling::CLEAR, ""}}));
    const Board& a = f->boards[1];
    EXPECT_EQ(a.routing, Routing::Fixed);
    EXPECT_TRUE(a.media.empty());
    EXPECT_EQ(a.trunks, (std::vector<Trunk>{{1, 4, 4, Signaling::CAS, ""}}));
    EXPECT_TRUE(a.analog());
    EXPECT_EQ(f->channelForNumber("0123"), (ChannelRef{1, 1, 24}));
    EXPECT_FALSE(f->channelForNumber("0124"));
    EXPECT_EQ(f->numbers.size(), 24u);

    // No boards, 64 trunks, and a flexible board that names no media gets all seven.
    auto none = parseFarm("system_name = \"empty\"\n", "t.toml", error);
    ASSERT_TRUE(none) << error;
    EXPECT_TRUE(none->boards.empty());
    auto most = parseFarm(kHead + trunks(64, kCasTrunk), "t.toml", error);
    ASSERT_TRUE(most) << error;
    EXPECT_EQ(most->boards[0].trunks.size(), 64u);
    EXPECT_EQ(most->boards[0].trunks.back().number, 64);
    auto flexible = parseFarm(kHead + "routing = \"flexible\"\n", "t.toml", error);
    ASSERT_TRUE(flexible) << error;
    EXPECT_EQ(flexible->boards[0].media.size(), 7u);
    EXPECT_EQ(flexible->boards[0].media.front(), Media::SigDet);
    EXPECT_EQ(flexible->boards[0].media.back(), Media::CallerId);
}

TEST(FarmParser, DirectoryOrBrokenFileIsOneLineNamingItsPath) {
    std::string error;
    EXPECT_FALSE(loadFarmFile(kFarms, error));
    EXPECT_EQ(error, kFarms + ": cannot read the farm file: not a regular file");
    std::string path = ::testing::TempDir() + "broken_farm.toml";
    std::ofstream(path) << "system_name = \"s\"\n\n[[board]]\nlogical_id = 40\n";
    EXPECT_FALSE(loadFarmFile(path, error));
    EXPECT_EQ(error, path + ":4:14: logical_id must be 0 to 32, not 40");
}

}  // namespace
}  // namespace farm
