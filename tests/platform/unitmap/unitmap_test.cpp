#include "platform/unitmap/unitmap.h"

#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <string>
#include <tuple>
#include <vector>

#include "platform/farm/ActiveFarm.h"

namespace {

const std::string kFarms = LINEPROBE_FARMS_DIR;
using Bytes = std::array<unsigned char, 8>;

// Bytes of a TKCompDesc: instance in host order, board, 0, processor 1, component, node 0, 0.
Bytes addr(unsigned instance, unsigned board, unsigned component) {
    Bytes b = {0, 0, static_cast<unsigned char>(board), 0, 1, static_cast<unsigned char>(component),
               0, 0};
    const auto i = static_cast<uint16_t>(instance);
    std::memcpy(b.data(), &i, sizeof i);
    return b;
}

class DeviceMap : public ::testing::Test {
  protected:
    void SetUp() override { use(""); }
    void TearDown() override {
        ::unsetenv(farm::kFarmEnvironment);
        farm::resetActiveFarm();
    }

    static void use(const std::string& file) {
        if (file.empty()) {
            ::unsetenv(farm::kFarmEnvironment);
        } else {
            ::setenv(farm::kFarmEnvironment, file.c_str(), 1);
        }
        farm::resetActiveFarm();
    }

    static UM_AUID host() {
        UM_AUID h = 0;
        EXPECT_EQ(um_getHostAU(&h), UM_SUCCESS);
        return h;
    }

    // The board search of the system view: CTPLATFORM "VX7" and LOGICAL ID, room for one.
    static std::vector<UM_AUID> findBoard(unsigned id, const std::string& platform = "VX7") {
        unsigned logical = id;
        um_attribute search[2];
        um_initAttributeStruct(&search[0], "CTPLATFORM", const_cast<char*>(platform.c_str()),
                               static_cast<uint32_t>(platform.size() + 1), 0, 0);
        um_initAttributeStruct(&search[1], "LOGICAL ID", &logical, 4, 0, 0);
        uint32_t count = 1;
        UM_AUID found[1] = {0};
        EXPECT_EQ(um_findAUs(host(), 2, search, &count, found), UM_SUCCESS);
        return std::vector<UM_AUID>(found, found + count);
    }

    static std::vector<UM_AUID> findType(UM_AUID parent, unsigned type, uint32_t room,
                                         uint32_t size = 4) {
        unsigned value = type;
        um_attribute search;
        um_initAttributeStruct(&search, "TYPE", &value, size, 0, 0);
        std::vector<UM_AUID> found(room);
        uint32_t count = room;
        EXPECT_EQ(um_findAUs(parent, 1, &search, &count, found.data()), UM_SUCCESS);
        found.resize(count);
        return found;
    }

    static std::string text(UM_AUID au, const char* name) {
        char buf[256] = {};
        um_attribute a;
        um_initAttributeStruct(&a, name, buf, sizeof buf, 0, 0);
        EXPECT_EQ(um_getAttributes(au, 1, &a), UM_SUCCESS) << name;
        return buf;
    }

