#pragma once

#include <ostream>

namespace tolk {

// Root of every framework class: anything derived can be streamed.
class virtualObject {
  public:
    virtual ~virtualObject() = default;
    virtual void toStream(std::ostream* os) const;
};

std::ostream& operator<<(std::ostream& os, const virtualObject& obj);

// Saves a stream's format flags and puts them back on scope exit.
class StreamFlagsGuard {
  public:
    explicit StreamFlagsGuard(std::ostream& os) : os_(os), flags_(os.flags()) {}
    ~StreamFlagsGuard() { os_.flags(flags_); }
    StreamFlagsGuard(const StreamFlagsGuard&) = delete;
    StreamFlagsGuard& operator=(const StreamFlagsGuard&) = delete;

  private:
    std::ostream& os_;
    std::ios_base::fmtflags flags_;
};

}  // namespace tolk
