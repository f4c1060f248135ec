// Writing and reading a body of 20 scalars and a list of 300 bytes, counting heap allocations.

#include <benchmark/benchmark.h>

#include "AllocCounter.h"
#include "catalogue/generated/wire.h"
#include "framework/Marshal.h"
#include "framework/Msg.h"

namespace {

class Scalars20 : public tolk::MsgBody {
  public:
    unsigned int writeMsg(tolk::Msg* m, unsigned int off) override {
        off = tolk::putFirst(m, off, tolk::wire::pack(tolk::wire::U32), &w[0]);
        for (int i = 1; i < 10; ++i) {
            off = tolk::putField(m, off, tolk::wire::pack(tolk::wire::U32), &w[i]);
        }
        for (int i = 0; i < 5; ++i) {
            off = tolk::putField(m, off, tolk::wire::pack(tolk::wire::U16), &h[i]);
        }
        for (int i = 0; i < 5; ++i) {
            off = tolk::putField(m, off, tolk::wire::pack(tolk::wire::U8), &b[i]);
        }
        len = bytes.length();
        off = tolk::putField(m, off, tolk::wire::pack(tolk::wire::U16), &len);
        return tolk::putList(m, off, tolk::wire::U8, bytes, false);
    }
    unsigned int readMsg(tolk::Msg* m, unsigned int off) override {
        off = tolk::getFirst(m, off, tolk::wire::pack(tolk::wire::U32), &w[0]);
        for (int i = 1; i < 10; ++i) {
            off = tolk::getField(m, off, tolk::wire::pack(tolk::wire::U32), &w[i]);
        }
        for (int i = 0; i < 5; ++i) {
            off = tolk::getField(m, off, tolk::wire::pack(tolk::wire::U16), &h[i]);
        }
        for (int i = 0; i < 5; ++i) {
            off = tolk::getField(m, off, tolk::wire::pack(tolk::wire::U8), &b[i]);
        }
        off = tolk::getField(m, off, tolk::wire::pack(tolk::wire::U16), &len);
        return tolk::getList(m, off, tolk::wire::U8, bytes, len, false);
    }
    unsigned int GetByteSize() override { return 40 + 10 + 5 + 2 + bytes.length(); }

    unsigned int w[10] = {};
    unsigned short h[5] = {};
    unsigned char b[5] = {};
    unsigned short len = 0;
    tolk::staticList<unsigned char> bytes;
};

void BM_Marshal_Write20ScalarsAnd300Bytes(benchmark::State& state) {
    Scalars20 body;
    body.bytes.realloc(300);
    tolk::Msg m(body.GetByteSize());
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        benchmark::DoNotOptimize(m.write(&body, 0));
    }
    state.counters["allocs_per_op"] =
        benchmark::Counter(static_cast<double>(lp_bench::heapAllocations() - before),
                           benchmark::Counter::kAvgIterations);
}
BENCHMARK(BM_Marshal_Write20ScalarsAnd300Bytes);

void BM_Marshal_Read20ScalarsAnd300Bytes(benchmark::State& state) {
    Scalars20 body;
    body.bytes.realloc(300);
    tolk::Msg m(body.GetByteSize());
    m.write(&body, 0);
    Scalars20 r;
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        benchmark::DoNotOptimize(m.read(&r, 0));
    }
    state.counters["allocs_per_op"] =
        benchmark::Counter(static_cast<double>(lp_bench::heapAllocations() - before),
                           benchmark::Counter::kAvgIterations);
}
BENCHMARK(BM_Marshal_Read20ScalarsAnd300Bytes);

// A whole send-side cycle: a new message of the body's size, written, freed.
void BM_Marshal_NewMsgWriteFree(benchmark::State& state) {
    Scalars20 body;
    body.bytes.realloc(300);
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        tolk::Msg m(body.GetByteSize());
        benchmark::DoNotOptimize(m.write(&body, 0));
    }
    state.counters["allocs_per_op"] =
        benchmark::Counter(static_cast<double>(lp_bench::heapAllocations() - before),
                           benchmark::Counter::kAvgIterations);
}
BENCHMARK(BM_Marshal_NewMsgWriteFree);

}  // namespace
