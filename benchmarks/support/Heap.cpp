#include "benchmarks/support/Heap.hpp"

#include <cstddef>

#include <malloc.h>

namespace {

thread_local std::uint64_t allocations = 0;

}  // namespace

namespace velkor::benchmarks {

std::uint64_t allocationCount() noexcept {
    return allocations;
}

std::uint64_t heapBytes() noexcept {
    const struct mallinfo2 info = mallinfo2();
    return info.uordblks + info.hblkhd;
}

}  // namespace velkor::benchmarks

// The C library's own functions stand behind these, so that what peers written in C allocate is
// counted as well.
extern "C" {

void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);

void* malloc(std::size_t size) {
    ++allocations;
    return __libc_malloc(size);
}

void* calloc(std::size_t count, std::size_t size) {
    ++allocations;
    return __libc_calloc(count, size);
}

void* realloc(void* block, std::size_t size) {
    ++allocations;
    return __libc_realloc(block, size);
}
}
