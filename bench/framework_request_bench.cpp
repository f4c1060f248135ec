// One Addressable::request with completion, answered by a responder thread in process and by a
// minimal relay on loopback that speaks the frame protocol.

#include <arpa/inet.h>
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <thread>

#include "framework/Addressable.h"
#include "framework/CompAttr_t.h"
#include "platform/tkhost/tkhost.h"
#include "transport/TKSFrame.h"
#include "transport/TKSSock.h"

namespace {

constexpr unsigned int kCommand = 0x08;
constexpr unsigned int kCompletion = 0x09;

void turnAround(TKMsg32Bit* b) {
    TKCompDesc from{}, to{};
    tkMsgFieldGet(b, TK_FIELD_SRC, &from);
    tkMsgFieldGet(b, TK_FIELD_TGT, &to);
    tkMsgFieldPut(b, TK_FIELD_SRC, &to);
    tkMsgFieldPut(b, TK_FIELD_TGT, &from);
    b->type = kCompletion;
}

void requests(benchmark::State& state, tolk::Addressable& a) {
    tolk::CompAttr_t cmd(1, 2);
    tolk::CompAttr_t ret;
    for (auto _ : state) {
        a.request(kCommand, &cmd, kCompletion, &ret);
        benchmark::DoNotOptimize(ret.key);
    }
}

void BM_RequestRoundTrip_Local(benchmark::State& state) {
    TKQueueHandle q = tkQueueOpen();
    TKCompDesc addr{};
    tkQueueBind(q, &addr);
    std::thread responder([q] {
        TKMsg32Bit* in = nullptr;
        while (tkMsgRead(q, 0, &in) == 0) {
            turnAround(in);
            tkMsgWrite(q, in, 0);
        }
    });
    {
        isa::RefPtr<tolk::MsgQueue> none;
        tolk::Addressable a(tolk::CompDesc_t(addr), none);
        requests(state, a);
    }
    tkQueueUnbind(q, addr);
    tkQueueClose(q);
    responder.join();
}
BENCHMARK(BM_RequestRoundTrip_Local)->UseRealTime();

// Sets REMOTE_TKHOST (and clears HOST) for the queue made in this scope.
class RemoteHost {
  public:
    explicit RemoteHost(const std::string& where) {
        save("REMOTE_TKHOST", remote);
        save("HOST", host);
        setenv("REMOTE_TKHOST", where.c_str(), 1);
        unsetenv("HOST");
    }
    ~RemoteHost() {
        restore("REMOTE_TKHOST", remote);
        restore("HOST", host);
    }

  private:
    static void save(const char* name, std::unique_ptr<std::string>& slot) {
        if (const char* v = std::getenv(name)) {
            slot = std::make_unique<std::string>(v);
        }
    }
    static void restore(const char* name, const std::unique_ptr<std::string>& slot) {
        if (slot) {
            setenv(name, slot->c_str(), 1);
        } else {
            unsetenv(name);
        }
    }
    std::unique_ptr<std::string> remote, host;
};

void serveRelay(sock& listener) {
    std::unique_ptr<sock> conn(listener.accept());
    if (!conn) {
        return;
    }
    msg_t open;
    if (conn->get_msg(open) != 0) {
        return;
    }
    free_msg(open);
    TKCompDesc assigned{};
    assigned.board = 0xFE;
    assigned.instance = 1;
    unsigned char body[TKS_ASSIGNED_BODY_BYTES];
    tksEncodeAssigned(assigned, body);
    msg_t a;
    a.type = TKS_FRAME_ASSIGNED;
    a.size = TKS_ASSIGNED_BODY_BYTES;
    a.body = body;
    conn->snd_msg(a);
    std::vector<unsigned char> out;
    for (;;) {
        msg_t m;
        if (conn->get_msg(m) != 0) {
            return;
        }
        if (m.type == TKS_FRAME_CLOSE) {
            free_msg(m);
            msg_t ack;
            ack.type = TKS_FRAME_CLOSE_ACK;
            conn->snd_msg(ack);
            return;
        }
        TKMsg32Bit* b = tksBlockFromFrame(m);
        free_msg(m);
        if (b == nullptr) {
            continue;
        }
        turnAround(b);
        tksEncodeMessageFrame(b, out);
        tkMsgFree(b);
        conn->writeblock(out.data(), static_cast<long>(out.size()));
    }
}

void BM_RequestRoundTrip_Relay(benchmark::State& state) {
    sock listener(inet_addr("127.0.0.1"), 0);
    listener.bind();
    listener.listen(1);
    std::string where = "127.0.0.1:" + std::to_string(listener.localPort());
    std::thread relay([&listener] { serveRelay(listener); });
    {
        RemoteHost env(where);
        tolk::CompDesc_t target(5, 1, 1, 0, 0);
        tolk::Addressable a(target);
        requests(state, a);
    }
    relay.join();
}
BENCHMARK(BM_RequestRoundTrip_Relay)->UseRealTime();

}  // namespace
