#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <new>
#include <string>

#include "tests/support/AllocationCounter.hpp"

namespace velkor::testing {

/// The name of a case that is about a kind of shortage.
inline std::string nameOfShortage(const ::testing::TestParamInfo<Shortage>& info) {
    return info.param == Shortage::once ? "Once" : "FromThenOn";
}

/// Runs the operation of a scenario short of memory; see `failEachAllocation`.
class ScarceMemory {
public:
    ScarceMemory(std::size_t allowed, Shortage kind) : successes(allowed), shortage(kind) {}

    /// Runs `operation` and says whether it got through: false when it threw `std::bad_alloc`.
    template <class Operation>
    bool allows(Operation&& operation) {
        const AllocationFailure failure(successes, shortage);
        bool passed = true;
        try {
            operation();
        } catch (const std::bad_alloc&) {
            passed = false;
        }
        ranOut = failure.hasHappened();
        return passed;
    }

    /// Whether the operation reached the allocation that was to fail.
    bool hasRunOut() const { return ranOut; }

private:
    std::size_t successes;
    Shortage shortage;
    bool ranOut = false;
};

/// Runs `scenario(ScarceMemory&)` with the first, second, ... allocation of the operation that it
/// hands to `allows` failing, once and for good, until the operation needs no more of them. What it
/// does around the operation has all the memory that it wants. Each run must give back every block.
template <class Scenario>
void failEachAllocation(Scenario scenario) {
    for (const Shortage shortage : {Shortage::once, Shortage::lasting}) {
        bool ranOut = true;
        for (std::size_t successes = 0; ranOut; ++successes) {
            SCOPED_TRACE(successes);
            const std::ptrdiff_t held = blocksHeldByThisThread();
            {
                ScarceMemory memory(successes, shortage);
                scenario(memory);
                ranOut = memory.hasRunOut();
            }
            EXPECT_EQ(blocksHeldByThisThread(), held);
        }
    }
}

}  // namespace velkor::testing
