#include "framework/common/Mutex.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <thread>

#include "tests/support/BoundedWait.hpp"

namespace {

using velkor::common::Mutex;
using velkor::common::MutexLock;
using velkor::testing::completes;
using velkor::testing::Latch;

// Whether another thread can have `mutex`.
bool isFree(Mutex& mutex) {
    return completes([&mutex] { const MutexLock lock(mutex); });
}

TEST(MutexLock, KeepsOtherThreadsOut) {
    Mutex mutex;
    Latch entered;
    int value = 0;
    std::thread other;
    {
        const MutexLock lock(mutex);
        other = std::thread([&] {
            const MutexLock otherLock(mutex);
            EXPECT_EQ(value, 1);
            entered.countDown();
        });
        value = 1;
    }
    EXPECT_TRUE(entered.wait());
    other.join();
}

TEST(MutexLock, ReleasesAtTheEndOfItsScope) {
    Mutex mutex;
    { const MutexLock lock(mutex); }
    EXPECT_TRUE(isFree(mutex));
}

TEST(MutexLock, UnlockReleasesBeforeTheEndOfItsScope) {
    Mutex mutex;
    MutexLock lock(mutex);
    lock.unlock();
    EXPECT_TRUE(isFree(mutex));
}

TEST(MutexLock, DestructionAfterUnlockLeavesTheNextOwnerAlone) {
    Mutex mutex;
    {
        MutexLock lock(mutex);
        lock.unlock();
    }
    EXPECT_TRUE(isFree(mutex));
}

TEST(MutexLock, WaitReleasesTheMutexAndTakesItAgain) {
    Mutex mutex;
    std::condition_variable changed;
    bool ready = false;
    std::thread waker;
    EXPECT_TRUE(completes([&] {
        MutexLock lock(mutex);
        waker = std::thread([&] {
            {
                const MutexLock wakerLock(mutex);
                ready = true;
            }
            changed.notify_all();
        });
        while (!ready) lock.wait(changed);
    }));
    waker.join();
    EXPECT_TRUE(isFree(mutex));
}

TEST(MutexLock, WaitWithALimitEndsThoughNobodyWakesIt) {
    Mutex mutex;
    std::condition_variable never;
    EXPECT_TRUE(completes([&] {
        MutexLock lock(mutex);
        lock.waitFor(never, std::chrono::nanoseconds(1));
    }));
    EXPECT_TRUE(isFree(mutex));
}

}  // namespace
