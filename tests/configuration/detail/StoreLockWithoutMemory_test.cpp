#include <gtest/gtest.h>

#include <memory>
#include <mutex>
#include <utility>

#include "configuration/detail/StoreLock.hpp"
#include "tests/support/ScarceMemory.hpp"

namespace velkor::configuration::detail {
namespace {

TEST(StoreLockWithoutMemory, GivesUpAtOnceWhatItCannotKeep) {
    testing::failEachAllocation([](testing::ScarceMemory& memory) {
        std::recursive_mutex mutex;
        StoreLock lock(mutex);
        bool destroyed = false;
        std::shared_ptr<const void> object(&destroyed, [&](const void*) { destroyed = true; });
        bool wasDropped = false;
        EXPECT_TRUE(memory.allows([&] {
            const StoreLock::Level level(lock);
            lock.retireOrDrop(std::move(object));
            wasDropped = destroyed;
        }));
        EXPECT_EQ(wasDropped, memory.hasRunOut());
        EXPECT_TRUE(destroyed);
    });
}

}  // namespace
}  // namespace velkor::configuration::detail
