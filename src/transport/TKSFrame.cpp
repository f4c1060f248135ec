#include "transport/TKSFrame.h"

#include <cstdlib>
#include <cstring>

namespace {

void putU32(unsigned char* p, std::uint32_t v) {
    p[0] = std::uint8_t(v >> 24);
    p[1] = std::uint8_t(v >> 16);
    p[2] = std::uint8_t(v >> 8);
    p[3] = std::uint8_t(v);
}

std::uint32_t getU32(const unsigned char* p) {
    return (std::uint32_t(p[0]) << 24) | (std::uint32_t(p[1]) << 16) | (std::uint32_t(p[2]) << 8) |
           std::uint32_t(p[3]);
}

void swapWords(void* dst, void* src, int n) {
    auto* d = static_cast<unsigned char*>(dst);
    auto* s = static_cast<unsigned char*>(src);
    for (int i = 0; i + 4 <= n; i += 4) {
        std::uint32_t v;
        std::memcpy(&v, s + i, 4);
        putU32(d + i, v);
    }
}

}  // namespace

void TKS_htonU32(void* dst, void* src, int n) {
    swapWords(dst, src, n);
}

void TKS_ntohU32(void* dst, void* src, int n) {
    auto* d = static_cast<unsigned char*>(dst);
    auto* s = static_cast<unsigned char*>(src);
    for (int i = 0; i + 4 <= n; i += 4) {
        std::uint32_t v = getU32(s + i);
        std::memcpy(d + i, &v, 4);
    }
}

void free_msg(msg_t& m) {
    std::free(m.body);
    std::free(m.ex);
    m.body = nullptr;
    m.ex = nullptr;
}

bool tksFrameSizesValid(std::uint32_t size, std::uint32_t exSize) {
    return size <= TKS_FRAME_MAX_PART && exSize <= TKS_FRAME_MAX_PART;
}

void tksEncodeFrameHeader(const msg_t& m, unsigned char out[TKS_FRAME_HEADER_SIZE]) {
    putU32(out, m.type);
    putU32(out + 4, m.tran);
    putU32(out + 8, m.size);
    putU32(out + 12, m.ex_size);
    putU32(out + 16, 0);
}

void tksDecodeFrameHeader(const unsigned char in[TKS_FRAME_HEADER_SIZE], msg_t& m) {
    m.type = getU32(in);
    m.tran = getU32(in + 4);
    m.size = getU32(in + 8);
    m.ex_size = getU32(in + 12);
}

std::vector<unsigned char> tksEncodeFrame(const msg_t& m) {
    if (!tksFrameSizesValid(m.size, m.ex_size) || (m.size != 0 && m.body == nullptr) ||
        (m.ex_size != 0 && m.ex == nullptr)) {
        return {};
    }
    std::vector<unsigned char> out(TKS_FRAME_HEADER_SIZE + m.size + m.ex_size);
    tksEncodeFrameHeader(m, out.data());
    if (m.size != 0) {
        std::memcpy(out.data() + TKS_FRAME_HEADER_SIZE, m.body, m.size);
    }
    if (m.ex_size != 0) {
        std::memcpy(out.data() + TKS_FRAME_HEADER_SIZE + m.size, m.ex, m.ex_size);
    }
    return out;
}

TKSReadResult tksReadFrame(TKSByteSource& src, msg_t& m) {
    unsigned char header[TKS_FRAME_HEADER_SIZE];
    if (src.readExact(header, sizeof header) != 0) {
        return TKS_READ_FAILED;
    }
    tksDecodeFrameHeader(header, m);
    if (!tksFrameSizesValid(m.size, m.ex_size)) {
        // Read and dropped in pieces, never allocated, so that the stream stays in step.
        unsigned char sink[4096];
        std::uint64_t left = std::uint64_t(m.size) + m.ex_size;
        while (left > 0) {
            std::size_t n = left < sizeof sink ? std::size_t(left) : sizeof sink;
            if (src.readExact(sink, n) != 0) {
                return TKS_READ_FAILED;
            }
            left -= n;
        }
        return TKS_READ_OVERSIZE;
    }
    m.body = static_cast<unsigned char*>(std::calloc(std::size_t(m.size) + 1, 1));
    m.ex = static_cast<unsigned char*>(std::calloc(std::size_t(m.ex_size) + 1, 1));
    if (m.body == nullptr || m.ex == nullptr) {
        free_msg(m);
        return TKS_READ_NO_MEMORY;
    }
    if ((m.size != 0 && src.readExact(m.body, m.size) != 0) ||
        (m.ex_size != 0 && src.readExact(m.ex, m.ex_size) != 0)) {
        free_msg(m);
        return TKS_READ_FAILED;
    }
    return TKS_READ_OK;
}

void tksPackMsgHeader(const TKMsg32Bit* b, unsigned char out[TKS_MSG_HEADER_BYTES]) {
    const std::uint32_t words[TKS_MSG_HEADER_WORDS] = {
        b->transTag & 0xFFu, b->transTag >> 8, b->type,         b->srcNode,      b->srcBoard,
        b->srcProcessor,     b->tgtNode,       b->tgtBoard,     b->tgtProcessor, b->srcInstance,
        b->srcComponent,     b->tgtInstance,   b->tgtComponent, b->size};
    for (std::uint32_t i = 0; i < TKS_MSG_HEADER_WORDS; ++i) {
        putU32(out + 4 * i, words[i]);
    }
}

