// Round trips through the transport against the floor of a raw loopback TCP ping-pong.
#include <arpa/inet.h>
#include <benchmark/benchmark.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <thread>

#include "platform/tkhost/tkhost.h"
#include "transport/TKSFrame.h"
#include "transport/TKSMsgQueue.h"
#include "transport/TKSSock.h"

namespace {

constexpr unsigned int kCommand = 0x1214;
constexpr unsigned int kCompletion = 0x1215;

bool readAll(int fd, void* p, std::size_t n) {
    auto* c = static_cast<char*>(p);
    while (n > 0) {
        ssize_t r = ::recv(fd, c, n, 0);
        if (r <= 0) {
            return false;
        }
        c += r;
        n -= static_cast<std::size_t>(r);
    }
    return true;
}

bool writeAll(int fd, const void* p, std::size_t n) {
    auto* c = static_cast<const char*>(p);
    while (n > 0) {
        ssize_t r = ::send(fd, c, n, MSG_NOSIGNAL);
        if (r <= 0) {
            return false;
        }
        c += r;
        n -= static_cast<std::size_t>(r);
    }
    return true;
}

void noDelay(int fd) {
    int one = 1;
    setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
}

void BM_TcpPingPong(benchmark::State& state) {
    int listener = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in addr{};
    addr.sin_family = AF_INET;
    addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    ::bind(listener, reinterpret_cast<sockaddr*>(&addr), sizeof addr);
    socklen_t len = sizeof addr;
    getsockname(listener, reinterpret_cast<sockaddr*>(&addr), &len);
    ::listen(listener, 1);
    int client = ::socket(AF_INET, SOCK_STREAM, 0);
    ::connect(client, reinterpret_cast<sockaddr*>(&addr), sizeof addr);
    int server = ::accept(listener, nullptr, nullptr);
    noDelay(client);
    noDelay(server);
    std::thread echo([server] {
        char buf[64];
        while (readAll(server, buf, sizeof buf) && writeAll(server, buf, sizeof buf)) {
        }
    });
    char buf[64] = {1};
    for (auto _ : state) {
        writeAll(client, buf, sizeof buf);
        readAll(client, buf, sizeof buf);
    }
    ::shutdown(client, SHUT_RDWR);
    echo.join();
    ::close(client);
    ::close(server);
    ::close(listener);
}
BENCHMARK(BM_TcpPingPong)->UseRealTime();

void roundTrips(benchmark::State& state, TKSMsgQueue& q, TKCompDesc target) {
    unsigned int trans = 10000;
    for (auto _ : state) {
        TKSMsgRef req(16u);
        req.setMsgType(kCommand);
        req.setTrans(++trans);
        req.setTgtAddr(target);
        TKSMsgRef reply = q.request(req, 5000, kCompletion, 0);
        if (reply.getMsgRef() == nullptr) {
            state.SkipWithError("request timed out");
            break;
        }
        reply.free();
    }
}

void BM_MsgQueueRoundTrip_Local(benchmark::State& state) {
    unsetenv("REMOTE_TKHOST");
    TKSMsgQueue q(TKCompDesc{}, 512, 5, nullptr);
    TKQueueHandle peer = tkQueueOpen();
    TKCompDesc peerAddr{};
    tkQueueBind(peer, &peerAddr);
    std::thread responder([peer, peerAddr] {
        for (;;) {
            TKMsg32Bit* m = nullptr;
            if (tkMsgRead(peer, 0, &m) != TK_OK) {
                return;
            }
            TKCompDesc from{};
            tkMsgFieldGet(m, TK_FIELD_SRC, &from);
            tkMsgFieldPut(m, TK_FIELD_TGT, &from);
            TKCompDesc self = peerAddr;
            tkMsgFieldPut(m, TK_FIELD_SRC, &self);
            m->type = kCompletion;
            tkMsgWrite(peer, m, 0);
        }
    });
    roundTrips(state, q, peerAddr);
    tkQueueUnbind(peer, peerAddr);
    responder.join();
    tkQueueClose(peer);
}
BENCHMARK(BM_MsgQueueRoundTrip_Local)->UseRealTime();

void BM_MsgQueueRoundTrip_Relay(benchmark::State& state) {
    sock listener(inet_addr("127.0.0.1"), 0);
    listener.bind();
    listener.listen(1);
    std::string where = "127.0.0.1:" + std::to_string(listener.localPort());
    std::thread relay([&listener] {
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
            TKCompDesc from{}, to{};
            tkMsgFieldGet(b, TK_FIELD_SRC, &from);
            tkMsgFieldGet(b, TK_FIELD_TGT, &to);
            tkMsgFieldPut(b, TK_FIELD_SRC, &to);
            tkMsgFieldPut(b, TK_FIELD_TGT, &from);
            b->type = kCompletion;
            tksEncodeMessageFrame(b, out);
            tkMsgFree(b);
            conn->writeblock(out.data(), static_cast<long>(out.size()));
        }
    });
    {
        TKSMsgQueue q(TKCompDesc{}, 512, 5, where.c_str());
        TKCompDesc target{};
        target.board = 1;
        target.processor = 1;
        target.instance = 5;
        roundTrips(state, q, target);
    }
    relay.join();
}
BENCHMARK(BM_MsgQueueRoundTrip_Relay)->UseRealTime();

}  // namespace
