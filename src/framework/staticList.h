#pragma once

#include <algorithm>
#include <cstddef>
#include <new>

#include "framework/list.h"

namespace tolk {

// Growable array with no spare room: every growth costs a new array of exactly the size asked.
template <class T>
class staticList : public list<T> {
  public:
    // A request above this many bytes of elements cannot come from a real body; it is refused
    // with AllocationError instead of being handed to the allocator.
    static constexpr std::size_t MaxBytes = std::size_t{64} << 20;

    staticList() = default;
    staticList(const staticList& other) : list<T>() { staticList::operator=(other); }
    ~staticList() override { delete[] buffer; }

    void toStream(std::ostream* os) const override {
        *os << "{";
        for (unsigned int i = 0; i < this->len; ++i) {
            if (i != 0) {
                *os << " ";
            }
            detail::printElement(*os, buffer[i]);
        }
        *os << "}";
    }

    // No bounds check: callers stay below length(), resizing first where needed.
    virtual T* element(unsigned int i) { return buffer + i; }
    virtual T* operator[](unsigned int i) { return buffer + i; }
    const T* element(unsigned int i) const { return buffer + i; }

    virtual void realloc(unsigned int n) {
        if (n == capacity) {
            this->len = n;
            return;
        }
        if (buffer != nullptr && n >= capacity / 2 && n <= capacity) {
            this->len = n;
            return;
        }
        if (n > MaxBytes / sizeof(T)) {
            throw typename list<T>::AllocationError(n);
        }
        // Value-initialised so that scalars never carry stale heap bytes into a print.
        T* fresh = new (std::nothrow) T[n]();
        if (fresh == nullptr) {
            throw typename list<T>::AllocationError(n);
        }
        if (buffer != nullptr) {
            unsigned int keep = n < this->len ? n : this->len;
            try {
                for (unsigned int i = 0; i < keep && i < n; ++i) {
                    fresh[i] = buffer[i];
                }
            } catch (...) {
                delete[] fresh;
                throw;
            }
            delete[] buffer;
        }
        buffer = fresh;
        capacity = n;
        this->len = n;
    }

    virtual staticList& operator=(const staticList& other) {
        if (&other == this) {
            return *this;
        }
        realloc(other.length());
        for (unsigned int i = 0; i < this->len; ++i) {
            buffer[i] = other.buffer[i];
        }
        return *this;
    }

    unsigned int getCapacity() const { return capacity; }
    T* data() { return buffer; }
    const T* data() const { return buffer; }

  protected:
    T* buffer = nullptr;
    unsigned int capacity = 0;
};

}  // namespace tolk
