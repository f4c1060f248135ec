#pragma once

// A component stand-in on the local transport: its own bound queue and thread, answering each
// request as the test's rule says (a reply of some type, nothing, or extra messages first).

#include <atomic>
#include <cstring>
#include <functional>
#include <thread>
#include <vector>

#include "framework/CompDesc_t.h"
#include "platform/tkhost/tkhost.h"

struct Outgoing {
    unsigned int type;
    std::vector<unsigned char> body;
    int transDelta = 0;  // added to the request's transaction id
};

class Responder {
  public:
    using Rule = std::function<std::vector<Outgoing>(TKMsg32Bit* request)>;

    explicit Responder(Rule r) : rule(std::move(r)) {
        queue = tkQueueOpen();
        tkQueueBind(queue, &addr);
        thread = std::thread([this] { run(); });
    }
    ~Responder() {
        tkQueueUnbind(queue, addr);
        tkQueueClose(queue);
        thread.join();
    }

    tolk::CompDesc_t address() const { return tolk::CompDesc_t(addr); }
    unsigned int received() const { return count.load(); }

    // Sends an unsolicited message from this responder to `to`.
    void send(TKCompDesc to, unsigned int type, unsigned int trans,
              const std::vector<unsigned char>& body) {
        TKMsg32Bit* m = nullptr;
        tkMsgAllocate(static_cast<unsigned int>(body.size()), &m);
        m->type = type;
        m->transTag = trans << 8;
        setAddr(m, addr, to);
        if (!body.empty()) {
            std::memcpy(tkMsgBody(m), body.data(), body.size());
        }
        tkMsgWrite(queue, m, 0);
    }

  private:
    static void setAddr(TKMsg32Bit* m, TKCompDesc src, TKCompDesc tgt) {
        tkMsgFieldPut(m, TK_FIELD_SRC, &src);
        tkMsgFieldPut(m, TK_FIELD_TGT, &tgt);
    }

    void run() {
        for (;;) {
            TKMsg32Bit* in = nullptr;
            if (tkMsgRead(queue, 0, &in) != 0) {
                return;
            }
            ++count;
            TKCompDesc from{};
            tkMsgFieldGet(in, TK_FIELD_SRC, &from);
            unsigned int trans = in->transTag >> 8;
            for (const Outgoing& o : rule(in)) {
                send(from, o.type, trans + o.transDelta, o.body);
            }
            tkMsgFree(in);
        }
    }

    Rule rule;
    TKQueueHandle queue;
    TKCompDesc addr{};
    std::thread thread;
    std::atomic<unsigned int> count{0};
};
