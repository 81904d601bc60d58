#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <utility>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/framework/reactive_streams/TrackedValue.hpp"

namespace velkor::reactive_streams {
namespace {

/// The publisher's only owner lets go of it from inside a call that the publisher makes. The
/// address sanitizer finds what is touched afterwards.
class CachedValuePublisherLifetime : public PublisherFixture {
protected:
    std::function<void()> dropPublisher() {
        return [this] { publisher.reset(); };
    }

    std::weak_ptr<Stream> observed = publisher;
};

TEST_F(CachedValuePublisherLifetime, OnSubscribeMayDropThePublisher) {
    subscriber->whenSubscribed = dropPublisher();
    Stream& stream = *publisher;
    stream.subscribe(subscriber);
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherLifetime, DirectDeliveryMayDropThePublisher) {
    subscriber->whenNext = [this](int) { publisher.reset(); };
    subscribe(allValues);
    Stream& stream = *publisher;
    stream.publish(1);
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherLifetime, DrainedDeliveryMayDropThePublisher) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) { publisher.reset(); };
    subscribe(0);
    subscriber->request(1);
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherLifetime, DeliveryAfterOnSubscribeMayDropThePublisher) {
    publisher->publish(1);
    subscriber->firstRequest = 1;
    subscriber->whenNext = [this](int) { publisher.reset(); };
    Stream& stream = *publisher;
    stream.subscribe(subscriber);
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherLifetime, DropThatThrowsAfterwardsLeavesNothingBehind) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) {
        publisher.reset();
        throw std::runtime_error("next");
    };
    subscribe(0);
    EXPECT_THROW(subscriber->request(1), std::runtime_error);
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherLifetime, OnCompleteMayDropThePublisher) {
    subscriber->whenComplete = dropPublisher();
    subscribe(0);
    Stream& stream = *publisher;
    stream.complete();
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherLifetime, OnErrorMayDropThePublisher) {
    subscriber->whenError = dropPublisher();
    subscribe(0);
    Stream& stream = *publisher;
    stream.fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherLifetime, HookOfACancelMayDropThePublisher) {
    whenDone = dropPublisher();
    subscribe(0);
    subscriber->cancel();
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherLifetime, HookOfACompletionMayDropThePublisher) {
    whenDone = dropPublisher();
    Stream& stream = *publisher;
    stream.complete();
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherLifetime, ContinuationMayDropThePublisher) {
    auto dropped = publisher->getCompletionFuture().then([this](Future<bool>&& completed) {
        publisher.reset();
        return completed.get();
    });
    subscribe(0);
    subscriber->cancel();
    EXPECT_TRUE(observed.expired());
    EXPECT_FALSE(dropped.get());
}

TEST_F(CachedValuePublisherLifetime, SubscriberThatCancelsDuringADeliveryLivesUntilItsEnd) {
    const std::weak_ptr<Recorder> recorder = subscriber;
    bool aliveAfterCancel = false;
    subscriber->whenNext = [&](int) {
        const auto subscription = subscriber->subscription.lock();
        subscriber.reset();
        subscription->cancel();
        aliveAfterCancel = !recorder.expired();
    };
    subscribe(1);
    publisher->publish(1);
    EXPECT_TRUE(aliveAfterCancel);
    EXPECT_TRUE(recorder.expired());
}

TEST_F(CachedValuePublisherLifetime, SubscriptionThatOthersHoldOutlivesThePublisher) {
    subscriber->whenNext = [this](int) { publisher.reset(); };
    subscribe(1);
    const auto subscription = subscriber->subscription.lock();
    Stream& stream = *publisher;
    stream.publish(1);
    EXPECT_NO_THROW(subscription->request(1));
    EXPECT_NO_THROW(subscription->cancel());
}

TEST_F(CachedValuePublisherLifetime, SubscriberMayOwnThePublisher) {
    subscriber->whenNext = [owned = publisher](int) {};
    subscribe(1);
    publisher->publish(1);
    publisher.reset();
    EXPECT_FALSE(observed.expired());
    // Only the cancel opens the cycle that the subscriber has made.
    subscriber->cancel();
    subscriber.reset();
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherLifetime, SubscriberReleasedByACancelMayOwnThePublisher) {
    subscriber->whenComplete = [owned = publisher] {};
    subscribe(0);
    const auto subscription = subscriber->subscription.lock();
    publisher.reset();
    subscriber.reset();
    subscription->cancel();
    EXPECT_TRUE(observed.expired());
}

class CachedValuePublisherValueLifetime : public ::testing::Test {
protected:
    using Stream = StreamOf<TrackedValue>;

    TrackedValue value(int number) const { return {log, number}; }

    std::shared_ptr<ValueLog> log = std::make_shared<ValueLog>();
    std::shared_ptr<Stream> publisher = std::make_shared<Stream>(1, [] {});
    std::weak_ptr<Stream> observed = publisher;
};

TEST_F(CachedValuePublisherValueLifetime, DestructorOfAReplacedValueMayDropThePublisher) {
    publisher->publish(value(1));
    const TrackedValue newer = value(2);
    log->whenDestroyed = [this] { publisher.reset(); };
    Stream& stream = *publisher;
    stream.publish(newer);
    log->whenDestroyed = nullptr;
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherValueLifetime, DestructorOfACancelledValueMayDropThePublisher) {
    const auto subscriber = std::make_shared<velkor::testing::RecordingSubscriber<TrackedValue>>();
    publisher->subscribe(subscriber);
    publisher->publish(value(1));
    log->whenDestroyed = [this] { publisher.reset(); };
    subscriber->cancel();
    EXPECT_TRUE(observed.expired());
}

TEST_F(CachedValuePublisherValueLifetime, DestructorOfAFailedValueMayDropThePublisher) {
    publisher->publish(value(1));
    log->whenDestroyed = [this] { publisher.reset(); };
    Stream& stream = *publisher;
    stream.fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_TRUE(observed.expired());
}

}  // namespace
}  // namespace velkor::reactive_streams
