// vx7sim's server on loopback: request/reply pairs from concurrent clients, and events to one
// subscriber. The clients speak raw frames so that the figures are the server's.
#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include <sstream>
#include <thread>
#include <vector>

#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/values.h"
#include "framework/Msg.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "sim/RelayServer.h"
#include "transport/TKSFrame.h"
#include "transport/TKSMsgRef.h"

namespace {

struct Server {
    std::ostringstream log;
    std::unique_ptr<sim::RelayServer> server;
    std::thread loop;

    Server() {
        unsetenv("VX7_FARM");
        auto load = farm::activeFarm();
        sim::RelayOptions o;
        o.port = 0;
        o.bindAddress = "127.0.0.1";
        server = std::make_unique<sim::RelayServer>(load.farm, o, log);
        std::string error;
        server->listen(error);
        loop = std::thread([this] { server->run(-1, nullptr); });
    }
    ~Server() {
        server->stop();
        loop.join();
    }
};

class Client {
  public:
    explicit Client(int port) {
        fd = ::socket(AF_INET, SOCK_STREAM, 0);
        int one = 1;
        setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &one, sizeof one);
        sockaddr_in sa{};
        sa.sin_family = AF_INET;
        sa.sin_port = htons(static_cast<std::uint16_t>(port));
        sa.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        ::connect(fd, reinterpret_cast<sockaddr*>(&sa), sizeof sa);
        unsigned char body[TKS_OPEN_BODY_BYTES];
        tksEncodeOpen(TKSOpenRequest{}, body);
        msg_t m;
        m.type = TKS_FRAME_OPEN;
        m.size = sizeof body;
        m.body = body;
        sendAll(tksEncodeFrame(m));
        std::vector<unsigned char> f = readFrame();
        msg_t h;
        tksDecodeFrameHeader(f.data(), h);
        h.body = f.data() + TKS_FRAME_HEADER_SIZE;
        tksDecodeAssigned(h, addr);
    }
    ~Client() { ::close(fd); }

    // A message frame from this client to `target`.
    std::vector<unsigned char> frame(std::uint32_t type, tolk::MsgBody* body,
                                     const farm::Address& target, std::uint32_t trans) {
        tolk::Msg m(body ? body->GetByteSize() : 0);
        m.setMsgType(type);
        m.setTrans(trans);
        tolk::CompDesc_t src(addr);
        tolk::CompDesc_t tgt(target.instance, target.board, target.processor, target.component,
                             target.node);
        m.setSrcAddr(src);
        m.setTgtAddr(tgt);
        if (body) {
            (void)body->writeMsg(&m, 0);
        }
        msg_t f = tksMakeMessageFrame(m.getMsgRef());
        std::vector<unsigned char> bytes = tksEncodeFrame(f);
        free_msg(f);
        return bytes;
    }
    void sendAll(const std::vector<unsigned char>& b) {
        std::size_t done = 0;
        while (done < b.size()) {
            ssize_t n = ::send(fd, b.data() + done, b.size() - done, MSG_NOSIGNAL);
            if (n <= 0) {
                return;
            }
            done += static_cast<std::size_t>(n);
        }
    }
    bool readExact(unsigned char* p, std::size_t n) {
        std::size_t got = 0;
        while (got < n) {
            ssize_t r = ::recv(fd, p + got, n - got, 0);
            if (r <= 0) {
                return false;
            }
            got += static_cast<std::size_t>(r);
        }
        return true;
    }
    std::vector<unsigned char> readFrame() {
        std::vector<unsigned char> f(TKS_FRAME_HEADER_SIZE);
        if (!readExact(f.data(), f.size())) {
            return {};
        }
        msg_t h;
        tksDecodeFrameHeader(f.data(), h);
        f.resize(TKS_FRAME_HEADER_SIZE + h.size + h.ex_size);
        readExact(f.data() + TKS_FRAME_HEADER_SIZE, h.size + h.ex_size);
        return f;
    }

    int fd = -1;
    TKCompDesc addr{};
};

// Each of 4 threads is one client with one request outstanding at a time.
void BM_Sim_RequestReply(benchmark::State& state) {
    static Server* server = nullptr;
    static std::vector<std::unique_ptr<Client>> clients;
    if (state.thread_index() == 0) {
        server = new Server();
        clients.clear();
        for (int i = 0; i < state.threads(); ++i) {
            clients.push_back(std::make_unique<Client>(server->server->port()));
        }
    }
    // Google Benchmark starts every thread's loop together, after the set-up above.
    std::vector<unsigned char> req;
    Client* c = nullptr;
    for (auto _ : state) {
        if (!c) {
            c = clients[static_cast<std::size_t>(state.thread_index())].get();
            tolk::StdResource_Bodies::MsgGetParm_t q;
            q.Num = tolk::wire::LCON::Parm::TRUNK_TYPE;
            req = c->frame(tolk::StdResource_Bodies::MsgGetParm_t::MsgType, &q,
                           farm::lconAddress(1, 1), 100 + state.thread_index());
        }
        c->sendAll(req);
        benchmark::DoNotOptimize(c->readFrame());
    }
    state.SetItemsProcessed(state.iterations());
    if (state.thread_index() == 0) {
        // Every thread has left its loop by now: the loop's end is a barrier.
        clients.clear();
        delete server;
        server = nullptr;
    }
}
BENCHMARK(BM_Sim_RequestReply)->Threads(4)->UseRealTime()->MinTime(1.0);

void BM_Sim_EventsToOneSubscriber(benchmark::State& state) {
    Server server;
    Client c(server.server->port());
    tolk::StdResource_Bodies::MsgDetectEvt_t sub;
    sub.RetAddr = tolk::CompDesc_t(c.addr);
    sub.EvtType = tolk::LCON_Bodies::Evt_0x1600_t::EvtGroup_;
    sub.EvtGroup = 0;
    c.sendAll(c.frame(tolk::StdResource_Bodies::MsgDetectEvt_t::MsgType, &sub,
                      farm::lconAddress(1, 1), 7));
    c.readFrame();
    const std::int64_t n = state.range(0);
    for (auto _ : state) {
        server.server->control("bpv 1 1 " + std::to_string(n));
        for (std::int64_t i = 0; i < n; ++i) {
            benchmark::DoNotOptimize(c.readFrame());
        }
    }
    state.SetItemsProcessed(state.iterations() * n);
}
BENCHMARK(BM_Sim_EventsToOneSubscriber)->Arg(100000)->UseRealTime()->Unit(benchmark::kMillisecond);

}  // namespace
