#include <gmock/gmock.h>

#include <stdexcept>

#include "tests/framework/reactive_streams/EndTesting.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using CachedValuePublisherFail = PublisherFixture;
using CachedValuePublisherFailOrder = OrderedEnd;

TEST_F(CachedValuePublisherFail, SubscriberReceivesTheErrorOnce) {
    const auto error = broken();
    subscribe(0);
    publisher->fail(error);
    EXPECT_THAT(subscriber->errors, ElementsAre(error));
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherFail, CompletionFutureFailsWithTheError) {
    auto completed = publisher->getCompletionFuture();
    publisher->fail(broken());
    EXPECT_EQ(errorOf([&] { completed.get(); }), "broken");
}

TEST_F(CachedValuePublisherFail, CompletionFutureAskedForAfterwardsFailsWithTheError) {
    publisher->fail(broken());
    EXPECT_EQ(errorOf([this] { publisher->getCompletionFuture().get(); }), "broken");
}

TEST_F(CachedValuePublisherFailOrder, FutureComesFirstThenTheSubscriberThenTheHook) {
    subscribe(0);
    publisher->fail(broken());
    EXPECT_THAT(steps, ElementsAre("future", "onError", "hook"));
}

TEST_F(CachedValuePublisherFail, QueuedValueIsDropped) {
    publisher->publish(1);
    subscribe(0);
    publisher->fail(broken());
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherFail, CompletingStreamCanFail) {
    publisher->publish(1);
    subscribe(0);
    publisher->complete();
    publisher->fail(broken());
    EXPECT_EQ(subscriber->errors.size(), 1U);
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherFail, FailInsideADrainedDeliveryDropsTheRestOfTheQueue) {
    publisher = makeStream(3);
    for (int value = 1; value <= 3; ++value) publisher->publish(value);
    subscriber->whenNext = [this](int) { publisher->fail(broken()); };
    subscribe(3);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(subscriber->errors.size(), 1U);
}

TEST_F(CachedValuePublisherFail, SecondCallDoesNothing) {
    subscribe(0);
    publisher->fail(broken());
    publisher->fail(broken());
    EXPECT_EQ(subscriber->errors.size(), 1U);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherFail, CompletedStreamStaysCompleted) {
    subscribe(0);
    publisher->complete();
    publisher->fail(broken());
    EXPECT_THAT(subscriber->errors, IsEmpty());
    EXPECT_TRUE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherFail, CancelledStreamStaysCancelled) {
    subscribe(0);
    subscriber->cancel();
    publisher->fail(broken());
    EXPECT_THAT(subscriber->errors, IsEmpty());
    EXPECT_FALSE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherFail, FailedStreamIsNotCompleted) {
    subscribe(0);
    publisher->fail(broken());
    publisher->complete();
    publisher.reset();
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherFail, NullErrorIsRefused) {
    EXPECT_EQ(errorOf([this] { publisher->fail(nullptr); }),
              "A promise can't be resolved with a null exception.");
    EXPECT_THROW(publisher->fail(nullptr), std::invalid_argument);
}

TEST_F(CachedValuePublisherFail, RefusedErrorLeavesTheStreamOpen) {
    subscribe(1);
    EXPECT_THROW(publisher->fail(nullptr), std::invalid_argument);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(endings, 0);
}

TEST_F(CachedValuePublisherFail, ExceptionOfOnErrorReachesTheCallerAfterTheHook) {
    subscriber->whenError = [] { throw std::logic_error("error"); };
    subscribe(0);
    EXPECT_EQ(errorOf([this] { publisher->fail(broken()); }), "error");
    EXPECT_EQ(endings, 1);
}

}  // namespace
}  // namespace velkor::reactive_streams
