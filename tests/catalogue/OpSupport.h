#pragma once

// Shared by the operation tests: a fake board behind the local switch, short waits, a private
// queue, the board's fixed addresses and big-endian builders of golden bodies.
//
// Every block written to a board address lands here: it is recorded as sent, and the test's
// rule decides what the board answers (a reply of some type, or nothing). Replies come from a
// thread of their own, from the address the request went to, with the request's id.

#include <gtest/gtest.h>

#include <condition_variable>
#include <cstdint>
#include <cstring>
#include <deque>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include "catalogue/stdresource/StdResource.h"
#include "framework/CompDesc_t.h"
#include "framework/MsgQueue.h"
#include "framework/String.h"
#include "platform/tkhost/tkhost.h"
#include "platform/tkhost/tkhost_switch.h"
#include "transport/IsaSync.h"

struct Sent {
    unsigned int type = 0;
    unsigned int trans = 0;
    tolk::CompDesc_t src;
    tolk::CompDesc_t tgt;
    std::vector<std::uint8_t> body;
};

struct Answer {
    unsigned int type;
    std::vector<std::uint8_t> body;
    bool fromElsewhere = false;  // sent from an address other than the request's target
};

// What the services and components of a board answer: the shared completions of the
// services, nothing to a one-way command, else the command's number + 1.
inline std::vector<Answer> boardAnswer(const Sent& s, std::vector<std::uint8_t> body = {}) {
    static const std::map<unsigned int, unsigned int> kShared = {
        {0x800059, 0x800000}, {0x80005A, 0x800000}, {0x80001B, 0x800000}, {0x800023, 0x800000},
        {0x800030, 0x800000}, {0x800036, 0x800000}, {0x800054, 0x800000}, {0x800055, 0x800000},
        {0x800056, 0x800000}, {0x80003D, 0x800007}, {0x80003E, 0x800007}, {0x80001E, 0x800007},
        {0x800053, 0x80002C}, {0x80001D, 0x80002C}, {0x800020, 0x80002C}, {0x800032, 0x800033},
        {0x80003A, 0x800006}, {0x800027, 0x800028}};
    static const std::set<unsigned int> kOneWay = {
        0x00,   0x01,   0x06,     0x1200,   0x1201,   0x1202,   0x1203,  0x1204, 0x1207,
        0x120A, 0x1211, 0x121A,   0x121B,   0x121C,   0x121D,   0x121E,  0x122D, 0x1612,
        0x1613, 0x140D, 0x800041, 0x80001F, 0x800025, 0x800024, 0x800052};
    if (kOneWay.count(s.type) != 0) {
        return {};
    }
    auto shared = kShared.find(s.type);
    return {{shared != kShared.end() ? shared->second : s.type + 1, std::move(body)}};
}

class FakeBoard {
  public:
    using Rule = std::function<std::vector<Answer>(const Sent&)>;

    FakeBoard() : FakeBoard([](const Sent& s) { return boardAnswer(s); }) {}
    explicit FakeBoard(Rule r) : rule(std::move(r)) {
        worker = std::thread([this] { run(); });
        tkSwitchAttachBoards(&FakeBoard::endpoint, this);
    }
    ~FakeBoard() {
        tkSwitchDetachBoards();
        {
            std::lock_guard<std::mutex> lk(m);
            stopping = true;
        }
        cv.notify_all();
        worker.join();
    }
    FakeBoard(const FakeBoard&) = delete;
    FakeBoard& operator=(const FakeBoard&) = delete;

    std::vector<Sent> sent() const {
        std::lock_guard<std::mutex> lk(m);
        return log;
    }
    void clear() {
        std::lock_guard<std::mutex> lk(m);
        log.clear();
    }

