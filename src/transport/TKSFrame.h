// The relay socket protocol's frames, as bytes: encoders and decoders shared by the client
// transport and any server. A frame is a 20-byte big-endian header (type, tran, size, ex_size,
// one ignored word), `size` bytes of body and `ex_size` bytes of ex, without padding.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "platform/tkhost/tkhost.h"

// The framed unit in memory. body and ex come from malloc; free_msg releases them.
struct msg_t {
    std::uint32_t type = 0;
    std::uint32_t tran = 0;
    std::uint32_t size = 0;
    std::uint32_t ex_size = 0;
    unsigned char* body = nullptr;
    unsigned char* ex = nullptr;
};

enum : std::uint32_t {
    TKS_FRAME_MESSAGE = 1001,
    TKS_FRAME_ASSIGNED = 1002,
    TKS_FRAME_OPEN = 1003,
    TKS_FRAME_CLOSE = 2000,
    TKS_FRAME_CLOSE_ACK = 2001
};

constexpr std::size_t TKS_FRAME_HEADER_SIZE = 20;
constexpr std::uint32_t TKS_FRAME_MAX_PART = 102400;
constexpr std::uint32_t TKS_MSG_HEADER_WORDS = 14;
constexpr std::uint32_t TKS_MSG_HEADER_BYTES = 56;
constexpr std::uint32_t TKS_OPEN_BODY_BYTES = 28;
constexpr std::uint32_t TKS_ASSIGNED_BODY_BYTES = 20;
constexpr int TKS_DEFAULT_PORT = 6554;

// Swap n / 4 32-bit words between host and network order; dst and src may be the same.
void TKS_htonU32(void* dst, void* src, int n);
void TKS_ntohU32(void* dst, void* src, int n);

void free_msg(msg_t& m);

// True if both parts are within TKS_FRAME_MAX_PART.
bool tksFrameSizesValid(std::uint32_t size, std::uint32_t exSize);
// The 20 header bytes of a frame (the ignored word written as 0).
void tksEncodeFrameHeader(const msg_t& m, unsigned char out[TKS_FRAME_HEADER_SIZE]);
// Fills type, tran, size and ex_size; body and ex are left alone.
void tksDecodeFrameHeader(const unsigned char in[TKS_FRAME_HEADER_SIZE], msg_t& m);
// The whole frame as bytes; empty if a part is over the limit or a non-empty part lacks bytes.
std::vector<unsigned char> tksEncodeFrame(const msg_t& m);

// Where tksReadFrame gets its bytes: fill exactly n bytes or fail.
class TKSByteSource {
  public:
    virtual ~TKSByteSource() = default;
    // 0 when all n bytes were read; anything else is a failure (nothing usable was read).
    virtual int readExact(void* dst, std::size_t n) = 0;
};

enum TKSReadResult {
    TKS_READ_OK = 0,
    TKS_READ_FAILED = -1,    // the source failed: short read, closed peer, error
    TKS_READ_OVERSIZE = -2,  // a part over the limit; the frame was consumed and dropped
    TKS_READ_NO_MEMORY = -3
};
// Reads one frame into m (which must be empty); on success body and ex hold size + 1 and
// ex_size + 1 zeroed-then-filled bytes. On any failure m holds no buffers.
TKSReadResult tksReadFrame(TKSByteSource& src, msg_t& m);

// Message frame (1001): the 56-byte header of 14 words and the body bytes as they stand.
void tksPackMsgHeader(const TKMsg32Bit* block, unsigned char out[TKS_MSG_HEADER_BYTES]);
msg_t tksMakeMessageFrame(const TKMsg32Bit* block);  // body and ex point into a fresh copy
// The whole 1001 frame of a block into out (reusing its storage); false, and out empty, if the
// body is over the limit.
bool tksEncodeMessageFrame(const TKMsg32Bit* block, std::vector<unsigned char>& out);
// A new block from a received message frame, or null if the frame isn't a well-formed message
// (body not 56 bytes, word 13 not ex_size, or no memory).
TKMsg32Bit* tksBlockFromFrame(const msg_t& m);

// Open (1003): seven words; assigned address (1002): five words.
struct TKSOpenRequest {
    TKCompDesc addr{};
    std::uint32_t maxRetMsgSize = 0;
    std::uint32_t depth = 0;
};
void tksEncodeOpen(const TKSOpenRequest& req, unsigned char out[TKS_OPEN_BODY_BYTES]);
bool tksDecodeOpen(const msg_t& m, TKSOpenRequest& req);
void tksEncodeAssigned(TKCompDesc addr, unsigned char out[TKS_ASSIGNED_BODY_BYTES]);
bool tksDecodeAssigned(const msg_t& m, TKCompDesc& addr);
