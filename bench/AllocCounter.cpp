#include "AllocCounter.h"

#include <atomic>
#include <cstddef>

namespace {
std::atomic<unsigned long> g_allocations{0};
}

// glibc lets a program interpose malloc; counting there sees every allocation, whichever
// operator new or container made it, and one counter serves every benchmark of the program.
extern "C" void* __libc_malloc(std::size_t n);
extern "C" void* malloc(std::size_t n) {
    g_allocations.fetch_add(1, std::memory_order_relaxed);
    return __libc_malloc(n);
}

unsigned long lp_bench::heapAllocations() {
    return g_allocations.load(std::memory_order_relaxed);
}
