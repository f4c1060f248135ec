#include "sim/RelayConnection.h"

#include <errno.h>
#include <sys/socket.h>

#include <cstring>

namespace sim {

namespace {

constexpr std::size_t kReadChunk = 256 * 1024;
// Sent bytes are dropped from the front of the queue once they are this many.
constexpr std::size_t kOutputCompaction = 1u << 20;

}  // namespace

RelayConnection::Read RelayConnection::receive() {
    static thread_local std::vector<unsigned char> chunk(kReadChunk);
    Read r;
    for (;;) {
        ssize_t n = ::recv(fd, chunk.data(), chunk.size(), 0);
        if (n > 0) {
            in.insert(in.end(), chunk.data(), chunk.data() + n);
            r.bytes = static_cast<std::size_t>(n);
            r.full = r.bytes == chunk.size();
            return r;
        }
        if (n == 0) {
            r.ended = true;
            if (inPos < in.size()) {
                r.why = "closed in the middle of a frame";
            }
            return r;
        }
        if (errno == EINTR) {
            return r;
        }
        if (errno != EAGAIN && errno != EWOULDBLOCK) {
            r.ended = true;
            r.why = std::strerror(errno);
        }
        return r;
    }
}

RelayConnection::FrameStatus RelayConnection::nextFrame(Frame& frame) {
    const std::size_t avail = in.size() - inPos;
    if (avail < TKS_FRAME_HEADER_SIZE) {
        return FrameStatus::Partial;
    }
    const unsigned char* p = in.data() + inPos;
    tksDecodeFrameHeader(p, frame.header);
    if (!tksFrameSizesValid(frame.header.size, frame.header.ex_size)) {
        return FrameStatus::Oversized;
    }
    const std::size_t whole = TKS_FRAME_HEADER_SIZE + frame.header.size + frame.header.ex_size;
    if (avail < whole) {
        return FrameStatus::Partial;
    }
    inPos += whole;
    frame.body = p + TKS_FRAME_HEADER_SIZE;
    frame.ex = frame.body + frame.header.size;
    return FrameStatus::Ready;
}

void RelayConnection::compactInput() {
    if (inPos > 0) {
        in.erase(in.begin(), in.begin() + static_cast<std::ptrdiff_t>(inPos));
        inPos = 0;
    }
}

std::size_t RelayConnection::queueFrame(std::uint32_t type, const unsigned char* body,
                                        std::uint32_t size, const unsigned char* ex,
                                        std::uint32_t exSize) {
    msg_t m;
    m.type = type;
    m.size = size;
    m.ex_size = exSize;
    unsigned char header[TKS_FRAME_HEADER_SIZE];
    tksEncodeFrameHeader(m, header);
    out.insert(out.end(), header, header + sizeof header);
    if (size) {
        out.insert(out.end(), body, body + size);
    }
    if (exSize) {
        out.insert(out.end(), ex, ex + exSize);
    }
    return sizeof header + size + exSize;
}

std::size_t RelayConnection::queueBlock(const TKMsg32Bit* block) {
    if (!tksFrameSizesValid(TKS_MSG_HEADER_BYTES, block->size)) {
        return 0;
    }
    unsigned char header[TKS_MSG_HEADER_BYTES];
    tksPackMsgHeader(block, header);
    return queueFrame(TKS_FRAME_MESSAGE, header, sizeof header,
                      reinterpret_cast<const unsigned char*>(block) + TK_MSG_HEADER_SIZE,
                      block->size);
}

bool RelayConnection::send(std::size_t& sent, std::string& why) {
    while (pending() > 0) {
        ssize_t n = ::send(fd, out.data() + outPos, pending(), MSG_NOSIGNAL);
        if (n < 0) {
            if (errno == EINTR) {
                continue;
            }
            if (errno == EAGAIN || errno == EWOULDBLOCK) {
                break;
            }
            why = std::strerror(errno);
            return false;
        }
        outPos += static_cast<std::size_t>(n);
        sent += static_cast<std::size_t>(n);
    }
    if (pending() == 0) {
        out.clear();
        outPos = 0;
    } else if (outPos > kOutputCompaction) {
        out.erase(out.begin(), out.begin() + static_cast<std::ptrdiff_t>(outPos));
        outPos = 0;
    }
    return true;
}

std::size_t RelayConnection::discardOutput() {
    const std::size_t dropped = pending();
    out.clear();
    outPos = 0;
    return dropped;
}

}  // namespace sim
