#pragma once

#include "framework/staticList.h"

namespace tolk {

// A staticList<char> that always holds its terminating zero: length() counts it.
class string : public staticList<char> {
  public:
    string() = default;
    string(const char* s);  // NOLINT: converting on purpose, bodies take literals
    string(const string& other) = default;
    string& operator=(const string& other) {
        staticList<char>::operator=(other);
        return *this;
    }
    void toStream(std::ostream* os) const override;
    const char* c_str() const { return buffer != nullptr ? buffer : ""; }
};

}  // namespace tolk
