#pragma once

#include <ostream>
#include <type_traits>

#include "framework/Exception.h"
#include "framework/virtualObject.h"

namespace tolk {

namespace detail {

// Lists print their elements with operator<<; 8-bit integers go out as numbers so that a
// byte list never writes control characters into a log. Plain char stays a character.
template <class T>
void printElement(std::ostream& os, const T& v) {
    if constexpr (std::is_same_v<T, unsigned char> || std::is_same_v<T, signed char>) {
        os << static_cast<int>(v);
    } else if constexpr (std::is_pointer_v<T>) {
        os << static_cast<const void*>(v);
    } else {
        os << v;
    }
}

}  // namespace detail

template <class T>
class list : public virtualObject {
  public:
    class AllocationError : public Exception {
      public:
        explicit AllocationError(unsigned int size)
            : Exception("list::AllocationError"), reqSize(size) {}
        void toStream(std::ostream* os) const override {
            StreamFlagsGuard g(*os);
            *os << "list::AllocationError(ReqSize: " << std::dec << reqSize << ")";
        }
        unsigned int reqSize;
    };

    class OutOfBoundsError : public Exception {
      public:
        explicit OutOfBoundsError(unsigned int i) : Exception("list::OutOfBoundsError"), index(i) {}
        void toStream(std::ostream* os) const override {
            StreamFlagsGuard g(*os);
            *os << "list::OutOfBoundsError(Index: " << std::dec << index << ")";
        }
        unsigned int index;
    };

    ~list() override = 0;
    virtual unsigned int length() const { return len; }

  protected:
    unsigned int len = 0;
};

template <class T>
list<T>::~list() = default;

}  // namespace tolk
