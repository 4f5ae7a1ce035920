// Replacements for glibc's malloc family that count allocations and bytes in use. They forward to
// glibc's own allocator through its __libc_* entry points, so there is no recursion and no
// dlsym() at start-up; glibc documents that a program may replace these functions this way, and
// its own internal allocations (strdup, fopen, ...) then come here too.
#include "AllocCounter.h"

#include <malloc.h>

#include <atomic>
#include <cerrno>
#include <cstdint>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* pointer, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);
void __libc_free(void* pointer);
}

namespace {

// Relaxed atomics: the benchmarks run on one thread; the counts only need to stay sane if the
// library or the host ever used another.
std::atomic<std::uint64_t> allocations{0};
std::atomic<std::int64_t> inUse{0};
std::atomic<std::int64_t> peak{0};

void noteAllocated(void* pointer) {
  if (pointer == nullptr) return;
  allocations.fetch_add(1, std::memory_order_relaxed);
  const std::int64_t now = inUse.fetch_add(static_cast<std::int64_t>(malloc_usable_size(pointer)),
                                           std::memory_order_relaxed) +
                           static_cast<std::int64_t>(malloc_usable_size(pointer));
  std::int64_t highest = peak.load(std::memory_order_relaxed);
  while (now > highest && !peak.compare_exchange_weak(highest, now, std::memory_order_relaxed)) {
  }
}

void noteFreed(void* pointer) {
  if (pointer == nullptr) return;
  inUse.fetch_sub(static_cast<std::int64_t>(malloc_usable_size(pointer)),
                  std::memory_order_relaxed);
}

}  // namespace

extern "C" {

void* malloc(std::size_t size) {
  void* pointer = __libc_malloc(size);
  noteAllocated(pointer);
  return pointer;
}

void* calloc(std::size_t count, std::size_t size) {
  void* pointer = __libc_calloc(count, size);
  noteAllocated(pointer);
  return pointer;
}

void* realloc(void* pointer, std::size_t size) {
  if (pointer == nullptr) return malloc(size);
  if (size == 0) {
    free(pointer);
    return nullptr;
  }
  // The old block is accounted as freed and the result as a new allocation, moved or not.
  const std::int64_t oldSize = static_cast<std::int64_t>(malloc_usable_size(pointer));
  void* result = __libc_realloc(pointer, size);
  if (result == nullptr) return nullptr;  // the old block is still there, still counted
  inUse.fetch_sub(oldSize, std::memory_order_relaxed);
  noteAllocated(result);
  return result;
}

void free(void* pointer) {
  noteFreed(pointer);
  __libc_free(pointer);
}

void* memalign(std::size_t alignment, std::size_t size) {
  void* pointer = __libc_memalign(alignment, size);
  noteAllocated(pointer);
  return pointer;
}

void* aligned_alloc(std::size_t alignment, std::size_t size) { return memalign(alignment, size); }

int posix_memalign(void** result, std::size_t alignment, std::size_t size) {
  if (alignment < sizeof(void*) || (alignment & (alignment - 1)) != 0) return EINVAL;
  void* pointer = memalign(alignment, size);
  if (pointer == nullptr) return ENOMEM;
  *result = pointer;
  return 0;
}

void* valloc(std::size_t size) { return memalign(4096, size); }

void* pvalloc(std::size_t size) { return memalign(4096, (size + 4095) & ~std::size_t{4095}); }

}  // extern "C"

namespace bench {

std::uint64_t allocationCount() { return allocations.load(std::memory_order_relaxed); }

std::int64_t bytesInUse() { return inUse.load(std::memory_order_relaxed); }

std::int64_t peakBytes() { return peak.load(std::memory_order_relaxed); }

void resetPeak() { peak.store(inUse.load(std::memory_order_relaxed), std::memory_order_relaxed); }

}  // namespace bench
