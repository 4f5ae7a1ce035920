// Heap accounting for the benchmarks. The benchmark program replaces the C library's malloc
// family with thin wrappers that count every allocation and track the bytes in use, so that the
// provider library (loaded with dlopen), the host and the platform are all counted alike:
// operator new of the C++ library ends in malloc as well.
#ifndef BLUELIGHT_BENCH_ALLOCCOUNTER_H
#define BLUELIGHT_BENCH_ALLOCCOUNTER_H

#include <cstddef>
#include <cstdint>

namespace bench {

// Allocations made since the program started (malloc, calloc, realloc to a new block, the
// aligned variants).
std::uint64_t allocationCount();
// Bytes of live heap blocks, as malloc_usable_size reports them.
std::int64_t bytesInUse();
// The highest bytesInUse() since the last resetPeak().
std::int64_t peakBytes();
// Starts a new peak at the bytes in use now.
void resetPeak();

// The heap cost of one piece of work: allocations made and the highest heap above the level at
// the start.
struct HeapCost {
  std::uint64_t allocations = 0;
  std::int64_t peakAbove = 0;
};

template <typename Work>
HeapCost measureHeap(Work&& work) {
  const std::uint64_t allocationsBefore = allocationCount();
  const std::int64_t base = bytesInUse();
  resetPeak();
  work();
  return HeapCost{allocationCount() - allocationsBefore, peakBytes() - base};
}

}  // namespace bench

#endif  // BLUELIGHT_BENCH_ALLOCCOUNTER_H
