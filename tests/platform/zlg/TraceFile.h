#pragma once

#include <gtest/gtest.h>

#include <unistd.h>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include "platform/zlg/zlg.h"

// Points VX7_TRACE_FILE at a fresh file for one test and reads back its lines.
class TraceFile {
  public:
    explicit TraceFile(const std::string& name)
        : path_(::testing::TempDir() + name + "_" + std::to_string(::getpid()) + ".log") {
        ::unlink(path_.c_str());
        ::setenv(ZLG_TRACE_FILE_ENV, path_.c_str(), 1);
    }
    ~TraceFile() {
        ::unsetenv(ZLG_TRACE_FILE_ENV);
        ::unlink(path_.c_str());
    }
    const std::string& path() const { return path_; }
    std::vector<std::string> lines() const {
        std::ifstream in(path_);
        std::vector<std::string> out;
        for (std::string line; std::getline(in, line);) {
            out.push_back(line);
        }
        return out;
    }

  private:
    std::string path_;
};
