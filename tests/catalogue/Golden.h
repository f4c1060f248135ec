#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "framework/Msg.h"
#include "framework/MsgBody.h"
#include "platform/tkhost/tkhost.h"

namespace golden {

using Bytes = std::vector<std::uint8_t>;

inline std::uint8_t* bodyOf(tolk::Msg& m) {
    return reinterpret_cast<std::uint8_t*>(m.getMsgRef()) + TK_MSG_HEADER_SIZE;
}

inline Bytes bytesOf(tolk::Msg& m) {
    const std::uint8_t* p = bodyOf(m);
    return Bytes(p, p + m.getSize());
}

// A message whose body is exactly these bytes.
inline std::unique_ptr<tolk::Msg> msgOf(const Bytes& b) {
    auto m = std::make_unique<tolk::Msg>(static_cast<unsigned int>(b.size()));
    if (!b.empty()) {
        std::memcpy(bodyOf(*m), b.data(), b.size());
    }
    return m;
}

struct Encoded {
    Bytes bytes;
    unsigned int size;     // GetByteSize
    unsigned int written;  // writeMsg's result
};

// Sizes the message by GetByteSize and writes the body into it, as a sender does.
inline Encoded encode(tolk::MsgBody& body) {
    Encoded e;
    e.size = body.GetByteSize();
    tolk::Msg m(e.size);
    e.written = body.writeMsg(&m, 0);
    e.bytes = bytesOf(m);
    return e;
}

inline std::string text(const tolk::MsgBody& b) {
    std::ostringstream os;
    b.toStream(&os);
    return os.str();
}

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

// Big-endian helpers for writing golden bytes out readably.
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

}  // namespace golden

namespace golden {

// Filled into a message before a body writes it; the byte behind the body must keep it.
inline constexpr std::uint8_t kCanary = 0xA5;

struct Canaried {
    Bytes bytes;           // the body's bytes as written, GetByteSize of them
    unsigned int size;     // GetByteSize
    unsigned int written;  // writeMsg's result
    bool canaryKept;       // the byte behind GetByteSize is untouched
};

// As encode, into a message one byte longer than GetByteSize and filled with the canary, so
// that a body writing past its size, or leaving a gap, shows in the bytes.
inline Canaried encodeCanaried(tolk::MsgBody& body) {
    Canaried c;
    c.size = body.GetByteSize();
    tolk::Msg m(c.size + 1);
    std::memset(bodyOf(m), kCanary, c.size + 1);
    c.written = body.writeMsg(&m, 0);
    const std::uint8_t* p = bodyOf(m);
    c.bytes = Bytes(p, p + c.size);
    c.canaryKept = p[c.size] == kCanary;
    return c;
}

}  // namespace golden
