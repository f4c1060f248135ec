// A diagnostic written to its stream in one piece.
#pragma once

#include <iostream>
#include <sstream>

// std::cerr is unbuffered: a line streamed to it piece by piece leaves as one write per piece,
// and a line another thread writes meanwhile lands in the middle of it. A TKSWholeLine gathers
// the pieces and hands them on in one insertion when the statement that made it ends, so the
// reader threads and their callers can report at the same time and each report stays whole.
// Stream manipulators (std::hex, std::endl) act on the gathered text, not on the stream.
class TKSWholeLine {
  public:
    explicit TKSWholeLine(std::ostream& to = std::cerr) : to_(to) {}
    TKSWholeLine(const TKSWholeLine&) = delete;
    TKSWholeLine& operator=(const TKSWholeLine&) = delete;
    ~TKSWholeLine() {
        try {
            to_ << text_.str() << std::flush;
        } catch (...) {
            // A report that cannot be written is lost; the thread that made it goes on.
        }
    }

    template <class T>
    TKSWholeLine& operator<<(const T& piece) {
        text_ << piece;
        return *this;
    }
    TKSWholeLine& operator<<(std::ostream& (*manipulator)(std::ostream&)) {
        manipulator(text_);
        return *this;
    }
    TKSWholeLine& operator<<(std::ios_base& (*manipulator)(std::ios_base&)) {
        manipulator(text_);
        return *this;
    }

  private:
    std::ostream& to_;
    std::ostringstream text_;
};
