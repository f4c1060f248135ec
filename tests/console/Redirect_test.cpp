#include "console/Redirect.h"

#include "RedirectFixture.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <sstream>
#include <string>

namespace lineprobe {
namespace {

std::string Slurp(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

using RedirectTest = testing::RedirectedStreams;

TEST_F(RedirectTest, CoutGoesToATruncatedFile) {
    const std::filesystem::path log = dir_ / "lineprobe.log";
    std::ofstream(log) << "left over from the last run\n";

    ASSERT_TRUE(Redirect(std::cout, log.c_str()));
    std::cout << "first line" << std::endl;

    EXPECT_EQ(Slurp(log), "first line\n");
    EXPECT_EQ(sbuf_cout, savedCout_);
}

TEST_F(RedirectTest, CerrGoesToItsOwnFile) {
    const std::filesystem::path log = dir_ / "lineprobe_err.log";

    ASSERT_TRUE(Redirect(std::cerr, log.c_str()));
    std::cerr << "an error" << std::endl;

    EXPECT_EQ(Slurp(log), "an error\n");
    EXPECT_EQ(sbuf_cerr, savedCerr_);
}

TEST_F(RedirectTest, OtherStreamsAreRefusedAndNoFileIsMade) {
    std::ostringstream other;
    const std::filesystem::path log = dir_ / "other.log";

    EXPECT_FALSE(Redirect(other, log.c_str()));
    EXPECT_FALSE(Redirect(std::clog, log.c_str()));
    EXPECT_FALSE(std::filesystem::exists(log));
}

TEST_F(RedirectTest, UnopenableFileLeavesTheStreamAlone) {
    const std::filesystem::path log = dir_ / "no-such-dir" / "lineprobe.log";

    EXPECT_FALSE(Redirect(std::cout, log.c_str()));
    EXPECT_EQ(std::cout.rdbuf(), savedCout_);
}

}  // namespace
}  // namespace lineprobe
