#pragma once

// Golden bytes: readable builders of big-endian byte strings, a comparison that shows where
// two strings part, and a buffer with a canary byte behind it for writers of fixed-size
// records.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <initializer_list>
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

// A big-endian word and half-word, a run of words, byte strings joined in order, and a
// character field of `fixed` bytes holding s.
inline Bytes u32(std::uint32_t v) {
    return {static_cast<std::uint8_t>(v >> 24), static_cast<std::uint8_t>(v >> 16),
            static_cast<std::uint8_t>(v >> 8), static_cast<std::uint8_t>(v)};
}
inline Bytes u16(std::uint16_t v) {
    return {static_cast<std::uint8_t>(v >> 8), static_cast<std::uint8_t>(v)};
}
inline Bytes concat(std::initializer_list<Bytes> parts) {
    Bytes out;
    for (const Bytes& p : parts) {
        out.insert(out.end(), p.begin(), p.end());
    }
    return out;
}
inline Bytes words(std::initializer_list<std::uint32_t> values) {
    Bytes out;
    for (std::uint32_t v : values) {
        const Bytes w = u32(v);
        out.insert(out.end(), w.begin(), w.end());
    }
    return out;
}
inline Bytes text(const std::string& s, std::size_t fixed) {
    Bytes b(s.begin(), s.end());
    b.resize(fixed, 0);
    return b;
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
