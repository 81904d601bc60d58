#include <gmock/gmock.h>

#include <functional>
#include <memory>
#include <stdexcept>

#include "tests/framework/reactive_streams/EndTesting.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;

using CachedValuePublisherComplete = PublisherFixture;
using CachedValuePublisherCompleteOrder = OrderedEnd;

TEST_F(CachedValuePublisherComplete, StreamWithNothingQueuedEndsAtOnce) {
    auto completed = publisher->getCompletionFuture();
    subscribe(0);
    publisher->complete();
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(completed.get());
}

TEST_F(CachedValuePublisherComplete, StreamWithoutSubscriberEnds) {
    publisher->complete();
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherCompleteOrder, FutureComesFirstThenTheSubscriberThenTheHook) {
    subscribe(0);
    publisher->complete();
    EXPECT_THAT(steps, ElementsAre("future", "onComplete", "hook"));
}

TEST_F(CachedValuePublisherComplete, SecondCallDoesNothing) {
    subscribe(0);
    publisher->complete();
    publisher->complete();
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherComplete, QueuedValueIsWaitedFor) {
    publisher->publish(1);
    subscribe(0);
    publisher->complete();
    EXPECT_EQ(subscriber->completions, 0);
    EXPECT_EQ(endings, 0);
}

TEST_F(CachedValuePublisherComplete, RequestForTheLastQueuedValueCompletes) {
    publisher->publish(1);
    subscribe(0);
    publisher->complete();
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherComplete, SecondCallDoesNotCutTheQueuedValuesOff) {
    publisher->publish(1);
    publisher->complete();
    publisher->complete();
    subscribe(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherComplete, PartOfTheQueueDoesNotComplete) {
    publisher = makeStream(2);
    publisher->publish(1);
    publisher->publish(2);
    publisher->complete();
    subscribe(1);
    EXPECT_EQ(subscriber->completions, 0);
    subscriber->request(1);
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherComplete, CompletingStreamKeepsToItsCapacity) {
    publisher->publish(1);
    publisher->complete();
    publisher->publish(2);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(2));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherComplete, RequestInsideTheLastOnNextCompletesNested) {
    publisher->publish(1);
    publisher->complete();
    subscriber->whenNext = [this](int) {
        subscriber->request(1);
        EXPECT_EQ(subscriber->completions, 1);
    };
    subscribe(1);
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherComplete, CompleteInsideADirectDeliveryEndsTheStream) {
    subscriber->whenNext = [this](int) { publisher->complete(); };
    subscribe(allValues);
    publisher->publish(1);
    publisher->publish(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherComplete, CompleteInsideADrainedDeliveryWaitsForTheRestOfTheQueue) {
    publisher = makeStream(3);
    for (int value = 1; value <= 3; ++value) publisher->publish(value);
    subscriber->whenNext = [this](int value) {
        if (value == 1) publisher->complete();
        EXPECT_EQ(subscriber->completions, 0);
    };
    subscribe(3);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherComplete, ValuePublishedWhileTheLastOneIsDeliveredStillArrives) {
    publisher->publish(1);
    publisher->complete();
    subscriber->whenNext = [this](int value) {
        if (value == 1) publisher->publish(2);
    };
    subscribe(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherComplete, ExceptionOfOnCompleteReachesTheCallerAfterTheHook) {
    subscriber->whenComplete = [] { throw std::runtime_error("complete"); };
    subscribe(0);
    EXPECT_EQ(errorOf([this] { publisher->complete(); }), "complete");
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(publisher->getCompletionFuture().get());
}

TEST_F(CachedValuePublisherComplete, ExceptionOfTheHookReachesTheCaller) {
    whenDone = [] { throw std::runtime_error("hook"); };
    EXPECT_EQ(errorOf([this] { publisher->complete(); }), "hook");
}

TEST_F(CachedValuePublisherComplete, EmptyHookThrowsBadFunctionCall) {
    publisher = std::make_shared<Stream>(1, std::function<void()>());
    EXPECT_THROW(publisher->complete(), std::bad_function_call);
}

TEST_F(CachedValuePublisherComplete, PublisherWithoutASharedOwnerCompletes) {
    {
        Stream unowned(1, [this] { ++endings; });
        unowned.complete();
    }
    EXPECT_EQ(endings, 1);
}

}  // namespace
}  // namespace velkor::reactive_streams
