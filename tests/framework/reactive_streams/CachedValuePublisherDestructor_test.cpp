#include <gmock/gmock.h>

#include <functional>
#include <memory>
#include <stdexcept>

#include "tests/framework/reactive_streams/EndTesting.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::IsEmpty;

using CachedValuePublisherDestructor = PublisherFixture;

TEST_F(CachedValuePublisherDestructor, CompletesTheStream) {
    auto completed = publisher->getCompletionFuture();
    subscribe(0);
    publisher.reset();
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(completed.get());
}

TEST_F(CachedValuePublisherDestructor, WithoutSubscriberRunsTheHook) {
    auto completed = publisher->getCompletionFuture();
    publisher.reset();
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(completed.get());
}

TEST_F(CachedValuePublisherDestructor, DoesNotDeliverWhatIsQueued) {
    publisher->publish(1);
    subscribe(0);
    publisher.reset();
    EXPECT_THAT(subscriber->values, IsEmpty());
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherDestructor, CompletesACompletingStream) {
    auto completed = publisher->getCompletionFuture();
    publisher->publish(1);
    subscribe(0);
    publisher->complete();
    publisher.reset();
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
    EXPECT_TRUE(completed.get());
}

TEST_F(CachedValuePublisherDestructor, CompletedStreamIsNotSignalledAgain) {
    subscribe(0);
    publisher->complete();
    publisher.reset();
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherDestructor, ReleasesTheSubscriber) {
    subscribe(0);
    publisher.reset();
    EXPECT_EQ(subscriber.use_count(), 1);
}

TEST_F(CachedValuePublisherDestructor, DropsTheExceptionOfOnCompleteAndStillRunsTheHook) {
    subscriber->whenComplete = [] { throw std::runtime_error("complete"); };
    subscribe(0);
    EXPECT_NO_THROW(publisher.reset());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherDestructor, DropsTheExceptionOfTheHook) {
    whenDone = [] { throw std::runtime_error("hook"); };
    subscribe(0);
    EXPECT_NO_THROW(publisher.reset());
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherDestructor, DropsTheErrorOfAnEmptyHook) {
    publisher = std::make_shared<Stream>(1, std::function<void()>());
    EXPECT_NO_THROW(publisher.reset());
}

TEST_F(CachedValuePublisherDestructor, SubscriberMayUseItsSubscriptionDuringOnComplete) {
    bool gone = false;
    subscriber->whenComplete = [&] {
        const auto subscription = subscriber->subscription.lock();
        ASSERT_NE(subscription, nullptr);
        subscription->request(1);
        subscription->cancel();
        gone = true;
    };
    subscribe(0);
    publisher.reset();
    EXPECT_TRUE(gone);
    EXPECT_EQ(endings, 1);
}

}  // namespace
}  // namespace velkor::reactive_streams
