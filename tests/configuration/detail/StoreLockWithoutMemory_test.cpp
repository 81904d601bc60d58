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
        {
            const StoreLock::Level level(lock);
            EXPECT_TRUE(memory.allows([&] { lock.retireOrDrop(std::move(object)); }));
            EXPECT_EQ(destroyed, memory.hasRunOut());
        }
        EXPECT_TRUE(destroyed);
    });
}

}  // namespace
}  // namespace velkor::configuration::detail
