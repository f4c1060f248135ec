#pragma once

// The boards behind the local switch, faked: every block written to a board address lands here,
// is recorded as sent, and the test's rule decides what the board answers (replies of some type,
// or nothing, the default). Replies come from a thread of their own, from the address the
// request went to (or another one), with the request's id.

#include <condition_variable>
#include <cstdint>
#include <cstring>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>
#include <utility>
#include <vector>

#include "framework/CompDesc_t.h"
#include "platform/tkhost/tkhost.h"
#include "platform/tkhost/tkhost_switch.h"

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

class FakeBoard {
  public:
    using Rule = std::function<std::vector<Answer>(const Sent&)>;

    explicit FakeBoard(Rule r = [](const Sent&) { return std::vector<Answer>{}; })
        : rule(std::move(r)) {
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

    // A block from a board to `to`, unasked for or in answer.
    static void send(const tolk::CompDesc_t& from, const tolk::CompDesc_t& to, unsigned int type,
                     unsigned int trans, const std::vector<std::uint8_t>& body) {
        TKMsg32Bit* out = nullptr;
        tkMsgAllocate(static_cast<unsigned int>(body.size()), &out);
        out->type = type;
        out->transTag = trans << 8;
        TKCompDesc src = from.getTKCompDesc(), tgt = to.getTKCompDesc();
        tkMsgFieldPut(out, TK_FIELD_SRC, &src);
        tkMsgFieldPut(out, TK_FIELD_TGT, &tgt);
        if (!body.empty()) {
            std::memcpy(tkMsgBody(out), body.data(), body.size());
        }
        tkSwitchDeliver(out);
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
                tolk::CompDesc_t from = s.tgt;
                from.instance =
                    static_cast<std::uint16_t>(from.instance + (a.fromElsewhere ? 0x100 : 0));
                send(from, s.src, a.type, s.trans, a.body);
            }
            lk.lock();
        }
    }

    Rule rule;
    mutable std::mutex m;
    mutable std::condition_variable cv;
    std::deque<Sent> pending;
    std::vector<Sent> log;
    bool stopping = false;
    std::thread worker;
};