msg_t tksMakeMessageFrame(const TKMsg32Bit* block) {
    msg_t m;
    m.type = TKS_FRAME_MESSAGE;
    m.size = TKS_MSG_HEADER_BYTES;
    m.ex_size = block->size;
    m.body = static_cast<unsigned char*>(std::malloc(TKS_MSG_HEADER_BYTES));
    m.ex = static_cast<unsigned char*>(std::malloc(std::size_t(block->size) + 1));
    if (m.body == nullptr || m.ex == nullptr) {
        free_msg(m);
        m.size = 0;
        m.ex_size = 0;
        return m;
    }
    tksPackMsgHeader(block, m.body);
    std::memcpy(m.ex, reinterpret_cast<const unsigned char*>(block) + TK_MSG_HEADER_SIZE,
                block->size);
    return m;
}

bool tksEncodeMessageFrame(const TKMsg32Bit* block, std::vector<unsigned char>& out) {
    out.clear();
    if (block->size > TKS_FRAME_MAX_PART) {
        return false;
    }
    out.resize(TKS_FRAME_HEADER_SIZE + TKS_MSG_HEADER_BYTES + block->size);
    msg_t m;
    m.type = TKS_FRAME_MESSAGE;
    m.size = TKS_MSG_HEADER_BYTES;
    m.ex_size = block->size;
    tksEncodeFrameHeader(m, out.data());
    tksPackMsgHeader(block, out.data() + TKS_FRAME_HEADER_SIZE);
    if (block->size != 0) {
        std::memcpy(out.data() + TKS_FRAME_HEADER_SIZE + TKS_MSG_HEADER_BYTES,
                    reinterpret_cast<const unsigned char*>(block) + TK_MSG_HEADER_SIZE,
                    block->size);
    }
    return true;
}

TKMsg32Bit* tksBlockFromFrame(const msg_t& m) {
    if (m.type != TKS_FRAME_MESSAGE || m.size != TKS_MSG_HEADER_BYTES || m.body == nullptr ||
        (m.ex_size != 0 && m.ex == nullptr)) {
        return nullptr;
    }
    std::uint32_t w[TKS_MSG_HEADER_WORDS];
    for (std::uint32_t i = 0; i < TKS_MSG_HEADER_WORDS; ++i) {
        w[i] = getU32(m.body + 4 * i);
    }
    if (w[13] != m.ex_size) {
        return nullptr;
    }
    TKMsg32Bit* b = nullptr;
    tkMsgAllocate(m.ex_size, &b);
    if (b == nullptr) {
        return nullptr;
    }
    b->transTag = (w[1] << 8) | (w[0] & 0xFFu);
    b->type = w[2];
    b->srcNode = std::uint8_t(w[3]);
    b->srcBoard = std::uint8_t(w[4]);
    b->srcProcessor = std::uint8_t(w[5]);
    b->tgtNode = std::uint8_t(w[6]);
    b->tgtBoard = std::uint8_t(w[7]);
    b->tgtProcessor = std::uint8_t(w[8]);
    b->srcInstance = std::uint16_t(w[9]);
    b->srcComponent = std::uint8_t(w[10]);
    b->tgtInstance = std::uint16_t(w[11]);
    b->tgtComponent = std::uint8_t(w[12]);
    if (m.ex_size != 0) {
        std::memcpy(tkMsgBody(b), m.ex, m.ex_size);
    }
    return b;
}

void tksEncodeOpen(const TKSOpenRequest& req, unsigned char out[TKS_OPEN_BODY_BYTES]) {
    putU32(out, req.addr.node);
    putU32(out + 4, req.addr.board);
    putU32(out + 8, req.addr.processor);
    putU32(out + 12, req.addr.component);
    putU32(out + 16, req.addr.instance);
    putU32(out + 20, req.maxRetMsgSize);
    putU32(out + 24, req.depth);
}

bool tksDecodeOpen(const msg_t& m, TKSOpenRequest& req) {
    if (m.type != TKS_FRAME_OPEN || m.size != TKS_OPEN_BODY_BYTES || m.body == nullptr) {
        return false;
    }
    req.addr = TKCompDesc{};
    req.addr.node = std::uint8_t(getU32(m.body));
    req.addr.board = std::uint8_t(getU32(m.body + 4));
    req.addr.processor = std::uint8_t(getU32(m.body + 8));
    req.addr.component = std::uint8_t(getU32(m.body + 12));
    req.addr.instance = std::uint16_t(getU32(m.body + 16));
    req.maxRetMsgSize = getU32(m.body + 20);
    req.depth = getU32(m.body + 24);
    return true;
}

void tksEncodeAssigned(TKCompDesc addr, unsigned char out[TKS_ASSIGNED_BODY_BYTES]) {
    putU32(out, addr.node);
    putU32(out + 4, addr.board);
    putU32(out + 8, addr.processor);
    putU32(out + 12, addr.component);
    putU32(out + 16, addr.instance);
}

bool tksDecodeAssigned(const msg_t& m, TKCompDesc& addr) {
    if (m.type != TKS_FRAME_ASSIGNED || m.size != TKS_ASSIGNED_BODY_BYTES || m.body == nullptr) {
        return false;
    }
    addr = TKCompDesc{};
    addr.node = std::uint8_t(getU32(m.body));
    addr.board = std::uint8_t(getU32(m.body + 4));
    addr.processor = std::uint8_t(getU32(m.body + 8));
    addr.component = std::uint8_t(getU32(m.body + 12));
    addr.instance = std::uint16_t(getU32(m.body + 16));
    return true;
}