    static unsigned number(UM_AUID au, const char* name) {
        unsigned v = 0xDEADBEEF;
        um_attribute a;
        um_initAttributeStruct(&a, name, &v, 4, 0, 0);
        EXPECT_EQ(um_getAttributes(au, 1, &a), UM_SUCCESS) << name;
        return v;
    }
};

TEST_F(DeviceMap, SystemViewFindsExactlyTheFarmsBoardsUnderAHostNamedAfterIt) {
    EXPECT_EQ(text(host(), "NAME"), "vx7-demo");
    std::map<unsigned, UM_AUID> boards;
    for (unsigned id = 0; id <= 32; ++id) {
        auto found = findBoard(id);
        ASSERT_LE(found.size(), 1u);
        if (!found.empty()) {
            boards[id] = found[0];
        }
    }
    ASSERT_EQ(boards.size(), 3u);
    const std::tuple<unsigned, const char*, const char*, unsigned> expected[] = {
        {1, "VX7/T1-2", "VX7-0001", 2},
        {2, "VX7/PRI-1", "VX7-0002", 1},
        {3, "VX7/AN-8", "VX7-0003", 2}};
    for (auto [id, name, serial, trunks] : expected) {
        ASSERT_TRUE(boards.count(id)) << id;
        EXPECT_EQ(text(boards[id], "NAME"), name);
        EXPECT_EQ(text(boards[id], "SERIAL_NUMBER"), serial);
        EXPECT_EQ(number(boards[id], "NUM_TRUNKS"), trunks);
    }
    // The platform must match wholly.
    EXPECT_TRUE(findBoard(1, "VX70").empty());
}

TEST_F(DeviceMap, LineAUsCarryTheirLconAddressAndSearchStopsAtTheRoomGiven) {
    UM_AUID board = findBoard(1).at(0);
    auto lines = findType(board, 503, 64);
    ASSERT_EQ(lines.size(), 2u);
    for (unsigned i = 0; i < lines.size(); ++i) {
        Bytes admin{};
        um_attribute a;
        um_initAttributeStruct(&a, "LINEADMINADDR", admin.data(), 8, 0, 0);
        ASSERT_EQ(um_getAttributes(lines[i], 1, &a), UM_SUCCESS);
        EXPECT_EQ(admin, addr(i + 1, 1, 22));
    }
    EXPECT_EQ(findType(board, 503, 1), std::vector<UM_AUID>{lines[0]});  // tree order
}

const char* const kVoiceAttributes[] = {"SIGDETADDR",    "CLUSTERADDR", "SIGBUFADDR_DTMF",
                                        "SIGBUFADDR_MF", "TONEGENADDR", "CALLANALYSISADDR",
                                        "R2MFPADDR",     "CALLERIDADDR"};

TEST_F(DeviceMap, BoardWithAllMediaAnswersWhole) {
    const std::string path = ::testing::TempDir() + "allmedia_farm.toml";
    std::ofstream(path) << "system_name = \"m\"\n[[board]]\nlogical_id = 9\nname = \"n\"\n"
                           "serial = \"s\"\nrouting = \"flexible\"\n[[board.trunk]]\n"
                           "channels = 2\ntype = 1\nsignaling = \"CAS\"\n";
    use(path);
    // The board manager's voice walk: groups of TYPE 501, up to 4 voice AUs of TYPE 502 in each,
    // searched for with a TYPE of 5 bytes, and the eight address attributes of a voice AU.
    std::vector<UM_AUID> voices;
    for (UM_AUID group : findType(findBoard(9).at(0), 501, 256, 5)) {
        const std::vector<UM_AUID> found = findType(group, 502, 4, 5);
        voices.insert(voices.end(), found.begin(), found.end());
    }
    ASSERT_EQ(voices.size(), 2u);
    Bytes values[8];
    um_attribute attrs[8];
    for (int i = 0; i < 8; ++i) {
        values[i].fill(0xAA);
        um_initAttributeStruct(&attrs[i], kVoiceAttributes[i], values[i].data(), 8, 0, 0);
    }
    EXPECT_EQ(um_getAttributes(voices[1], 8, attrs), UM_SUCCESS);
    for (const um_attribute& a : attrs) {
        EXPECT_EQ(a.status, 0u);
    }
    EXPECT_EQ(values[6], addr(2, 9, 66));
}

TEST_F(DeviceMap, PartialAnswerMarksEachAttributeAndAllFailingGivesTheFirstFailure) {
    UM_AUID board = findBoard(1).at(0);
    char name[256];
    unsigned bogus = 0x55555555;
    unsigned trunks = 0;
    um_attribute a[3];
    um_initAttributeStruct(&a[0], "NAME", name, sizeof name, 0, 0);
    um_initAttributeStruct(&a[1], "BOGUS", &bogus, 4, 0, 0);
    um_initAttributeStruct(&a[2], "NUM_TRUNKS", &trunks, 4, 0, 0);
    EXPECT_EQ(um_getAttributes(board, 3, a), UM_PARTIAL);
    EXPECT_EQ(a[0].status, 0u);
    EXPECT_EQ(a[1].status, static_cast<uint32_t>(UM_ERR_NO_SUCH_ATTRIBUTE));
    EXPECT_EQ(a[2].status, 0u);
    EXPECT_STREQ(name, "VX7/T1-2");
    EXPECT_EQ(bogus, 0x55555555u);
    EXPECT_EQ(trunks, 2u);
    um_initAttributeStruct(&a[0], "TYPE", &trunks, 4, 0, 0);
    um_initAttributeStruct(&a[2], "ChannelCount", &trunks, 4, 0, 0);
    EXPECT_EQ(um_getAttributes(board, 1, a), UM_ERR_NO_SUCH_ATTRIBUTE);
    EXPECT_EQ(um_getAttributes(board, 2, &a[1]), UM_ERR_NO_SUCH_ATTRIBUTE);
}

TEST_F(DeviceMap, ValuesNeedTheirRoom) {
    const UM_AUID board = findBoard(1).at(0);
    const UM_AUID line = findType(board, 503, 1).at(0);
    // One byte short of each value's room ("VX7/T1-2" needs 9 with its terminator): refused,
    // and the buffer left as it was.
    const std::tuple<UM_AUID, const char*, uint32_t> tooSmall[] = {
        {board, "NAME", 8}, {board, "NUM_TRUNKS", 3}, {line, "LINEADMINADDR", 7}};
    char buf[10];
    um_attribute a;
    for (auto [au, name, size] : tooSmall) {
        SCOPED_TRACE(name);
        std::memset(buf, '#', sizeof buf);
        um_initAttributeStruct(&a, name, buf, size, 0, 0);
        EXPECT_EQ(um_getAttributes(au, 1, &a), UM_ERR_BUFFER_TOO_SMALL);
        EXPECT_EQ(a.status, static_cast<uint32_t>(UM_ERR_BUFFER_TOO_SMALL));
        EXPECT_EQ(std::string(buf, 10), std::string(10, '#'));
    }
    um_initAttributeStruct(&a, "NAME", buf, 9, 0, 0);
    EXPECT_EQ(um_getAttributes(board, 1, &a), UM_SUCCESS);
    EXPECT_EQ(std::string(buf, 10), std::string("VX7/T1-2\0#", 10));
}

TEST_F(DeviceMap, UnknownHandlesAndBadArguments) {
    char buf[16];
    um_attribute a;
    um_initAttributeStruct(&a, "NAME", buf, sizeof buf, 0, 0);
    EXPECT_EQ(um_getAttributes(0, 1, &a), UM_ERR_INVALID_AU);
    EXPECT_EQ(a.status, static_cast<uint32_t>(UM_ERR_INVALID_AU));
    EXPECT_EQ(um_getAttributes(100000, 1, &a), UM_ERR_INVALID_AU);
    EXPECT_EQ(um_getAttributes(host(), 0, &a), UM_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(um_getAttributes(host(), 1, nullptr), UM_ERR_INVALID_ARGUMENT);
    um_initAttributeStruct(&a, nullptr, buf, sizeof buf, 0, 0);
    EXPECT_EQ(um_getAttributes(host(), 1, &a), UM_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(um_getHostAU(nullptr), UM_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(um_initAttributeStruct(nullptr, "TYPE", buf, 4, 0, 0), UM_ERR_INVALID_ARGUMENT);

    uint32_t count = 4;
    UM_AUID found[4];
    EXPECT_EQ(um_findAUs(100000, 0, nullptr, &count, found), UM_ERR_INVALID_AU);
    EXPECT_EQ(um_findAUs(host(), 0, nullptr, nullptr, found), UM_ERR_INVALID_ARGUMENT);
    EXPECT_EQ(um_findAUs(host(), 0, nullptr, &count, nullptr), UM_ERR_INVALID_ARGUMENT);
    um_initAttributeStruct(&a, "NAME", nullptr, 4, 0, 0);
    EXPECT_EQ(um_findAUs(host(), 1, &a, &count, found), UM_ERR_INVALID_ARGUMENT);
}

TEST_F(DeviceMap, BrokenFarmMeansTheBoardServiceIsDownUntilRepaired) {
    const std::string path = ::testing::TempDir() + "broken_unitmap_farm.toml";
    std::ofstream(path) << "system_name = \"s\"\n[[board]]\nlogical_id = 99\n";
    use(path);
    ::testing::internal::CaptureStderr();
    UM_AUID h = 77;
    EXPECT_EQ(um_getHostAU(&h), UM_ERR_SERVICE_DOWN);
    EXPECT_EQ(h, 77u);
    uint32_t count = 1;
    UM_AUID found;
    EXPECT_EQ(um_findAUs(1, 0, nullptr, &count, &found), UM_ERR_SERVICE_DOWN);
    char buf[16];
    um_attribute a;
    um_initAttributeStruct(&a, "NAME", buf, sizeof buf, 0, 0);
    EXPECT_EQ(um_getAttributes(1, 1, &a), UM_ERR_SERVICE_DOWN);
    EXPECT_EQ(a.status, static_cast<uint32_t>(UM_ERR_SERVICE_DOWN));
    std::string printed = ::testing::internal::GetCapturedStderr();
    EXPECT_EQ(printed.rfind(path + ":", 0), 0u) << printed;

    use(kFarms + "/default.toml");  // repaired: the service is back
    EXPECT_EQ(um_getHostAU(&h), UM_SUCCESS);
    EXPECT_EQ(text(h, "NAME"), "vx7-demo");
}

}  // namespace
