// Message blocks: allocation with room for a whole copy, and the header fields.
#include <cstdlib>
#include <cstring>

#include "platform/tkhost/tkhost.h"

namespace {

TKCompDesc targetOf(const TKMsg32Bit* msg) {
    TKCompDesc d{};
    d.instance = msg->tgtInstance;
    d.board = msg->tgtBoard;
    d.processor = msg->tgtProcessor;
    d.component = msg->tgtComponent;
    d.node = msg->tgtNode;
    return d;
}

}  // namespace

extern "C" {

TKStatus tkDrvSetInterface(int, int) {
    return TK_OK;
}

TKStatus tkMsgAllocate(unsigned int size, TKMsg32Bit** msg) {
    if (msg == nullptr) {
        return TK_ERR_PARAM;
    }
    *msg = nullptr;
    if (size > TK_MSG_MAX_BODY) {
        return TK_ERR_NO_MEMORY;
    }
    auto* block = static_cast<TKMsg32Bit*>(std::calloc(1, std::size_t(size) + TK_MSG_COPY_EXTRA));
    if (block == nullptr) {
        return TK_ERR_NO_MEMORY;
    }
    block->size = size;
    *msg = block;
    return TK_OK;
}

TKStatus tkMsgReallocate(unsigned int size, TKMsg32Bit** msg) {
    if (msg == nullptr || *msg == nullptr) {
        return TK_ERR_PARAM;
    }
    if (size > TK_MSG_MAX_BODY) {
        return TK_ERR_NO_MEMORY;
    }
    std::size_t oldRoom = std::size_t((*msg)->size) + TK_MSG_COPY_EXTRA;
    std::size_t newRoom = std::size_t(size) + TK_MSG_COPY_EXTRA;
    auto* block = static_cast<TKMsg32Bit*>(std::realloc(*msg, newRoom));
    if (block == nullptr) {
        return TK_ERR_NO_MEMORY;
    }
    if (newRoom > oldRoom) {
        std::memset(reinterpret_cast<unsigned char*>(block) + oldRoom, 0, newRoom - oldRoom);
    }
    // Body bytes that were cut off must not reappear when the block grows again.
    if (size < block->size) {
        std::memset(tkMsgBody(block) + size, 0, newRoom - TK_MSG_HEADER_SIZE - size);
    }
    block->size = size;
    *msg = block;
    return TK_OK;
}

TKStatus tkMsgFree(TKMsg32Bit* msg) {
    std::free(msg);
    return TK_OK;
}

TKStatus tkMsgFieldGet(TKMsg32Bit* msg, TKMsgField field, void* value) {
    if (msg == nullptr || value == nullptr) {
        return TK_ERR_PARAM;
    }
    switch (field) {
        case TK_FIELD_TRANS: {
            unsigned int v = msg->transTag >> 8;
            std::memcpy(value, &v, sizeof v);
            return TK_OK;
        }
        case TK_FIELD_TAG: {
            unsigned char v = static_cast<unsigned char>(msg->transTag & 0xFF);
            std::memcpy(value, &v, sizeof v);
            return TK_OK;
        }
        case TK_FIELD_TYPE:
            std::memcpy(value, &msg->type, sizeof msg->type);
            return TK_OK;
        case TK_FIELD_SRC: {
            TKCompDesc d{};
            d.instance = msg->srcInstance;
            d.board = msg->srcBoard;
            d.processor = msg->srcProcessor;
            d.component = msg->srcComponent;
            d.node = msg->srcNode;
            std::memcpy(value, &d, sizeof d);
            return TK_OK;
        }
        case TK_FIELD_TGT: {
            TKCompDesc d = targetOf(msg);
            std::memcpy(value, &d, sizeof d);
            return TK_OK;
        }
        case TK_FIELD_SIZE:
            std::memcpy(value, &msg->size, sizeof msg->size);
            return TK_OK;
    }
    return TK_ERR_PARAM;
}

TKStatus tkMsgFieldPut(TKMsg32Bit* msg, TKMsgField field, void* value) {
    if (msg == nullptr || value == nullptr) {
        return TK_ERR_PARAM;
    }
    switch (field) {
        case TK_FIELD_TRANS: {
            unsigned int v;
            std::memcpy(&v, value, sizeof v);
            msg->transTag = (v << 8) | (msg->transTag & 0xFF);
            return TK_OK;
        }
        case TK_FIELD_TAG: {
            unsigned char v;
            std::memcpy(&v, value, sizeof v);
            msg->transTag = (msg->transTag & ~0xFFu) | v;
            return TK_OK;
        }
        case TK_FIELD_TYPE:
            std::memcpy(&msg->type, value, sizeof msg->type);
            return TK_OK;
        case TK_FIELD_SRC: {
            TKCompDesc d;
            std::memcpy(&d, value, sizeof d);
            msg->srcInstance = d.instance;
            msg->srcBoard = d.board;
            msg->srcProcessor = d.processor;
            msg->srcComponent = d.component;
            msg->srcNode = d.node;
            return TK_OK;
        }
        case TK_FIELD_TGT: {
            TKCompDesc d;
            std::memcpy(&d, value, sizeof d);
            msg->tgtInstance = d.instance;
            msg->tgtBoard = d.board;
            msg->tgtProcessor = d.processor;
            msg->tgtComponent = d.component;
            msg->tgtNode = d.node;
            return TK_OK;
        }
        case TK_FIELD_SIZE:
            return TK_ERR_PARAM;  // the size changes only through tkMsgReallocate
    }
    return TK_ERR_PARAM;
}

}  // extern "C"
