#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <mutex>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::configuration {
namespace {

/// Whether other threads could use the store while a subscriber was told.
class WatchLocks : public WatchTest {
protected:
    /// Lets the next signals to the subscriber note whether the store is free.
    void observe(const Watch& started) {
        started.subscriber->whenNext = [this](const auto&) {
            ++deliveries;
            free = open->isFreeForOthers();
        };
    }

    int deliveries = 0;
    bool free = false;
};

TEST_F(WatchLocks, StoreIsLockedForOthersWhileAWrittenValueIsDelivered) {
    const Watch started = watch("key");
    observe(started);
    set("key", 1);
    EXPECT_EQ(deliveries, 1);
    EXPECT_FALSE(free);
}

TEST_F(WatchLocks, StoreIsLockedForOthersWhileAValueWrittenByNameIsDelivered) {
    const Watch started = watch("key");
    observe(started);
    store->set("key", 1, "default").get();
    EXPECT_EQ(deliveries, 1);
    EXPECT_FALSE(free);
}

TEST_F(WatchLocks, StoreIsFreeAfterAWrite) {
    const Watch started = watch("key");
    set("key", 1);
    EXPECT_TRUE(open->isFreeForOthers());
}

TEST_F(WatchLocks, StoreIsFreeWhileAnAddedSourceIsTold) {
    const Watch started = watch("key");
    observe(started);
    add("source", "", 5, {{"key", 1}});
    EXPECT_EQ(deliveries, 1);
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, StoreIsFreeWhileARemovedSourceIsTold) {
    set("key", 1);
    add("high", "", -1, {{"key", 2}});
    const Watch started = watch("key");
    observe(started);
    EXPECT_TRUE(store->removeSource("high").get());
    EXPECT_EQ(deliveries, 1);
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, StoreIsFreeWhileAChangeOfTheSourceItselfIsTold) {
    const auto source = addHooked("hooked", "", -1, {{"key", 1}});
    const Watch started = watch("key");
    observe(started);
    source->listener("key");
    EXPECT_EQ(deliveries, 1);
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, StoreIsFreeWhileTheFirstValueIsDelivered) {
    set("key", 1);
    const Watch started{store->watchOption("key")};
    observe(started);
    started.subscribe(1);
    EXPECT_EQ(deliveries, 1);
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, AnotherThreadMayUseTheStoreWhileAnAddedSourceIsTold) {
    const Watch started = watch("key");
    bool used = false;
    started.subscriber->whenNext = [&](const auto&) {
        used = velkor::testing::completes([shared = open] { shared->set("other", 1).get(); });
    };
    add("source", "", 5, {{"key", 1}});
    EXPECT_TRUE(used);
}

TEST_F(WatchLocks, UpdateReleasesOneLevelOfTheMutex) {
    set("key", 1);
    const Watch started = watch("key");
    observe(started);
    std::unique_lock<std::recursive_mutex> outer(open->mutex);
    std::unique_lock<std::recursive_mutex> inner(open->mutex);
    open->updatePublishers(inner, "key");
    EXPECT_FALSE(free);
    EXPECT_TRUE(inner.owns_lock());
    inner.unlock();
    open->updatePublishers(outer, "key");
    EXPECT_TRUE(free);
    EXPECT_TRUE(outer.owns_lock());
}

TEST_F(WatchLocks, UpdateOfAnUnknownKeyEndsWithTheLockOwned) {
    std::unique_lock<std::recursive_mutex> lock(open->mutex);
    open->updatePublishers(lock, "key");
    EXPECT_TRUE(lock.owns_lock());
}

/// Looks at the store when it is destroyed.
class LastLook {
public:
    explicit LastLook(std::function<void()> look) : action(std::move(look)) {}
    ~LastLook() { action(); }
    LastLook(const LastLook&) = delete;
    LastLook& operator=(const LastLook&) = delete;

private:
    std::function<void()> action;
};

TEST_F(WatchLocks, StoreIsFreeWhileAPublisherThatWasRemovedCompletes) {
    Watch started = watch("key");
    started.subscriber->whenComplete = [this] { free = open->isFreeForOthers(); };
    started.publisher.reset();
    open->removeStream(0);
    EXPECT_EQ(started.subscriber->completions, 1);
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, StoreIsFreeWhileACancelledSubscriberIsDestroyed) {
    Watch started = watch("key");
    started.subscriber->whenComplete =
        [look = std::make_shared<LastLook>([this] { free = open->isFreeForOthers(); })] {};
    const auto subscription = started.subscriber->subscription.lock();
    started.subscriber.reset();
    subscription->cancel();
    EXPECT_TRUE(free);
}

TEST_F(WatchLocks, ContinuationOfACancelRunsWithTheStoreFree) {
    const Watch started = watch("key");
    auto observed = started.publisher->getCompletionFuture().then([this](Future<bool>&& completed) {
        free = open->isFreeForOthers();
        return completed.get();
    });
    started.subscriber->cancel();
    EXPECT_TRUE(free);
}

}  // namespace
}  // namespace velkor::configuration
