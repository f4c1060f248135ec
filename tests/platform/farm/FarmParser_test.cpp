#include "platform/farm/FarmParser.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>

namespace farm {
namespace {

const std::string kFarms = LINEPROBE_FARMS_DIR;

// A valid start: a farm with one digital board, to which a case appends a trunk or more.
const std::string kHead =
    "system_name = \"s\"\n"  // line 1
    "[[board]]\n"            // line 2
    "logical_id = 1\n"       // line 3
    "name = \"n\"\n"         // line 4
    "serial = \"x\"\n";      // line 5
const std::string kCasTrunk = "[[board.trunk]]\nchannels = 24\ntype = 1\nsignaling = \"CAS\"\n";

struct BadFarm {
    const char* label;
    std::string text;
    std::string message;  // after "t.toml:"
};

std::ostream& operator<<(std::ostream& os, const BadFarm& b) {
    return os << b.label;
}

class FarmParserRejects : public ::testing::TestWithParam<BadFarm> {};

TEST_P(FarmParserRejects, WithOneLineNamingThePlace) {
    std::string error;
    auto farm = parseFarm(GetParam().text, "t.toml", error);
    EXPECT_FALSE(farm.has_value());
    EXPECT_EQ(error, "t.toml:" + GetParam().message);
    EXPECT_EQ(error.find('\n'), std::string::npos);
}

std::string trunks(int n, const std::string& trunk) {
    std::string s;
    for (int i = 0; i < n; ++i) {
        s += trunk;
    }
    return s;
}

INSTANTIATE_TEST_SUITE_P(
    Cases, FarmParserRejects,
    ::testing::Values(
        BadFarm{"Syntax", "system_name = \"s\"\n[[board]\n",
                "2:9: Error while parsing table header: expected ']', saw '\\n'"},
        BadFarm{"Empty", "", "1:1: system_name is missing"},
        BadFarm{"SystemNameNotText", "system_name = 5\n", "1:15: system_name must be a string"},
        BadFarm{"SystemNameEmpty", "system_name = \"\"\n",
                "1:15: system_name must be 1 to 255 characters"},
        BadFarm{"SystemNameTooLong", "system_name = \"" + std::string(256, 'a') + "\"\n",
                "1:15: system_name must be 1 to 255 characters"},
        BadFarm{"UnknownTopKey", "system_name = \"s\"\nboards = 1\n",
                "2:1: unknown key \"boards\""},
        BadFarm{"BoardNotTables", "system_name = \"s\"\nboard = 3\n",
                "2:9: board must be an array of tables ([[board]])"},
        BadFarm{"LogicalIdMissing",
                "system_name = \"s\"\n[[board]]\nname = \"n\"\nserial = \"x\"\n",
                "2:1: logical_id is missing"},
        BadFarm{"LogicalIdNotInteger", "system_name = \"s\"\n[[board]]\nlogical_id = \"1\"\n",
                "3:14: logical_id must be an integer"},
        BadFarm{"LogicalIdTooBig", "system_name = \"s\"\n[[board]]\nlogical_id = 33\n",
                "3:14: logical_id must be 0 to 32, not 33"},
        BadFarm{"LogicalIdNegative", "system_name = \"s\"\n[[board]]\nlogical_id = -1\n",
                "3:14: logical_id must be 0 to 32, not -1"},
        BadFarm{"LogicalIdTwice", kHead + "[[board]]\nlogical_id = 1\n",
                "7:14: logical_id 1 is already used by the board at line 2"},
        BadFarm{"NameMissing", "system_name = \"s\"\n[[board]]\nlogical_id = 1\nserial = \"x\"\n",
                "2:1: name is missing"},
        BadFarm{"SerialNotText",
                "system_name = \"s\"\n[[board]]\nlogical_id = 1\nname = \"n\"\n"
                "serial = 7\n",
                "5:10: serial must be a string"},
        BadFarm{"UnknownBoardKey", kHead + "serail = \"y\"\n", "6:1: unknown key \"serail\""},
        BadFarm{"Routing", kHead + "routing = \"dynamic\"\n",
                "6:11: routing must be \"fixed\" or \"flexible\", not \"dynamic\""},
        BadFarm{"RoutingNotText", kHead + "routing = 1\n",
                "6:11: routing must be \"fixed\" or \"flexible\""},
        BadFarm{"TooManyTrunks", kHead + trunks(65, kCasTrunk),
                "262:1: a board has at most 64 trunks"},
        BadFarm{"TrunkNotTables", kHead + "trunk = 1\n",
                "6:9: trunk must be an array of tables ([[board.trunk]])"},
        BadFarm{"ChannelsTooMany",
                kHead + "[[board.trunk]]\nchannels = 32\ntype = 1\n"
                        "signaling = \"CAS\"\n",
                "7:12: channels must be 1 to 31, not 32"},
        BadFarm{"ChannelsZero",
                kHead + "[[board.trunk]]\nchannels = 0\ntype = 1\n"
                        "signaling = \"CAS\"\n",
                "7:12: channels must be 1 to 31, not 0"},
        BadFarm{"ChannelsNotInteger",
                kHead + "[[board.trunk]]\nchannels = 2.5\ntype = 1\n"
                        "signaling = \"CAS\"\n",
                "7:12: channels must be an integer"},
        BadFarm{"ChannelsMissing", kHead + "[[board.trunk]]\ntype = 1\nsignaling = \"CAS\"\n",
                "6:1: channels is missing"},
        BadFarm{"TypeMissing", kHead + "[[board.trunk]]\nchannels = 24\nsignaling = \"CAS\"\n",
                "6:1: type is missing"},
        BadFarm{"TypeTooBig", kHead + "[[board.trunk]]\nchannels = 24\ntype = 5\n",
                "8:8: type must be 0 to 4 (below 4 digital, 4 analog), not 5"},
        BadFarm{"SignalingUnknown",
                kHead + "[[board.trunk]]\nchannels = 24\ntype = 1\n"
                        "signaling = \"ISDN\"\n",
                "9:13: signaling must be \"CAS\", \"CCS\" or \"CLEAR\", not \"ISDN\""},
        BadFarm{"SignalingMissing", kHead + "[[board.trunk]]\nchannels = 24\ntype = 1\n",
                "6:1: signaling is missing"},
        BadFarm{"UnknownTrunkKey", kHead + "[[board.trunk]]\nchannel = 24\n",
                "7:1: unknown key \"channel\""},
        BadFarm{"AnalogChannels", kHead + "[[board.trunk]]\ntype = 4\nchannels = 8\n",
                "8:12: an analog trunk (type 4) has 4 channels, not 8"},
        BadFarm{"AnalogSignaling", kHead + "[[board.trunk]]\ntype = 4\nsignaling = \"CCS\"\n",
                "8:13: an analog trunk (type 4) uses CAS signaling, not \"CCS\""},
        BadFarm{"MixedAnalogDigital", kHead + kCasTrunk + "[[board.trunk]]\ntype = 4\n",
                "11:8: a board's trunks are all analog (type 4) or all digital"},
        BadFarm{"NumberNotDigits", kHead + kCasTrunk + "first_number = \"555-1212\"\n",
                "10:16: first_number must be 1 to 31 digits, not \"555-1212\""},
        BadFarm{"NumberNotText", kHead + kCasTrunk + "first_number = 5551212\n",
                "10:16: first_number must be a string of digits"},
        BadFarm{"NumberOverflows", kHead + kCasTrunk + "first_number = \"9999990\"\n",
                "10:16: first_number 9999990 leaves no room for 24 channels of 7 digits"},
        BadFarm{
            "NumberTaken",
            kHead + kCasTrunk + "first_number = \"100\"\n" + kCasTrunk + "first_number = \"120\"\n",
            "15:16: number 120 of channel 1.2.1 is already channel 1.1.21"},
        BadFarm{"MediaOnFixedBoard", kHead + "media = [\"SIGDET\"]\n",
                "6:9: media needs routing = \"flexible\""},
        BadFarm{"MediaUnknown", kHead + "routing = \"flexible\"\nmedia = [\"SIGDET\", \"FAX\"]\n",
                "7:20: media must name SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, "
                "R2MFP or CALLERID, not \"FAX\""},
        BadFarm{"MediaTwice",
                kHead + "routing = \"flexible\"\nmedia = [\"TONEGEN\", \"TONEGEN\"]\n",
                "7:21: media lists TONEGEN twice"},
        BadFarm{"MediaNotList", kHead + "routing = \"flexible\"\nmedia = \"SIGDET\"\n",
                "7:9: media must be a list of names"},
        BadFarm{"TooManyVoiceChannels",
                kHead + "routing = \"flexible\"\n" +
                    trunks(34, "[[board.trunk]]\nchannels = 31\ntype = 1\nsignaling = \"CCS\"\n"),
                "2:1: a flexible-routing board serves at most 1024 channels, this one has 1054"},
        BadFarm{"ControlCharacters", kHead + "routing = \"a\\nb\"\n",
                "6:11: routing must be \"fixed\" or \"flexible\", not \"a?b\""}),
    [](const ::testing::TestParamInfo<BadFarm>& info) { return std::string(info.param.label); });

TEST(FarmParser, ReadsEveryFieldOfABoard) {
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
    ASSERT_EQ(b.trunks.size(), 2u);
    EXPECT_EQ(b.trunks[0], (Trunk{1, 24, 1, Signaling::CAS, "0100"}));
    EXPECT_EQ(b.trunks[1], (Trunk{2, 1, 0, Signaling::CLEAR, ""}));
    const Board& a = f->boards[1];
    EXPECT_EQ(a.routing, Routing::Fixed);
    EXPECT_TRUE(a.media.empty());
    ASSERT_EQ(a.trunks.size(), 1u);
    EXPECT_EQ(a.trunks[0], (Trunk{1, 4, 4, Signaling::CAS, ""}));
    EXPECT_TRUE(a.analog());
    EXPECT_EQ(f->channelForNumber("0123"), (ChannelRef{1, 1, 24}));
    EXPECT_FALSE(f->channelForNumber("0124"));
    EXPECT_EQ(f->numbers.size(), 24u);
}

TEST(FarmParser, AcceptsNoBoardsSixtyFourTrunksAndGivesAFlexibleBoardAllSevenMedia) {
    std::string error;
    auto none = parseFarm("system_name = \"empty\"\n", "t.toml", error);
    ASSERT_TRUE(none) << error;
    EXPECT_TRUE(none->boards.empty());
    auto f = parseFarm(kHead + trunks(64, kCasTrunk), "t.toml", error);
    ASSERT_TRUE(f) << error;
    EXPECT_EQ(f->boards[0].trunks.size(), 64u);
    EXPECT_EQ(f->boards[0].trunks.back().number, 64);
    auto flexible = parseFarm(kHead + "routing = \"flexible\"\n", "t.toml", error);
    ASSERT_TRUE(flexible) << error;
    EXPECT_EQ(flexible->boards[0].media.size(), 7u);
    EXPECT_EQ(flexible->boards[0].media.front(), Media::SigDet);
    EXPECT_EQ(flexible->boards[0].media.back(), Media::CallerId);
}

TEST(FarmParser, FileThatCannotBeReadOrParsedIsOneLineNamingItsPath) {
    std::string error;
    EXPECT_FALSE(loadFarmFile(kFarms + "/no-such-farm.toml", error));
    EXPECT_EQ(error,
              kFarms + "/no-such-farm.toml: cannot read the farm file: No such file or directory");
    EXPECT_FALSE(loadFarmFile(kFarms, error));
    EXPECT_EQ(error, kFarms + ": cannot read the farm file: not a regular file");
    std::string path = ::testing::TempDir() + "broken_farm.toml";
    std::ofstream(path) << "system_name = \"s\"\n\n[[board]]\nlogical_id = 40\n";
    EXPECT_FALSE(loadFarmFile(path, error));
    EXPECT_EQ(error, path + ":4:14: logical_id must be 0 to 32, not 40");
}

}  // namespace
}  // namespace farm
