#include <gmock/gmock.h>

#include <thread>

#include "tests/framework/reactive_streams/EndTesting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::IsEmpty;

using CachedValuePublisherFuture = PublisherFixture;

TEST_F(CachedValuePublisherFuture, IsPendingWhileTheStreamIsOpen) {
    bool settled = false;
    auto observed = publisher->getCompletionFuture().then([&](Future<bool>&&) {
        settled = true;
        return true;
    });
    subscribe(allValues);
    publisher->publish(1);
    EXPECT_FALSE(settled);
    publisher->complete();
    EXPECT_TRUE(settled);
}

TEST_F(CachedValuePublisherFuture, IsGivenOutOnce) {
    const auto first = publisher->getCompletionFuture();
    EXPECT_EQ(errorOf([this] { publisher->getCompletionFuture(); }),
              "Promise already returned a future.");
}

TEST_F(CachedValuePublisherFuture, IsGivenOutOnceAfterTheEndToo) {
    publisher->complete();
    const auto first = publisher->getCompletionFuture();
    EXPECT_EQ(errorOf([this] { publisher->getCompletionFuture(); }),
              "Promise already returned a future.");
}

TEST_F(CachedValuePublisherFuture, CanBeHadOnceMoreAfterAContinuationRan) {
    auto observed = publisher->getCompletionFuture().then([](Future<bool>&&) { return true; });
    publisher->complete();
    EXPECT_TRUE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherFuture, MayBeDropped) {
    { const auto dropped = publisher->getCompletionFuture(); }
    subscribe(0);
    publisher->complete();
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherFuture, MayBeCancelled) {
    auto completed = publisher->getCompletionFuture();
    completed.cancel();
    publisher->complete();
    EXPECT_EQ(endings, 1);
    EXPECT_EQ(errorOf([&] { completed.get(); }), "Future has been cancelled.");
}

TEST_F(CachedValuePublisherFuture, WakesAWaiterOnAnotherThread) {
    auto completed = publisher->getCompletionFuture();
    bool result = false;
    velkor::testing::Latch waiting;
    std::thread waiter([&] {
        waiting.countDown();
        result = completed.get();
    });
    EXPECT_TRUE(waiting.wait());
    publisher->complete();
    waiter.join();
    EXPECT_TRUE(result);
}

TEST_F(CachedValuePublisherFuture, ContinuationMayCallAnythingOnThePublisher) {
    subscribe(allValues);
    auto observed = publisher->getCompletionFuture().then([this](Future<bool>&& completed) {
        publisher->publish(1);
        publisher->complete();
        publisher->fail(broken());
        subscriber->request(1);
        subscriber->cancel();
        return completed.get();
    });
    publisher->complete();
    EXPECT_TRUE(observed.get());
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_THAT(subscriber->values, IsEmpty());
    EXPECT_EQ(endings, 1);
}

}  // namespace
}  // namespace velkor::reactive_streams
