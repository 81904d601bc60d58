#pragma once

#include <cstddef>

namespace velkor::testing {

/// How often the calling thread has called operator new since it began.
///
/// Programs that link velkor-allocation-counter have the global operators new and delete replaced;
/// the libraries that they load use the replacements, too. The target does not exist under the
/// sanitizers, which bring operators of their own.
std::size_t allocationsOfThisThread() noexcept;

/// The number of allocations that `callable` makes on the calling thread.
template <class Callable>
std::size_t countAllocations(Callable&& callable) {
    const std::size_t before = allocationsOfThisThread();
    callable();
    return allocationsOfThisThread() - before;
}

/// How many blocks more than it has given back the calling thread has been given by operator new.
std::ptrdiff_t blocksHeldByThisThread() noexcept;

/// How long memory stays short.
enum class Shortage {
    once,     ///< One allocation fails, the next one succeeds.
    lasting,  ///< Every allocation fails from then on.
};

/// Lets allocations of the calling thread fail with `std::bad_alloc` while it lives: the first one
/// after `successes` more that succeed and, in a lasting shortage, all that follow.
class AllocationFailure {
public:
    explicit AllocationFailure(std::size_t successes, Shortage shortage = Shortage::once) noexcept;
    ~AllocationFailure();

    AllocationFailure(const AllocationFailure&) = delete;
    AllocationFailure& operator=(const AllocationFailure&) = delete;

    /// Whether the allocation that was to fail first has been reached.
    bool hasHappened() const noexcept;
};

/// `AllocationFailure` for all threads but the one that makes it. One at a time.
class AllocationFailureElsewhere {
public:
    explicit AllocationFailureElsewhere(std::size_t successes,
                                        Shortage shortage = Shortage::once) noexcept;
    ~AllocationFailureElsewhere();

    AllocationFailureElsewhere(const AllocationFailureElsewhere&) = delete;
    AllocationFailureElsewhere& operator=(const AllocationFailureElsewhere&) = delete;

    /// Whether the allocation that was to fail first has been reached.
    bool hasHappened() const noexcept;
};

}  // namespace velkor::testing
