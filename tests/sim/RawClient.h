#pragma once

// Test-side pieces for driving vx7sim's server: a raw TCP client for what a well-behaved client
// never sends, and a log that the server's thread writes while the test reads it.

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <mutex>
#include <streambuf>
#include <string>
#include <thread>
#include <vector>

#include "BoardEvents.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "framework/Addressable.h"
#include "transport/TKSFrame.h"

namespace sim {

// A plain TCP client for raw frames.
class RawClient {
  public:
    // A receive buffer of rcvbuf bytes (0: the system's) keeps what the kernel holds for a
    // client that does not read small against what the server queues.
    explicit RawClient(int port, int rcvbuf = 0) {
        fd = ::socket(AF_INET, SOCK_STREAM, 0);
        if (rcvbuf > 0) {
            setsockopt(fd, SOL_SOCKET, SO_RCVBUF, &rcvbuf, sizeof rcvbuf);
        }
        sockaddr_in sa{};
        sa.sin_family = AF_INET;
        sa.sin_port = htons(static_cast<std::uint16_t>(port));
        sa.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        connected = ::connect(fd, reinterpret_cast<sockaddr*>(&sa), sizeof sa) == 0;
        timeval tv{5, 0};
        setsockopt(fd, SOL_SOCKET, SO_RCVTIMEO, &tv, sizeof tv);
    }
    ~RawClient() {
        if (fd >= 0) {
            ::close(fd);
        }
    }
    void send(const std::vector<unsigned char>& bytes) {
        ASSERT_EQ(::send(fd, bytes.data(), bytes.size(), MSG_NOSIGNAL),
                  static_cast<ssize_t>(bytes.size()));
    }
    std::vector<unsigned char> open() {
        unsigned char body[TKS_OPEN_BODY_BYTES];
        TKSOpenRequest req;
        req.maxRetMsgSize = 512;
        req.depth = 5;
        tksEncodeOpen(req, body);
        msg_t m;
        m.type = TKS_FRAME_OPEN;
        m.size = sizeof body;
        m.body = body;
        return tksEncodeFrame(m);
    }
    // A block from the host to `to` carrying `body`, as a client would send it (the relay
    // stamps its own source on it); the caller frees it.
    static TKMsg32Bit* block(std::uint32_t type, const farm::Address& to, std::uint32_t trans,
                             const std::vector<unsigned char>& body = {}) {
        TKMsg32Bit* b = nullptr;
        EXPECT_EQ(tkMsgAllocate(static_cast<unsigned int>(body.size()), &b), 0);
        b->type = type;
        b->transTag = trans << 8;
        b->srcBoard = 0xFF;
        b->srcInstance = 1;
        b->tgtInstance = to.instance;
        b->tgtBoard = to.board;
        b->tgtProcessor = to.processor;
        b->tgtComponent = to.component;
        b->tgtNode = to.node;
        if (!body.empty()) {
            std::memcpy(tkMsgBody(b), body.data(), body.size());
        }
        return b;
    }
    // A message frame of a request without a body.
    static std::vector<unsigned char> request(const farm::Address& to, std::uint32_t type) {
        TKMsg32Bit* b = block(type, to, 0x42);
        std::vector<unsigned char> frame;
        EXPECT_TRUE(tksEncodeMessageFrame(b, frame));
        tkMsgFree(b);
        return frame;
    }
    // Sends the open and reads the whole assigned-address frame: true when it came.
    bool opened() {
        send(open());
        return read(TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES).size() ==
               TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES;
    }
    // Reads a frame header: the frame's type, or 0 when none came.
    std::uint32_t nextType() {
        std::vector<unsigned char> head = read(TKS_FRAME_HEADER_SIZE);
        msg_t h;
        if (head.size() != TKS_FRAME_HEADER_SIZE) {
            return 0;
        }
        tksDecodeFrameHeader(head.data(), h);
        return h.type;
    }
    // Reads n bytes; fewer if the server closed.
    std::vector<unsigned char> read(std::size_t n) {
        std::vector<unsigned char> out(n);
        std::size_t got = 0;
        while (got < n) {
            ssize_t r = ::recv(fd, out.data() + got, n - got, 0);
            if (r <= 0) {
                break;
            }
            got += static_cast<std::size_t>(r);
        }
        out.resize(got);
        return out;
    }
    bool closedByServer() {
        char c;
        return ::recv(fd, &c, 1, 0) == 0;
    }
    int fd = -1;
    bool connected = false;
};

// A message frame whose header is 12 bytes instead of 56.
inline const std::vector<unsigned char> kShortHeaderFrame = {0,  0, 0x03, 0xE9, 0, 0, 0, 0, 0, 0, 0,
                                                             12, 0, 0,    0,    0, 0, 0, 0, 0, 1, 2,
                                                             3,  4, 5,    6,    7, 8, 9, 0, 1, 2};

// Subscribes the events of `group` that `a`'s target raises, handed to BoardEvents.
inline void subscribe(tolk::Addressable& a, std::uint32_t group) {
    a.asyncRegisterEvtGroup(group, &testsupport::BoardEvents::take);
    tolk::StdResource_Bodies::MsgDetectEvt_t sub;
    sub.RetAddr = a.getMsgQueue()->getHostDesc();
    sub.EvtType = group;
    sub.EvtGroup = 0;
    a.request(0x16, &sub, 0x17, nullptr, a.getId());
}

// The server's log, written on its thread and read by the test while it runs.
class LockedLog : public std::streambuf {
  public:
    std::string text() {
        std::lock_guard<std::mutex> g(lock_);
        return text_;
    }

  protected:
    int_type overflow(int_type c) override {
        if (c != traits_type::eof()) {
            std::lock_guard<std::mutex> g(lock_);
            text_.push_back(static_cast<char>(c));
        }
        return c;
    }
    std::streamsize xsputn(const char* p, std::streamsize n) override {
        std::lock_guard<std::mutex> g(lock_);
        text_.append(p, static_cast<std::size_t>(n));
        return n;
    }

  private:
    std::mutex lock_;
    std::string text_;
};

}  // namespace sim
