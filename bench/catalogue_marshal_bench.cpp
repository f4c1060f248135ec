// Body marshalling cost and heap allocations per body.

#include <benchmark/benchmark.h>

#include <cstring>

#include "AllocCounter.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "catalogue/generated/values.h"
#include "framework/Msg.h"
#include "platform/tkhost/tkhost.h"

namespace {

using tolk::staticList;

// Allocations per iteration beyond the message block itself.
void report(benchmark::State& state, unsigned long allocs, unsigned long blocks) {
    state.counters["allocs_per_iter"] =
        static_cast<double>(allocs - blocks) / static_cast<double>(state.iterations());
}

void BM_Marshal_MakeCall(benchmark::State& state) {
    staticList<char> dest, orig;
    dest.realloc(128);
    orig.realloc(128);
    std::strcpy(dest.data(), "5551234");
    std::strcpy(orig.data(), "5551212");
    unsigned char progress = 0;
    staticList<tolk::TSC_Bodies::MsgMakeCall_t::KVSet_t> kv;
    tolk::TSC_Bodies::MsgMakeCall_t body(dest, orig, progress, kv);
    tolk::TSC_Bodies::MsgMakeCall_t back;
    tolk::Msg m(body.GetByteSize());
    back.readMsg(&m, 0);  // sizes the read side's arrays once
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        benchmark::DoNotOptimize(body.writeMsg(&m, 0));
        benchmark::DoNotOptimize(back.readMsg(&m, 0));
    }
    report(state, lp_bench::heapAllocations() - before, 0);
}
BENCHMARK(BM_Marshal_MakeCall);

void BM_Marshal_DetectxEvts18(benchmark::State& state) {
    tolk::CompDesc_t addr(1, 2, 3, 4, 5);
    unsigned int count = 0xFFFFFFFF;
    staticList<tolk::StdResource_Bodies::MsgDetectxEvts_t::List_t> list;
    list.realloc(18);
    for (unsigned int i = 0; i < 18; ++i) {
        list[i]->EvtType = tolk::wire::TSC::EvtType::CALL_STATE_FIRST + i;
        list[i]->EvtGroup = tolk::wire::TSC::EvtType::CALL_STATE_FIRST;
    }
    tolk::StdResource_Bodies::MsgDetectxEvts_t body(addr, count, list);
    tolk::StdResource_Bodies::MsgDetectxEvts_t back;
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        tolk::Msg m(body.GetByteSize());
        benchmark::DoNotOptimize(body.writeMsg(&m, 0));
        benchmark::DoNotOptimize(back.readMsg(&m, 0));
    }
    // One message block per iteration is the sender's, not the body's.
    report(state, lp_bench::heapAllocations() - before, state.iterations());
}
BENCHMARK(BM_Marshal_DetectxEvts18);

void BM_Decode_EvtCallState(benchmark::State& state) {
    tolk::Msg m(24);
    unsigned char* b = reinterpret_cast<unsigned char*>(m.getMsgRef()) + TK_MSG_HEADER_SIZE;
    const unsigned char bytes[24] = {0, 0, 0x12, 0x30, 0, 0, 0x12, 0x34, 0, 0, 0, 1,
                                     0, 0, 0,    5,    0, 0, 0,    3,    0, 0, 0, 14};
    std::memcpy(b, bytes, 24);
    unsigned long before = lp_bench::heapAllocations();
    for (auto _ : state) {
        tolk::TSC_Bodies::EvtCallState_t ev;
        benchmark::DoNotOptimize(ev.readMsg(&m, 0));
        benchmark::DoNotOptimize(ev.CallState);
    }
    report(state, lp_bench::heapAllocations() - before, 0);
}
BENCHMARK(BM_Decode_EvtCallState);

}  // namespace
