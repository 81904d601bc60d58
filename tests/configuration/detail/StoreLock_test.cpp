#include "configuration/detail/StoreLock.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <system_error>
#include <thread>

#include "tests/support/FreeMutex.hpp"

// The analysis knows no mutex that one thread holds twice.
#if defined(__clang__)
#pragma clang diagnostic ignored "-Wthread-safety-analysis"
#endif

namespace velkor::configuration::detail {
namespace {

class StoreLockTest : public ::testing::Test {
protected:
    // Whether another thread would get the mutex now, without waiting.
    bool isFree() { return testing::isFreeForOthers(mutex); }

    // An object whose end is noted, with whether the mutex was free then.
    std::shared_ptr<const void> object() {
        return std::shared_ptr<const void>(&destroyed, [this](const void*) {
            destroyed = true;
            wasFree = isFree();
        });
    }

    std::recursive_mutex mutex;
    StoreLock lock{mutex};
    bool destroyed = false;
    bool wasFree = false;
};

TEST_F(StoreLockTest, LevelHoldsTheMutexWhileItLives) {
    {
        const StoreLock::Level level(lock);
        EXPECT_FALSE(isFree());
    }
    EXPECT_TRUE(isFree());
}

TEST_F(StoreLockTest, RetiredObjectGoesAfterTheLastLevel) {
    {
        const StoreLock::Level outer(lock);
        {
            const StoreLock::Level inner(lock);
            lock.retire(object());
        }
        EXPECT_FALSE(destroyed);
    }
    EXPECT_TRUE(destroyed);
    EXPECT_TRUE(wasFree);
}

TEST_F(StoreLockTest, RetiredObjectGoesWhenTheLastLevelIsReleased) {
    StoreLock::Level level(lock);
    lock.retire(object());
    level.releasedWhile([this] { EXPECT_TRUE(destroyed); });
    EXPECT_TRUE(wasFree);
    EXPECT_FALSE(isFree());
}

TEST_F(StoreLockTest, RetiredObjectStaysWhenAnInnerLevelIsReleased) {
    const StoreLock::Level outer(lock);
    StoreLock::Level inner(lock);
    lock.retire(object());
    inner.releasedWhile([this] { EXPECT_FALSE(isFree()); });
    EXPECT_FALSE(destroyed);
}

TEST_F(StoreLockTest, LevelsAreCountedAgainAfterARelease) {
    {
        StoreLock::Level level(lock);
        level.releasedWhile([] {});
        { const StoreLock::Level inner(lock); }
        lock.retire(object());
        { const StoreLock::Level inner(lock); }
        EXPECT_FALSE(destroyed);
    }
    EXPECT_TRUE(destroyed);
}

TEST_F(StoreLockTest, LevelIsTakenBackWhenTheActionThrows) {
    {
        StoreLock::Level level(lock);
        EXPECT_THROW(level.releasedWhile([] { throw std::logic_error("inside"); }),
                     std::logic_error);
        EXPECT_FALSE(isFree());
        lock.retire(object());
    }
    EXPECT_TRUE(destroyed);
}

TEST_F(StoreLockTest, OtherThreadsUseTheirOwnLevelsMeanwhile) {
    StoreLock::Level level(lock);
    level.releasedWhile([this] {
        std::thread([this] {
            const StoreLock::Level other(lock);
            lock.retire(object());
        }).join();
        EXPECT_TRUE(destroyed);
    });
}

TEST_F(StoreLockTest, CallersLockIsCountedAndStaysHeld) {
    std::unique_lock<std::recursive_mutex> callers(mutex);
    {
        const StoreLock::Level level(lock, callers);
        { const StoreLock::Level inner(lock); }
        EXPECT_TRUE(callers.owns_lock());
    }
    EXPECT_TRUE(callers.owns_lock());
    EXPECT_FALSE(isFree());
}

TEST_F(StoreLockTest, WhatIsRetiredBelowACallersLockWaitsForTheMutexToBeReleased) {
    {
        std::unique_lock<std::recursive_mutex> callers(mutex);
        const StoreLock::Level level(lock, callers);
        lock.retire(object());
    }
    EXPECT_FALSE(destroyed);
    { const StoreLock::Level next(lock); }
    EXPECT_TRUE(destroyed);
    EXPECT_TRUE(wasFree);
}

TEST_F(StoreLockTest, CallersLockIsReleasedAndTakenBack) {
    std::unique_lock<std::recursive_mutex> callers(mutex);
    StoreLock::Level level(lock, callers);
    level.releasedWhile([this] { EXPECT_TRUE(isFree()); });
    EXPECT_TRUE(callers.owns_lock());
}

TEST_F(StoreLockTest, CallersLockThatIsNotHeldIsRefused) {
    std::unique_lock<std::recursive_mutex> callers(mutex, std::defer_lock);
    StoreLock::Level level(lock, callers);
    EXPECT_THROW(level.releasedWhile([] { FAIL() << "run"; }), std::system_error);
}

TEST_F(StoreLockTest, CallersLockThatWasTakenMeanwhileIsRefusedAndCounted) {
    {
        std::unique_lock<std::recursive_mutex> callers(mutex);
        StoreLock::Level level(lock, callers);
        EXPECT_THROW(level.releasedWhile([&] { callers.lock(); }), std::system_error);
        lock.retire(object());
        { const StoreLock::Level inner(lock); }
        EXPECT_FALSE(destroyed);
    }
    { const StoreLock::Level next(lock); }
    EXPECT_TRUE(destroyed);
}

TEST_F(StoreLockTest, NothingIsRetiredForANullReference) {
    const StoreLock::Level level(lock);
    lock.retireOrDrop(nullptr);
    lock.retireOrDrop(object());
    EXPECT_FALSE(destroyed);
}

}  // namespace
}  // namespace velkor::configuration::detail
