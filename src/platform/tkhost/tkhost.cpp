#include "platform/tkhost/tkhost.h"

#include <condition_variable>
#include <cstdarg>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <shared_mutex>

#include "platform/tkhost/tkhost_switch.h"

namespace {

struct Queue {
    std::mutex m;
    std::condition_variable cv;
    std::deque<TKMsg32Bit*> pending;
    bool bound = false;
    bool closed = false;
    TKCompDesc addr{};
};

std::uint64_t addrKey(const TKCompDesc& d) {
    return (std::uint64_t(d.instance) << 32) | (std::uint64_t(d.board) << 24) |
           (std::uint64_t(d.processor) << 16) | (std::uint64_t(d.component) << 8) |
           std::uint64_t(d.node);
}

struct Switch {
    std::mutex m;
    std::map<TKQueueHandle, std::shared_ptr<Queue>> queues;
    std::map<std::uint64_t, std::shared_ptr<Queue>> bound;
    TKQueueHandle nextHandle = 16;
    std::uint16_t nextInstance = 1;
    unsigned int queueLimit = 0;
    std::uint64_t undeliverable = 0;

    std::shared_mutex boardsLock;
    TKBoardEndpoint boards = nullptr;
    void* boardsCtx = nullptr;
};

Switch& sw() {
    static Switch* s = new Switch;  // lives past static destruction: reader threads may still run
    return *s;
}

std::shared_ptr<Queue> findQueue(TKQueueHandle h) {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    auto it = s.queues.find(h);
    return it == s.queues.end() ? nullptr : it->second;
}

TKCompDesc targetOf(const TKMsg32Bit* msg) {
    TKCompDesc d{};
    d.instance = msg->tgtInstance;
    d.board = msg->tgtBoard;
    d.processor = msg->tgtProcessor;
    d.component = msg->tgtComponent;
    d.node = msg->tgtNode;
    return d;
}

bool enqueue(const std::shared_ptr<Queue>& q, TKMsg32Bit* msg) {
    {
        std::lock_guard<std::mutex> lk(q->m);
        if (q->closed || !q->bound) {
            return false;
        }
        q->pending.push_back(msg);
    }
    q->cv.notify_one();
    return true;
}

// Delivers to the bound queue at the target; false if nobody is bound there.
bool deliverToHost(TKMsg32Bit* msg) {
    std::shared_ptr<Queue> q;
    {
        Switch& s = sw();
        std::lock_guard<std::mutex> lk(s.m);
        auto it = s.bound.find(addrKey(targetOf(msg)));
        if (it == s.bound.end()) {
            return false;
        }
        q = it->second;
    }
    return enqueue(q, msg);
}

void dropUndeliverable(TKMsg32Bit* msg) {
    std::free(msg);
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    ++s.undeliverable;
}

unsigned int elementWidth(unsigned int desc) {
    switch ((desc >> 19) & 0x1F) {
        case 0:
        case 4:
        case 10:
            return 1;
        case 1:
        case 5:
            return 2;
        default:
            return 4;
    }
}

unsigned int elementCount(unsigned int desc) {
    return ((desc >> 11) & 0xFF) + 1;
}

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

TKStatus tkDrvSetInterface(int, int) {
    return TK_OK;
}

TKQueueHandle tkQueueOpen(void) {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    if (s.queueLimit != 0 && s.queues.size() >= s.queueLimit) {
        return TK_ERR_NO_DESCRIPTORS;
    }
    TKQueueHandle h = s.nextHandle++;
    if (s.nextHandle < 16) {
        s.nextHandle = 16;
    }
    s.queues[h] = std::make_shared<Queue>();
    return h;
}

TKStatus tkQueueBind(TKQueueHandle queue, TKCompDesc* desc) {
    if (desc == nullptr) {
        return TK_ERR_PARAM;
    }
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    auto it = s.queues.find(queue);
    if (it == s.queues.end()) {
        return TK_ERR_BAD_QUEUE;
    }
    std::shared_ptr<Queue> q = it->second;
    std::lock_guard<std::mutex> qlk(q->m);
    if (q->bound) {
        return TK_ERR_ALREADY_BOUND;
    }
    // Instances are handed out round the clock, skipping those still bound.
    for (unsigned int tries = 0; tries < 0xFFFF; ++tries) {
        TKCompDesc d{};
        d.board = TK_HOST_BOARD;
        d.instance = s.nextInstance;
        s.nextInstance = s.nextInstance == 0xFFFF ? 1 : std::uint16_t(s.nextInstance + 1);
        if (s.bound.count(addrKey(d)) != 0) {
            continue;
        }
        s.bound[addrKey(d)] = q;
        q->bound = true;
        q->addr = d;
        *desc = d;
        return TK_OK;
    }
    return TK_ERR_NO_DESCRIPTORS;
}

TKStatus tkQueueUnbind(TKQueueHandle queue, TKCompDesc desc) {
    Switch& s = sw();
    std::shared_ptr<Queue> q;
    {
        std::lock_guard<std::mutex> lk(s.m);
        auto it = s.queues.find(queue);
        if (it == s.queues.end()) {
            return TK_ERR_BAD_QUEUE;
        }
        q = it->second;
        std::lock_guard<std::mutex> qlk(q->m);
        if (!q->bound || addrKey(q->addr) != addrKey(desc)) {
            return TK_ERR_PARAM;
        }
        s.bound.erase(addrKey(desc));
        q->bound = false;
    }
    q->cv.notify_all();
    return TK_OK;
}

TKStatus tkQueueClose(TKQueueHandle queue) {
    Switch& s = sw();
    std::shared_ptr<Queue> q;
    {
        std::lock_guard<std::mutex> lk(s.m);
        auto it = s.queues.find(queue);
        if (it == s.queues.end()) {
            return TK_ERR_BAD_QUEUE;
        }
        q = it->second;
        s.queues.erase(it);
        std::lock_guard<std::mutex> qlk(q->m);
        if (q->bound) {
            s.bound.erase(addrKey(q->addr));
            q->bound = false;
        }
        q->closed = true;
    }
    std::deque<TKMsg32Bit*> left;
    {
        std::lock_guard<std::mutex> qlk(q->m);
        left.swap(q->pending);
    }
    q->cv.notify_all();
    for (TKMsg32Bit* m : left) {
        std::free(m);
    }
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

TKStatus tkMsgRead(TKQueueHandle queue, int, TKMsg32Bit** msg) {
    if (msg == nullptr) {
        return TK_ERR_PARAM;
    }
    *msg = nullptr;
    std::shared_ptr<Queue> q = findQueue(queue);
    if (!q) {
        return TK_ERR_BAD_QUEUE;
    }
    std::unique_lock<std::mutex> lk(q->m);
    q->cv.wait(lk, [&] { return !q->pending.empty() || q->closed || !q->bound; });
    if (q->pending.empty()) {
        return TK_ERR_CLOSED;
    }
    *msg = q->pending.front();
    q->pending.pop_front();
    return TK_OK;
}

TKStatus tkMsgWrite(TKQueueHandle queue, TKMsg32Bit* msg, int) {
    if (msg == nullptr) {
        return TK_ERR_PARAM;
    }
    if (!findQueue(queue)) {
        return TK_ERR_BAD_QUEUE;
    }
    if (deliverToHost(msg)) {
        return TK_OK;
    }
    Switch& s = sw();
    {
        std::shared_lock<std::shared_mutex> blk(s.boardsLock);
        if (s.boards != nullptr) {
            s.boards(s.boardsCtx, msg);
            return TK_OK;
        }
    }
    dropUndeliverable(msg);
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
        at += std::uint64_t(elementWidth(desc)) * elementCount(desc);
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
        unsigned int width = elementWidth(desc);
        unsigned int count = elementCount(desc);
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
        unsigned int width = elementWidth(desc);
        unsigned int count = elementCount(desc);
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

void tkSwitchAttachBoards(TKBoardEndpoint fn, void* ctx) {
    Switch& s = sw();
    std::unique_lock<std::shared_mutex> lk(s.boardsLock);
    s.boards = fn;
    s.boardsCtx = ctx;
}

void tkSwitchDetachBoards() {
    tkSwitchAttachBoards(nullptr, nullptr);
}

TKStatus tkSwitchDeliver(TKMsg32Bit* msg) {
    if (msg == nullptr) {
        return TK_ERR_PARAM;
    }
    if (deliverToHost(msg)) {
        return TK_OK;
    }
    dropUndeliverable(msg);
    return TK_ERR_CLOSED;
}

bool tkSwitchIsHostAddress(TKCompDesc desc) {
    return desc.board == TK_HOST_BOARD;
}

bool tkSwitchIsBound(TKCompDesc desc) {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    return s.bound.count(addrKey(desc)) != 0;
}

std::uint64_t tkSwitchUndeliverableCount() {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    return s.undeliverable;
}

void tkSwitchResetUndeliverableCount() {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    s.undeliverable = 0;
}

void tkSwitchSetQueueLimit(unsigned int n) {
    Switch& s = sw();
    std::lock_guard<std::mutex> lk(s.m);
    s.queueLimit = n;
}
