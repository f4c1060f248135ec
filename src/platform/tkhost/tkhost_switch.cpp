// The in-process switch behind the local queues: queue handles, host addresses, delivery to a
// bound queue or to the attached board endpoint.
#include <condition_variable>
#include <cstdlib>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <shared_mutex>

#include "platform/tkhost/tkhost.h"
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

TKCompDesc targetOf(TKMsg32Bit* msg) {
    TKCompDesc d{};
    (void)tkMsgFieldGet(msg, TK_FIELD_TGT, &d);
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

}  // namespace

extern "C" {

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
