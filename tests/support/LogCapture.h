#pragma once

#include <iostream>
#include <sstream>
#include <string>

namespace testsupport {

// What is written to a standard stream (std::cout unless told otherwise) while it lives: the trace
// log or the error log as the program would have written it.
class LogCapture {
  public:
    explicit LogCapture(std::ostream& stream = std::cout)
        : stream_(stream), saved_(stream.rdbuf(captured_.rdbuf())) {}
    ~LogCapture() { stream_.rdbuf(saved_); }

    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    std::string Text() const { return captured_.str(); }

  private:
    std::ostream& stream_;
    std::ostringstream captured_;
    std::streambuf* saved_;
};

}  // namespace testsupport
