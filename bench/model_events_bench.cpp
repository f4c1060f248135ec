// Events per second from the built-in emulation through a publisher to an observer, and the
// start-up discovery of one board by the board manager.
#include <benchmark/benchmark.h>

// The board-facing model joins the build with the catalogue's operation classes.
#if __has_include("catalogue/tsc/TSC.h") && __has_include("catalogue/cluster/Cluster.h")

#include <atomic>
#include <chrono>
#include <string>
#include <thread>

#include "model/AllAlarms.h"
#include "model/BoardManager.h"
#include "model/VX7EventPublisher.h"
#include "sim/Builtin.h"

namespace {

class CountingObserver : public vx7diag::Observer {
  public:
    void Update(vx7diag::Subject*, vx7diag::Aspect&) override {
        seen.fetch_add(1, std::memory_order_relaxed);
    }
    std::atomic<long> seen{0};
};

void BM_Model_EventsToObserver(benchmark::State& state) {
    sim::startBuiltinEmulation();
    static vx7diag::AllAlarms alarms;
    vx7diag::VX7EventPublisher publisher(1, 1, 1);
    auto* counter = new CountingObserver;
    isa::RefPtr<vx7diag::Observer> observer(counter);
    if (!publisher.Attach(observer, &alarms)) {
        state.SkipWithError("subscription failed");
        return;
    }
    const long burst = state.range(0);
    long total = 0;
    for (auto _ : state) {
        total += burst;
        sim::builtinControl("bpv 1 1 " + std::to_string(burst));
        while (counter->seen.load(std::memory_order_relaxed) < total) {
            std::this_thread::yield();
        }
    }
    state.SetItemsProcessed(total);
    publisher.Detach(observer, alarms);
}
BENCHMARK(BM_Model_EventsToObserver)->Arg(1000)->UseRealTime()->Unit(benchmark::kMillisecond);

void BM_Model_BoardDiscovery(benchmark::State& state) {
    sim::startBuiltinEmulation();
    for (auto _ : state) {
        vx7diag::BoardManager manager(static_cast<unsigned int>(state.range(0)));
        benchmark::DoNotOptimize(manager.GetNumberOfTrunks());
    }
}
// Board 1: digital with two trunks; board 2: flexible routing with 23 voice groups.
BENCHMARK(BM_Model_BoardDiscovery)->Arg(1)->Arg(2)->UseRealTime()->Unit(benchmark::kMillisecond);

}  // namespace

#endif
