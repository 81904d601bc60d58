#pragma once

#include <cstdint>

namespace velkor::benchmarks {

/// The number of blocks that this thread has asked of the heap, by whatever way.
std::uint64_t allocationCount() noexcept;

/// The bytes in use on the heap of this process, its own bookkeeping included.
std::uint64_t heapBytes() noexcept;

}  // namespace velkor::benchmarks
