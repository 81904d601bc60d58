#include <gmock/gmock.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using CachedValuePublisherCancel = PublisherFixture;

TEST_F(CachedValuePublisherCancel, CompletionFutureYieldsFalse) {
    auto completed = publisher->getCompletionFuture();
    subscribe(0);
    subscriber->cancel();
    EXPECT_FALSE(completed.get());
}

TEST_F(CachedValuePublisherCancel, CompletionFutureAskedForAfterwardsYieldsFalse) {
    subscribe(0);
    subscriber->cancel();
    EXPECT_FALSE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherCancel, HookRunsOnce) {
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(endings, 1);
    subscriber->cancel();
    publisher.reset();
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, SubscriberIsNotToldOfItsOwnCancel) {
    subscribe(0);
    subscriber->cancel();
    publisher.reset();
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_THAT(subscriber->errors, IsEmpty());
}

TEST_F(CachedValuePublisherCancel, FutureIsSettledBeforeTheHookRuns) {
    std::vector<std::string> steps;
    auto observed = publisher->getCompletionFuture().then([&](Future<bool>&& completed) {
        steps.push_back("future");
        return completed.get();
    });
    whenDone = [&] { steps.push_back("hook"); };
    subscribe(0);
    subscriber->cancel();
    EXPECT_THAT(steps, ElementsAre("future", "hook"));
}

TEST_F(CachedValuePublisherCancel, SubscriberIsReleased) {
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(subscriber.use_count(), 1);
}

TEST_F(CachedValuePublisherCancel, SubscriberIsReleasedAfterTheRunningDelivery) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) { subscriber->cancel(); };
    subscribe(1);
    EXPECT_EQ(subscriber.use_count(), 1);
}

TEST_F(CachedValuePublisherCancel, SubscriberIsReleasedAfterADeliveryThatCancelsAndThrows) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) {
        subscriber->cancel();
        throw std::runtime_error("next");
    };
    subscribe(0);
    EXPECT_THROW(subscriber->request(1), std::runtime_error);
    EXPECT_EQ(subscriber.use_count(), 1);
}

TEST_F(CachedValuePublisherCancel, CancelInsideADirectDeliveryEndsTheStream) {
    subscriber->whenNext = [this](int) { subscriber->cancel(); };
    subscribe(allValues);
    publisher->publish(1);
    publisher->publish(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelDuringOnNextStillDeliversWhatWasQueuedWithinTheDemand) {
    publisher = makeStream(4);
    for (int value = 1; value <= 4; ++value) publisher->publish(value);
    subscriber->whenNext = [this](int value) {
        if (value == 1) subscriber->cancel();
    };
    subscribe(3);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherCancel, NothingIsQueuedOnceTheCancelHasBeenSeen) {
    publisher = makeStream(4);
    publisher->publish(1);
    publisher->publish(2);
    subscriber->whenNext = [this](int value) {
        if (value == 1) subscriber->cancel();
        publisher->publish(9);
    };
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(CachedValuePublisherCancel, HookRunsDuringTheDeliveryThatCancels) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) {
        subscriber->cancel();
        EXPECT_EQ(endings, 1);
    };
    subscribe(1);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CompletingStreamCanBeCancelled) {
    subscribe(0);
    publisher->publish(1);
    publisher->complete();
    subscriber->cancel();
    EXPECT_FALSE(publisher->getCompletionFuture().get());
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelAfterCompletionChangesNothing) {
    subscribe(0);
    publisher->complete();
    subscriber->cancel();
    EXPECT_TRUE(publisher->getCompletionFuture().get());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelAfterFailureChangesNothing) {
    subscribe(0);
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    subscriber->cancel();
    EXPECT_THROW(publisher->getCompletionFuture().get(), std::runtime_error);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelInsideOnCompleteChangesNothing) {
    subscriber->whenComplete = [this] { subscriber->cancel(); };
    subscribe(0);
    publisher->complete();
    EXPECT_TRUE(publisher->getCompletionFuture().get());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelInsideTheHookChangesNothing) {
    whenDone = [this] { subscriber->cancel(); };
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, CancelAfterThePublisherHasGoneDoesNothing) {
    subscribe(0);
    const auto subscription = subscriber->subscription.lock();
    publisher.reset();
    subscription->cancel();
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherCancel, ExceptionOfTheHookReachesTheCaller) {
    whenDone = [] { throw std::runtime_error("hook"); };
    subscribe(0);
    EXPECT_THROW(subscriber->cancel(), std::runtime_error);
    EXPECT_FALSE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherCancel, EmptyHookThrowsBadFunctionCall) {
    publisher = std::make_shared<Stream>(1, std::function<void()>());
    subscribe(0);
    EXPECT_THROW(subscriber->cancel(), std::bad_function_call);
}

TEST_F(CachedValuePublisherCancel, CancelDoesNotWaitForADeliveryOnAnotherThread) {
    velkor::testing::Latch started;
    velkor::testing::Latch cancelled;
    bool cancelledMeanwhile = false;
    subscriber->whenNext = [&](int) {
        started.countDown();
        cancelledMeanwhile = cancelled.wait();
    };
    subscribe(1);
    std::thread publishing([this] { publisher->publish(1); });
    EXPECT_TRUE(started.wait());
    subscriber->cancel();
    cancelled.countDown();
    publishing.join();
    EXPECT_TRUE(cancelledMeanwhile);
}

}  // namespace
}  // namespace velkor::reactive_streams
