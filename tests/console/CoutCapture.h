#pragma once

#include <iostream>
#include <sstream>
#include <string>

namespace lineprobe::testing {

// Collects what is written to std::cout while it lives.
class CoutCapture {
  public:
    CoutCapture() : saved_(std::cout.rdbuf(captured_.rdbuf())) {}
    ~CoutCapture() { std::cout.rdbuf(saved_); }

    CoutCapture(const CoutCapture&) = delete;
    CoutCapture& operator=(const CoutCapture&) = delete;

    std::string Text() const { return captured_.str(); }

  private:
    std::ostringstream captured_;
    std::streambuf* saved_;
};

}  // namespace lineprobe::testing
