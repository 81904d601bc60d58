#include <gmock/gmock.h>

#include <memory>
#include <thread>
#include <utility>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;

class WatchLifetime : public WatchTest {
protected:
    void destroyStore() {
        store.reset();
        open.reset();
    }
};

TEST_F(WatchLifetime, WatchDoesNotKeepTheStoreAlive) {
    const std::weak_ptr<OpenStore> observed = open;
    const Watch started = watch("key");
    destroyStore();
    EXPECT_TRUE(observed.expired());
}

TEST_F(WatchLifetime, StoreKeepsAPublisherThatItsClientDroppedAlive) {
    Watch started = watch("key");
    const std::weak_ptr<reactive_streams::Publisher> observed = started.publisher;
    started.publisher.reset();
    EXPECT_FALSE(observed.expired());
    EXPECT_EQ(started.subscriber->completions, 0);
}

TEST_F(WatchLifetime, DestroyedStoreCompletesTheStreamsThatItAloneHolds) {
    Watch started = watch("key");
    auto completed = started.publisher->getCompletionFuture();
    started.publisher.reset();
    destroyStore();
    EXPECT_EQ(started.subscriber->completions, 1);
    EXPECT_TRUE(completed.get());
}

TEST_F(WatchLifetime, DestroyedStoreLeavesAStreamThatItsClientHoldsOpen) {
    Watch started = watch("key");
    destroyStore();
    EXPECT_EQ(started.subscriber->completions, 0);
    started.publisher.reset();
    EXPECT_EQ(started.subscriber->completions, 1);
}

TEST_F(WatchLifetime, DestroyedStoreCompletesStreamsInOrderOfCreation) {
    std::vector<int> order;
    std::vector<Watch> watches;
    for (int number = 0; number < 5; ++number) {
        watches.push_back(watch("key"));
        watches.back().publisher.reset();
        watches.back().subscriber->whenComplete = [&order, number] { order.push_back(number); };
    }
    destroyStore();
    EXPECT_THAT(order, ElementsAre(0, 1, 2, 3, 4));
}

TEST_F(WatchLifetime, KeptValueCanBeHadAfterTheStoreHasGone) {
    set("key", 1);
    const Watch started = watch("key", 0);
    destroyStore();
    started.subscriber->request(1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchLifetime, CancelAfterTheStoreHasGoneEndsTheStream) {
    const Watch started = watch("key");
    destroyStore();
    started.subscriber->cancel();
    EXPECT_FALSE(started.publisher->getCompletionFuture().get());
}

TEST_F(WatchLifetime, StreamCanBeSubscribedAfterTheStoreHasGone) {
    set("key", 1);
    const Watch started{open->watchOption("key")};
    destroyStore();
    started.subscribe(1);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchLifetime, SourceThatOutlivesTheStoreReportsToNobody) {
    const auto source = addHooked("hooked", "", -1, {{"key", 1}});
    const Watch started = watch("key");
    destroyStore();
    source->set("key", 2);
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
}

TEST_F(WatchLifetime, OnCompleteOfADestroyedStoreMayUseTheOtherStreams) {
    Watch first = watch("key");
    Watch second = watch("key");
    first.subscriber->whenComplete = [&] { second.subscriber->cancel(); };
    first.publisher.reset();
    second.publisher.reset();
    destroyStore();
    EXPECT_EQ(first.subscriber->completions, 1);
    EXPECT_EQ(second.subscriber->completions, 0);
}

TEST_F(WatchLifetime, SubscriberMayDropTheStoreWhileItIsTold) {
    const std::weak_ptr<OpenStore> observed = open;
    Watch started = watch("key");
    started.publisher.reset();
    started.subscriber->whenNext = [this](const auto&) { destroyStore(); };
    OpenStore& last = *open;
    const auto answer = last.set("key", 1);
    EXPECT_TRUE(observed.expired());
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
    EXPECT_EQ(started.subscriber->completions, 1);
}

TEST_F(WatchLifetime, SubscriberMayDropTheStoreWhileAnAddedSourceIsTold) {
    const std::weak_ptr<OpenStore> observed = open;
    const Watch started = watch("a");
    started.subscriber->whenNext = [this](const auto&) { destroyStore(); };
    OpenStore& last = *open;
    const auto answer = last.addInMemorySource("source", "", 5, false, {{"a", 1}, {"b", 2}});
    EXPECT_TRUE(observed.expired());
}

TEST_F(WatchLifetime, SubscriberMayDropTheStoreWhileARemovedSourceIsTold) {
    set("key", 1);
    add("high", "", -1, {{"key", 2}});
    const std::weak_ptr<OpenStore> observed = open;
    const Watch started = watch("key");
    started.subscriber->whenNext = [this](const auto&) { destroyStore(); };
    OpenStore& last = *open;
    EXPECT_TRUE(last.removeSource("high").get());
    EXPECT_TRUE(observed.expired());
}

TEST_F(WatchLifetime, SubscriberMayDropPublisherAndItselfWhileItIsTold) {
    Watch started = watch("key");
    const std::weak_ptr<Watch::Recorder> observed = started.subscriber;
    started.subscriber->whenNext = [&](const auto&) {
        const auto subscription = started.subscriber->subscription.lock();
        started = {};
        subscription->cancel();
    };
    set("key", 1);
    EXPECT_TRUE(observed.expired());
}

TEST_F(WatchLifetime, LastReferenceToTheStoreMayBeDroppedOnAnotherThreadDuringACancel) {
    const Watch started = watch("key");
    auto observed = started.publisher->getCompletionFuture().then([this](Future<bool>&& completed) {
        EXPECT_TRUE(velkor::testing::completes(
            [first = std::move(open), second = std::move(store)]() mutable {
                first.reset();
                second.reset();
            }));
        return completed.get();
    });
    started.subscriber->cancel();
    EXPECT_FALSE(observed.get());
}

TEST_F(WatchLifetime, ManyCyclesOfWatchingLeaveNoPublisherBehind) {
    std::vector<std::weak_ptr<reactive_streams::Publisher>> observed;
    for (int round = 0; round < 1'000; ++round) {
        const Watch started = watch("key");
        observed.emplace_back(started.publisher);
        started.subscriber->cancel();
    }
    for (const auto& publisher : observed) EXPECT_TRUE(publisher.expired());
}

}  // namespace
}  // namespace velkor::configuration
