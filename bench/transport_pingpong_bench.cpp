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

#include "EchoPeers.h"
#include "catalogue/generated/values.h"
#include "platform/tkhost/tkhost.h"
#include "transport/TKSMsgQueue.h"
#include "transport/TKSSock.h"

namespace {

constexpr unsigned int kCommand = tolk::wire::TSC::MsgType::MsgMakeCall_t;
constexpr unsigned int kCompletion = tolk::wire::TSC::MsgType::MsgMakeCallCmplt_t;

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
    std::thread responder([peer] { lp_bench::serveEchoQueue(peer, kCompletion); });
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
    std::thread relay([&listener] { lp_bench::serveEchoRelay(listener, kCompletion); });
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
