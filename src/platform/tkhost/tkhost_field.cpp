// Body fields: packed, every multi-byte number big-endian, whatever the host's order.
#include <cstdarg>
#include <cstdint>
#include <cstring>

#include "catalogue/generated/wire.h"
#include "platform/tkhost/tkhost.h"

namespace {

namespace wire = tolk::wire;

void putElement(unsigned char* dst, const unsigned char* src, unsigned int width) {
    switch (width) {
        case 1:
            dst[0] = src[0];
            break;
        case 2: {
            std::uint16_t v;
            std::memcpy(&v, src, 2);
            dst[0] = std::uint8_t(v >> 8);
            dst[1] = std::uint8_t(v);
            break;
        }
        default: {
            std::uint32_t v;
            std::memcpy(&v, src, 4);
            dst[0] = std::uint8_t(v >> 24);
            dst[1] = std::uint8_t(v >> 16);
            dst[2] = std::uint8_t(v >> 8);
            dst[3] = std::uint8_t(v);
            break;
        }
    }
}

// Bytes at or behind `limit` read as zero.
void getElement(unsigned char* dst, const unsigned char* body, std::uint64_t at,
                std::uint64_t limit, unsigned int width) {
    unsigned char raw[4] = {0, 0, 0, 0};
    for (unsigned int i = 0; i < width; ++i) {
        if (at + i < limit) {
            raw[i] = body[at + i];
        }
    }
    switch (width) {
        case 1:
            dst[0] = raw[0];
            break;
        case 2: {
            std::uint16_t v = std::uint16_t((raw[0] << 8) | raw[1]);
            std::memcpy(dst, &v, 2);
            break;
        }
        default: {
            std::uint32_t v = (std::uint32_t(raw[0]) << 24) | (std::uint32_t(raw[1]) << 16) |
                              (std::uint32_t(raw[2]) << 8) | std::uint32_t(raw[3]);
            std::memcpy(dst, &v, 4);
            break;
        }
    }
}

}  // namespace

extern "C" {

TKStatus tkMsgVarFieldPut(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...) {
    if (msg == nullptr || offset == nullptr || fieldCount < 0) {
        return TK_ERR_PARAM;
    }
    va_list args;
    va_start(args, offset);
    va_list check;
    va_copy(check, args);
    // Refused as a whole: check every field against the body before writing any.
    std::uint64_t at = *offset;
    bool fits = true;
    for (int i = 0; i < fieldCount; ++i) {
        unsigned int desc = va_arg(check, unsigned int);
        void* ptr = va_arg(check, void*);
        at += std::uint64_t(wire::width(wire::typeOf(desc))) * wire::countOf(desc);
        if (ptr == nullptr || at > msg->size) {
            fits = false;
            break;
        }
    }
    va_end(check);
    if (!fits) {
        va_end(args);
        return TK_ERR_RANGE;
    }
    at = *offset;
    unsigned char* body = tkMsgBody(msg);
    for (int i = 0; i < fieldCount; ++i) {
        unsigned int desc = va_arg(args, unsigned int);
        auto* src = static_cast<const unsigned char*>(va_arg(args, void*));
        unsigned int width = wire::width(wire::typeOf(desc));
        unsigned int count = wire::countOf(desc);
        for (unsigned int k = 0; k < count; ++k) {
            putElement(body + at, src + std::size_t(k) * width, width);
            at += width;
        }
    }
    va_end(args);
    if (*offset != 0) {
        *offset = static_cast<unsigned int>(at);
    }
    return TK_OK;
}

TKStatus tkMsgVarFieldGet(TKMsg32Bit* msg, int fieldCount, unsigned int* offset, ...) {
    if (msg == nullptr || offset == nullptr || fieldCount < 0) {
        return TK_ERR_PARAM;
    }
    va_list args;
    va_start(args, offset);
    std::uint64_t at = *offset;
    const unsigned char* body = tkMsgBody(msg);
    TKStatus status = TK_OK;
    for (int i = 0; i < fieldCount; ++i) {
        unsigned int desc = va_arg(args, unsigned int);
        auto* dst = static_cast<unsigned char*>(va_arg(args, void*));
        unsigned int width = wire::width(wire::typeOf(desc));
        unsigned int count = wire::countOf(desc);
        if (dst == nullptr) {
            status = TK_ERR_PARAM;
            at += std::uint64_t(width) * count;
            continue;
        }
        for (unsigned int k = 0; k < count; ++k) {
            getElement(dst + std::size_t(k) * width, body, at, msg->size, width);
            at += width;
        }
    }
    va_end(args);
    if (*offset != 0) {
        *offset = static_cast<unsigned int>(at);
    }
    return status;
}

}  // extern "C"
