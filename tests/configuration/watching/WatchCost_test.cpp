#include <gtest/gtest.h>
#include <malloc.h>

#include <cstddef>
#include <string>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::countAllocations;

std::size_t bytesInUse() {
    return mallinfo2().uordblks;
}

class WatchCost : public WatchTest {
protected:
    /// Watches of keys that nobody writes.
    std::vector<Watch> watchOtherKeys(int count) const {
        std::vector<Watch> others;
        for (int number = 0; number < count; ++number) {
            others.push_back(watch("other." + std::to_string(number), 0));
        }
        return others;
    }

    std::size_t allocationsOfAWrite() const {
        return countAllocations([this] { set("key", 1); });
    }
};

TEST_F(WatchCost, WriteAllocatesTheSameWhateverOthersWatch) {
    const Watch started = watch("key", 0);
    set("key", 0);
    const std::size_t alone = allocationsOfAWrite();
    const auto others = watchOtherKeys(100'000);
    EXPECT_EQ(allocationsOfAWrite(), alone);
}

TEST_F(WatchCost, CancelAllocatesTheSameWhateverOthersWatch) {
    const Watch first = watch("key", 0);
    const std::size_t alone = countAllocations([&] { first.subscriber->cancel(); });
    const auto others = watchOtherKeys(100'000);
    const Watch second = watch("key", 0);
    EXPECT_EQ(countAllocations([&] { second.subscriber->cancel(); }), alone);
}

TEST_F(WatchCost, WatcherOfTheKeyAddsNoAllocationWhenItWaitsForTheValue) {
    set("key", 0);
    const Watch first = watch("key");
    first.subscriber->values.reserve(10);
    set("key", 0);
    const std::size_t withOne = allocationsOfAWrite();
    const Watch second = watch("key");
    second.subscriber->values.reserve(10);
    EXPECT_EQ(allocationsOfAWrite(), withOne);
}

TEST_F(WatchCost, MillionWritesWithoutDemandLeaveMemoryFlat) {
    const Watch started = watch("key", 0);
    const std::string text(100, 'x');
    for (int round = 0; round < 1'000; ++round) store->set("key", text).get();
    const std::size_t before = bytesInUse();
    for (int round = 0; round < 1'000'000; ++round) store->set("key", text).get();
    EXPECT_LE(bytesInUse(), before + 4096);
}

TEST_F(WatchCost, MillionCyclesOfWatchingLeaveMemoryFlat) {
    set("key", 1);
    const auto cycle = [this] {
        const Watch started = watch("key", 1);
        started.subscriber->cancel();
    };
    for (int round = 0; round < 1'000; ++round) cycle();
    const std::size_t before = bytesInUse();
    for (int round = 0; round < 1'000'000; ++round) cycle();
    EXPECT_LE(bytesInUse(), before + 4096);
}

}  // namespace
}  // namespace velkor::configuration
