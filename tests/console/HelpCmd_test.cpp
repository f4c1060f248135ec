#include "console/HelpCmd.h"

#include <gtest/gtest.h>

#include <string>

namespace lineprobe {
namespace {

TEST(HelpCmd, PagerCommandJoinsDirectoryBinAndFile) {
    EXPECT_EQ(HelpCmd::BuildPagerCommand("/opt/orvane/", "lineprobe_help.txt"),
              std::optional<std::string>("less /opt/orvane/bin/lineprobe_help.txt"));
    // No separator is added: the directory carries its own trailing slash.
    EXPECT_EQ(HelpCmd::BuildPagerCommand("/opt/orvane", "lineprobe_help.txt"),
              std::optional<std::string>("less /opt/orvanebin/lineprobe_help.txt"));
}

TEST(HelpCmd, PagerCommandMustFitTwoHundredFiftyFiveCharacters) {
    // "less " (5) + directory + "bin/" (4) + "lineprobe_help.txt" (18) = 27 + directory.
    const std::string fits = "/" + std::string(226, 'd') + "/";     // 228: line of 255
    const std::string tooLong = "/" + std::string(227, 'd') + "/";  // 229: line of 256

    const std::optional<std::string> longest =
        HelpCmd::BuildPagerCommand(fits, "lineprobe_help.txt");
    ASSERT_TRUE(longest.has_value());
    EXPECT_EQ(longest->size(), 255u);
    EXPECT_FALSE(HelpCmd::BuildPagerCommand(tooLong, "lineprobe_help.txt").has_value());
    EXPECT_FALSE(HelpCmd::BuildPagerCommand(std::string(5000, 'x'), "lineprobe_help.txt"));
}

}  // namespace
}  // namespace lineprobe
