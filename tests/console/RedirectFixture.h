#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <string>

namespace lineprobe::testing {

// A fresh directory for the log files of one test, and std::cout and std::cerr put back on the
// buffers they had, whatever the test redirected them to.
class RedirectedStreams : public ::testing::Test {
  protected:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "lp-redir-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        savedCout_ = std::cout.rdbuf();
        savedCerr_ = std::cerr.rdbuf();
    }
    void TearDown() override {
        std::cout.rdbuf(savedCout_);
        std::cerr.rdbuf(savedCerr_);
        std::filesystem::remove_all(dir_);
    }

    std::filesystem::path dir_;
    std::streambuf* savedCout_ = nullptr;
    std::streambuf* savedCerr_ = nullptr;
};

}  // namespace lineprobe::testing
