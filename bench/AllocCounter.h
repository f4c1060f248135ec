#pragma once

// Heap allocations made by the whole benchmark program so far, counted at malloc (operator
// new reaches malloc too), so that benchmarks can report allocations per operation.
namespace lp_bench {
unsigned long heapAllocations();
}
