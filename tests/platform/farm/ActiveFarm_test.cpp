#include "platform/farm/ActiveFarm.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "platform/farm/FarmParser.h"

namespace farm {
namespace {

const std::string kFarms = LINEPROBE_FARMS_DIR;

class ActiveFarmTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ::unsetenv(kFarmEnvironment);
        resetActiveFarm();
    }
    void TearDown() override {
        ::unsetenv(kFarmEnvironment);
        resetActiveFarm();
    }
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

TEST_F(ActiveFarmTest, UnsetMeansTheBuiltinFarm) {
    FarmLoad load = activeFarm();
    ASSERT_TRUE(load.farm) << load.error;
    EXPECT_EQ(load.source, kBuiltinFarmSource);
    EXPECT_EQ(load.farm->systemName, "vx7-demo");
}

TEST_F(ActiveFarmTest, EmptyVariableMeansTheBuiltinFarm) {
    ::setenv(kFarmEnvironment, "", 1);
    FarmLoad load = activeFarm();
    ASSERT_TRUE(load.farm) << load.error;
    EXPECT_EQ(load.farm->systemName, "vx7-demo");
}

TEST_F(ActiveFarmTest, VariableNamesAnotherFile) {
    ::setenv(kFarmEnvironment, (kFarms + "/flexible.toml").c_str(), 1);
    FarmLoad load = activeFarm();
    ASSERT_TRUE(load.farm) << load.error;
    EXPECT_EQ(load.source, kFarms + "/flexible.toml");
    EXPECT_EQ(load.farm->systemName, "vx7-flex");
}

TEST_F(ActiveFarmTest, KeptUntilReset) {
    FarmLoad first = activeFarm();
    ::setenv(kFarmEnvironment, (kFarms + "/gaps.toml").c_str(), 1);
    EXPECT_EQ(activeFarm().farm, first.farm);
    resetActiveFarm();
    FarmLoad second = activeFarm();
    ASSERT_TRUE(second.farm);
    EXPECT_EQ(second.farm->systemName, "vx7-gaps");
}

TEST_F(ActiveFarmTest, BrokenFileGivesNoFarmAndItsLine) {
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

}  // namespace
}  // namespace farm
