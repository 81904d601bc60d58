#include "tests/support/AllocationCounter.hpp"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <mutex>
#include <new>

namespace velkor::testing {

namespace {

constexpr std::size_t never = std::numeric_limits<std::size_t>::max();

thread_local std::size_t allocations = 0;
thread_local std::ptrdiff_t blocksHeld = 0;
thread_local std::size_t successesLeft = never;
thread_local Shortage kind = Shortage::once;
thread_local bool hasFailed = false;

/// The shortage of all threads but one.
struct ShortageElsewhere {
    std::atomic<bool> isOn{false};
    std::mutex mutex;  // guards all below
    std::size_t successesLeft = never;
    Shortage kind = Shortage::once;
    bool hasFailed = false;
};

ShortageElsewhere elsewhere;
thread_local bool isExempt = false;

void countAllocationElsewhere() {
    const std::lock_guard<std::mutex> lock(elsewhere.mutex);
    if (elsewhere.successesLeft == never) return;
    if (elsewhere.successesLeft > 0) {
        --elsewhere.successesLeft;
        return;
    }
    elsewhere.hasFailed = true;
    if (elsewhere.kind == Shortage::once) elsewhere.successesLeft = never;
    throw std::bad_alloc();
}

void countAllocation() {
    ++allocations;
    if (elsewhere.isOn && !isExempt) countAllocationElsewhere();
    if (successesLeft == never) return;
    if (successesLeft > 0) {
        --successesLeft;
        return;
    }
    hasFailed = true;
    if (kind == Shortage::once) successesLeft = never;
    throw std::bad_alloc();
}

void* require(void* memory) {
    if (memory == nullptr) throw std::bad_alloc();
    ++blocksHeld;
    return memory;
}

void giveBack(void* memory) noexcept {
    if (memory == nullptr) return;
    --blocksHeld;
    std::free(memory);
}

}  // namespace

std::size_t allocationsOfThisThread() noexcept {
    return allocations;
}

std::ptrdiff_t blocksHeldByThisThread() noexcept {
    return blocksHeld;
}

AllocationFailure::AllocationFailure(std::size_t successes, Shortage shortage) noexcept {
    successesLeft = successes;
    kind = shortage;
    hasFailed = false;
}

AllocationFailure::~AllocationFailure() {
    successesLeft = never;
}

bool AllocationFailure::hasHappened() const noexcept {
    return hasFailed;
}

AllocationFailureElsewhere::AllocationFailureElsewhere(std::size_t successes,
                                                       Shortage shortage) noexcept {
    const std::lock_guard<std::mutex> lock(elsewhere.mutex);
    elsewhere.successesLeft = successes;
    elsewhere.kind = shortage;
    elsewhere.hasFailed = false;
    isExempt = true;
    elsewhere.isOn = true;
}

AllocationFailureElsewhere::~AllocationFailureElsewhere() {
    const std::lock_guard<std::mutex> lock(elsewhere.mutex);
    elsewhere.successesLeft = never;
    elsewhere.isOn = false;
    isExempt = false;
}

bool AllocationFailureElsewhere::hasHappened() const noexcept {
    const std::lock_guard<std::mutex> lock(elsewhere.mutex);
    return elsewhere.hasFailed;
}

}  // namespace velkor::testing

// The array and nothrow forms of the standard library call these; a sanitizer has its own ones.

void* operator new(std::size_t size) {
    velkor::testing::countAllocation();
    return velkor::testing::require(std::malloc(size == 0 ? 1 : size));
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    try {
        return ::operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

void* operator new(std::size_t size, std::align_val_t alignment) {
    velkor::testing::countAllocation();
    const auto unit = static_cast<std::size_t>(alignment);
    const std::size_t rounded = (size + unit - 1) / unit * unit;
    return velkor::testing::require(std::aligned_alloc(unit, rounded == 0 ? unit : rounded));
}

void operator delete(void* memory) noexcept {
    velkor::testing::giveBack(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
    velkor::testing::giveBack(memory);
}

void operator delete(void* memory, std::align_val_t) noexcept {
    velkor::testing::giveBack(memory);
}

void operator delete(void* memory, std::size_t, std::align_val_t) noexcept {
    velkor::testing::giveBack(memory);
}
