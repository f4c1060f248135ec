#pragma once

#include "framework/virtualObject.h"

namespace tolk {

// Root of the framework's exceptions. The text is not copied: it must be a literal or
// otherwise outlive the exception.
class Exception : public virtualObject {
  public:
    Exception() : text("Exception") {}
    explicit Exception(const char* t) : text(t) {}
    ~Exception() override = default;
    void toStream(std::ostream* os) const override;

    const char* text;
};

}  // namespace tolk
