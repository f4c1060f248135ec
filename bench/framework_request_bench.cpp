// One Addressable::request with completion, answered by a responder thread in process and by a
// minimal relay on loopback that speaks the frame protocol.

#include <arpa/inet.h>
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <thread>

#include "EchoPeers.h"
#include "framework/Addressable.h"
#include "framework/CompAttr_t.h"
#include "platform/tkhost/tkhost.h"
#include "transport/TKSSock.h"

namespace {

constexpr unsigned int kCommand = 0x08;
constexpr unsigned int kCompletion = 0x09;

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
    std::thread responder([q] { lp_bench::serveEchoQueue(q, kCompletion); });
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

void BM_RequestRoundTrip_Relay(benchmark::State& state) {
    sock listener(inet_addr("127.0.0.1"), 0);
    listener.bind();
    listener.listen(1);
    std::string where = "127.0.0.1:" + std::to_string(listener.localPort());
    std::thread relay([&listener] { lp_bench::serveEchoRelay(listener, kCompletion); });
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
