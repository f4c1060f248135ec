#pragma once

// Golden bytes of message bodies: a body's bytes as a sender writes them, with a canary
// behind the size it claims, and a message made of given bytes for readers. The byte
// builders and the comparison are the shared ones of Golden.h.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "Golden.h"
#include "framework/Msg.h"
#include "framework/MsgBody.h"
#include "platform/tkhost/tkhost.h"

namespace golden {

inline std::uint8_t* bodyOf(tolk::Msg& m) {
    return reinterpret_cast<std::uint8_t*>(m.getMsgRef()) + TK_MSG_HEADER_SIZE;
}

// A message whose body is exactly these bytes.
inline std::unique_ptr<tolk::Msg> msgOf(const Bytes& b) {
    auto m = std::make_unique<tolk::Msg>(static_cast<unsigned int>(b.size()));
    if (!b.empty()) {
        std::memcpy(bodyOf(*m), b.data(), b.size());
    }
    return m;
}

inline std::string text(const tolk::MsgBody& b) {
    std::ostringstream os;
    b.toStream(&os);
    return os.str();
}

// Filled into a message before a body writes it; the byte behind the body must keep it.
inline constexpr std::uint8_t kCanary = 0xA5;

struct Canaried {
    Bytes bytes;           // the body's bytes as written, GetByteSize of them
    unsigned int size;     // GetByteSize
    unsigned int written;  // writeMsg's result
    bool canaryKept;       // the byte behind GetByteSize is untouched
};

// Sizes the message by GetByteSize and writes the body into it, as a sender does, but one byte
// longer and filled with the canary, so that a body writing past its size, or leaving a gap,
// shows in the bytes.
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
