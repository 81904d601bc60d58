#include <gmock/gmock.h>

#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::configuration {
namespace {

using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::Not;

using WatchCancel = WatchTest;

TEST_F(WatchCancel, StopsTheDelivery) {
    const Watch started = watch("key");
    started.subscriber->cancel();
    set("key", 1);
    EXPECT_THAT(started.values(), IsEmpty());
}

TEST_F(WatchCancel, LeavesTheOtherWatchesOfTheKeyAlone) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    const Watch third = watch("key");
    second.subscriber->cancel();
    set("key", 1);
    EXPECT_THAT(first.values(), ElementsAre("int 1"));
    EXPECT_THAT(third.values(), ElementsAre("int 1"));
}

TEST_F(WatchCancel, RemovesTheWatchFromTheStore) {
    const Watch started = watch("key");
    started.subscriber->cancel();
    const velkor::testing::LogCapture log("velkor::configuration");
    set("key", 1);
    EXPECT_THAT(log.messages(), Not(Contains("notifying watcher: key")));
}

TEST_F(WatchCancel, ReleasesTheStoresReference) {
    Watch started = watch("key");
    const std::weak_ptr<reactive_streams::Publisher> observed = started.publisher;
    started.publisher.reset();
    EXPECT_FALSE(observed.expired());
    started.subscriber->cancel();
    EXPECT_TRUE(observed.expired());
}

TEST_F(WatchCancel, ReleasesTheSubscriber) {
    const Watch started = watch("key");
    started.subscriber->cancel();
    EXPECT_EQ(started.subscriber.use_count(), 1);
}

TEST_F(WatchCancel, CompletionFutureYieldsFalse) {
    const Watch started = watch("key");
    started.subscriber->cancel();
    EXPECT_FALSE(started.publisher->getCompletionFuture().get());
}

TEST_F(WatchCancel, SecondCancelDoesNothing) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    first.subscriber->cancel();
    first.subscriber->cancel();
    set("key", 1);
    EXPECT_THAT(second.values(), ElementsAre("int 1"));
}

TEST_F(WatchCancel, InsideOnNextRemovesTheWatch) {
    const Watch started = watch("key");
    started.subscriber->whenNext = [&](const auto&) { started.subscriber->cancel(); };
    set("key", 1);
    set("key", 2);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchCancel, InsideOnNextOfAnEarlierWatcherKeepsTheValueFromALaterOne) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    first.subscriber->whenNext = [&](const auto&) { second.subscriber->cancel(); };
    set("key", 1);
    EXPECT_THAT(second.values(), IsEmpty());
}

TEST_F(WatchCancel, WatchThatIsRemovedDuringTheDeliveryStillReceivesTheValue) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    first.subscriber->whenNext = [&](const auto&) { open->removeStream(1); };
    set("key", 1);
    set("key", 2);
    EXPECT_THAT(first.values(), ElementsAre("int 1", "int 2"));
    EXPECT_THAT(second.values(), ElementsAre("int 1"));
}

TEST_F(WatchCancel, OnAnotherThreadTakesEffectAtOnceAndReturnsAfterTheWrite) {
    const Watch started = watch("key");
    auto completed = started.publisher->getCompletionFuture();
    std::atomic<bool> returned{false};
    std::thread cancelling;
    started.subscriber->whenNext = [&](const auto&) {
        const auto subscription = started.subscriber->subscription.lock();
        cancelling = std::thread([subscription, &returned] {
            subscription->cancel();
            returned = true;
        });
        EXPECT_FALSE(completed.get());
        EXPECT_FALSE(returned);
    };
    set("key", 1);
    cancelling.join();
    EXPECT_TRUE(returned);
}

TEST_F(WatchCancel, ManyWatchesOfOneKeyCanBeCancelledInAnyOrder) {
    std::vector<Watch> watches;
    for (int number = 0; number < 100; ++number) watches.push_back(watch("key"));
    for (std::size_t number = 0; number < 100; number += 2) watches[number].subscriber->cancel();
    set("key", 1);
    for (std::size_t number = 0; number < 100; ++number) {
        EXPECT_EQ(watches[number].values().size(), number % 2);
    }
}

}  // namespace
}  // namespace velkor::configuration
