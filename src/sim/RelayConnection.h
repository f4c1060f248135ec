// One client of vx7sim's relay: its socket, the bytes read and not yet cut into frames, the
// bytes queued and not yet sent, and what the client has become (open, its address). The
// server decides what a frame means and when a client has had too much; this only moves bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "platform/tkhost/tkhost.h"
#include "sim/Emulation.h"
#include "transport/TKSFrame.h"

namespace sim {

class RelayConnection {
  public:
    RelayConnection(int fd, std::uint64_t serial, Clock::time_point accepted)
        : fd(fd), serial(serial), accepted(accepted) {}

    const int fd;
    const std::uint64_t serial;
    const Clock::time_point accepted;
    bool opened = false;
    bool dead = false;
    // Whether the poll is told to wake for room to write.
    bool wantWrite = false;
    TKCompDesc addr{};

    // One read of what the socket holds, cut to a fixed chunk.
    struct Read {
        std::size_t bytes = 0;  // 0 and not ended: nothing there now
        bool full = false;      // the chunk was filled: there may be more
        bool ended = false;     // the peer closed or the read failed; `why` says so, if worth it
        std::string why;
    };
    Read receive();

    // The next whole frame read; its parts point into the input and stay valid until the next
    // receive() or compactInput().
    struct Frame {
        msg_t header;
        const unsigned char* body = nullptr;
        const unsigned char* ex = nullptr;
    };
    enum class FrameStatus { Ready, Partial, Oversized };
    // Oversized leaves `frame.header` holding the header that was refused.
    FrameStatus nextFrame(Frame& frame);
    // Moves what is left of a partial frame to the front, so the buffer stays small.
    void compactInput();

    // Queues one frame; the number of bytes queued.
    std::size_t queueFrame(std::uint32_t type, const unsigned char* body, std::uint32_t size,
                           const unsigned char* ex, std::uint32_t exSize);
    // Queues a block as a message frame; 0 when its size cannot go into a frame.
    std::size_t queueBlock(const TKMsg32Bit* block);
    std::size_t pending() const { return out.size() - outPos; }
    // Sends what the socket takes now, adding the bytes sent to `sent`. False when the send
    // failed (`why` says why): the connection is then to be closed.
    bool send(std::size_t& sent, std::string& why);
    // Drops everything queued; the number of bytes dropped.
    std::size_t discardOutput();

  private:
    std::vector<unsigned char> in;
    std::size_t inPos = 0;
    std::vector<unsigned char> out;
    std::size_t outPos = 0;
};

}  // namespace sim