  private:
    static void endpoint(void* ctx, TKMsg32Bit* msg) {
        auto* self = static_cast<FakeBoard*>(ctx);
        Sent s;
        s.type = msg->type;
        s.trans = msg->transTag >> 8;
        TKCompDesc d{};
        tkMsgFieldGet(msg, TK_FIELD_SRC, &d);
        s.src = tolk::CompDesc_t(d);
        tkMsgFieldGet(msg, TK_FIELD_TGT, &d);
        s.tgt = tolk::CompDesc_t(d);
        const auto* b = reinterpret_cast<const std::uint8_t*>(tkMsgBody(msg));
        s.body.assign(b, b + msg->size);
        tkMsgFree(msg);
        {
            std::lock_guard<std::mutex> lk(self->m);
            self->log.push_back(s);
            self->pending.push_back(s);
        }
        self->cv.notify_all();
    }

    void run() {
        std::unique_lock<std::mutex> lk(m);
        for (;;) {
            cv.wait(lk, [this] { return stopping || !pending.empty(); });
            if (pending.empty()) {
                return;
            }
            Sent s = pending.front();
            pending.pop_front();
            lk.unlock();
            for (const Answer& a : rule(s)) {
                reply(s, a);
            }
            lk.lock();
        }
    }

    static void reply(const Sent& s, const Answer& a) {
        TKMsg32Bit* out = nullptr;
        tkMsgAllocate(static_cast<unsigned int>(a.body.size()), &out);
        out->type = a.type;
        out->transTag = s.trans << 8;
        TKCompDesc from = s.tgt.getTKCompDesc();
        if (a.fromElsewhere) {
            from.instance = static_cast<std::uint16_t>(from.instance + 0x100);
        }
        TKCompDesc to = s.src.getTKCompDesc();
        tkMsgFieldPut(out, TK_FIELD_SRC, &from);
        tkMsgFieldPut(out, TK_FIELD_TGT, &to);
        if (!a.body.empty()) {
            std::memcpy(tkMsgBody(out), a.body.data(), a.body.size());
        }
        tkSwitchDeliver(out);
    }

    Rule rule;
    mutable std::mutex m;
    mutable std::condition_variable cv;
    std::deque<Sent> pending;
    std::vector<Sent> log;
    bool stopping = false;
    std::thread worker;
};

using Bytes = std::vector<std::uint8_t>;

// A component class with its waits cut short, so that silence costs little.
template <class T>
class Quick : public T {
  public:
    template <class... A>
    explicit Quick(A&&... a) : T(std::forward<A>(a)...) {
        this->ResponseTimeout = 300;
        this->ErrorWaitTime = 100;
    }
    // As the most derived class, it ends the delivery of stray messages before its own part
    // goes, as every class of the resource family does.
    ~Quick() override {
        if constexpr (std::is_base_of_v<tolk::StdResource, T>) {
            this->endDispatch();
        }
    }
};

inline isa::RefPtr<tolk::MsgQueue> newQueue() {
    return isa::RefPtr<tolk::MsgQueue>(
        new tolk::MsgQueue(tolk::CompDesc_t(1, 1, 1, 1, 1), 1024, 5));
}

// A channel component on board 2, node 0; its services stand at fixed instances there.
inline const tolk::CompDesc_t kTarget(3, 2, 1, 18, 0);
inline const tolk::CompDesc_t kResourceMgr(5, 2, 1, 0, 0);
inline const tolk::CompDesc_t kClusterMgr(8, 2, 1, 0, 0);

inline std::string textOf(const tolk::virtualObject& o) {
    std::ostringstream os;
    o.toStream(&os);
    return os.str();
}

inline Bytes concat(std::initializer_list<Bytes> parts) {
    Bytes out;
    for (const Bytes& p : parts) {
        out.insert(out.end(), p.begin(), p.end());
    }
    return out;
}

// Big-endian, as on the wire.
inline Bytes u32(unsigned int v) {
    return {static_cast<std::uint8_t>(v >> 24), static_cast<std::uint8_t>(v >> 16),
            static_cast<std::uint8_t>(v >> 8), static_cast<std::uint8_t>(v)};
}

inline Bytes desc(const tolk::CompDesc_t& d) {
    return {static_cast<std::uint8_t>(d.instance >> 8),
            static_cast<std::uint8_t>(d.instance),
            d.board,
            d.processor,
            d.component,
            d.node};
}
