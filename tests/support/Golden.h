#pragma once

// Golden bytes: readable builders of big-endian byte strings, a comparison that shows where
// two strings part, and a buffer with a canary byte behind it for writers of fixed-size
// records.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace golden {

using Bytes = std::vector<std::uint8_t>;

inline std::string hex(const Bytes& b) {
    std::string s;
    char buf[4];
    for (std::uint8_t c : b) {
        std::snprintf(buf, sizeof buf, "%02x ", c);
        s += buf;
    }
    return s;
}

// Both byte strings in hex and the offset of the first difference.
inline ::testing::AssertionResult SameBytes(const Bytes& actual, const Bytes& expected) {
    if (actual == expected) {
        return ::testing::AssertionSuccess();
    }
    std::size_t i = 0;
    while (i < actual.size() && i < expected.size() && actual[i] == expected[i]) {
        ++i;
    }
    return ::testing::AssertionFailure()
           << "first difference at offset " << i << " (actual " << actual.size()
           << " bytes, expected " << expected.size() << ")\n  actual:   " << hex(actual)
           << "\n  expected: " << hex(expected);
}

inline void u32(Bytes& b, std::uint32_t v) {
    b.push_back(static_cast<std::uint8_t>(v >> 24));
    b.push_back(static_cast<std::uint8_t>(v >> 16));
    b.push_back(static_cast<std::uint8_t>(v >> 8));
    b.push_back(static_cast<std::uint8_t>(v));
}
inline void u16(Bytes& b, std::uint16_t v) {
    b.push_back(static_cast<std::uint8_t>(v >> 8));
    b.push_back(static_cast<std::uint8_t>(v));
}
inline void u8(Bytes& b, std::uint8_t v) {
    b.push_back(v);
}
inline void zeros(Bytes& b, std::size_t n) {
    b.insert(b.end(), n, 0);
}
inline void chars(Bytes& b, const char* s, std::size_t fixed) {
    std::size_t n = std::strlen(s);
    b.insert(b.end(), s, s + n);
    zeros(b, fixed - n);
}

// What `write` put into a buffer of `size` bytes. A canary byte sits right behind the buffer:
// a writer that runs past its record fails the test instead of passing unseen.
template <class Write>
Bytes WrittenInto(std::size_t size, Write write) {
    constexpr std::uint8_t canary = 0xC5;
    Bytes buf(size + 1, 0);
    buf[size] = canary;
    write(buf.data());
    EXPECT_EQ(buf[size], canary) << "wrote past the " << size << " bytes of its record";
    buf.resize(size);
    return buf;
}

}  // namespace golden
