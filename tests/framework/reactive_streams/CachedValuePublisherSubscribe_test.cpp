#include <gmock/gmock.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"

namespace velkor::reactive_streams {

// Every member of the template has to compile for a second type of value.
template class CachedValuePublisher<std::string, std::function<void()>>;

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using CachedValuePublisherSubscribe = PublisherFixture;

template <class Callable>
std::string refusalOf(Callable&& callable) {
    try {
        callable();
    } catch (const std::invalid_argument& error) {
        return error.what();
    }
    return "accepted";
}

TEST_F(CachedValuePublisherSubscribe, CapacityOfZeroIsRefused) {
    EXPECT_EQ(refusalOf([this] { makeStream(0); }), "A publisher needs a capacity of at least 1.");
}

TEST_F(CachedValuePublisherSubscribe, NullSubscriberIsRefused) {
    EXPECT_EQ(refusalOf([this] { publisher->subscribe(nullptr); }),
              "A subscriber must not be null.");
}

TEST_F(CachedValuePublisherSubscribe, SubscriberMayComeAfterANullOne) {
    EXPECT_THROW(publisher->subscribe(nullptr), std::invalid_argument);
    subscribe(1);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherSubscribe, SecondSubscriberIsRefused) {
    subscribe(0);
    EXPECT_EQ(refusalOf([this] { publisher->subscribe(std::make_shared<Recorder>()); }),
              "Only one subscription allowed.");
}

TEST_F(CachedValuePublisherSubscribe, SameSubscriberIsRefusedTheSecondTime) {
    subscribe(0);
    EXPECT_EQ(refusalOf([this] { publisher->subscribe(subscriber); }),
              "Only one subscription allowed.");
    EXPECT_EQ(subscriber->subscriptions, 1);
}

TEST_F(CachedValuePublisherSubscribe, RefusedSubscriberReceivesNoSignal) {
    subscribe(0);
    const auto second = std::make_shared<Recorder>();
    EXPECT_THROW(publisher->subscribe(second), std::invalid_argument);
    publisher->publish(1);
    publisher.reset();
    EXPECT_EQ(second->subscriptions, 0);
    EXPECT_EQ(second->completions, 0);
}

TEST_F(CachedValuePublisherSubscribe, RefusedSubscriberIsReleased) {
    subscribe(0);
    const auto second = std::make_shared<Recorder>();
    EXPECT_THROW(publisher->subscribe(second), std::invalid_argument);
    EXPECT_EQ(second.use_count(), 1);
}

TEST_F(CachedValuePublisherSubscribe, FirstSubscriberIsServedAfterASecondWasRefused) {
    subscribe(2);
    EXPECT_THROW(publisher->subscribe(std::make_shared<Recorder>()), std::invalid_argument);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherSubscribe, SubscriberAfterACancelledOneIsRefused) {
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(refusalOf([this] { publisher->subscribe(std::make_shared<Recorder>()); }),
              "Only one subscription allowed.");
}

TEST_F(CachedValuePublisherSubscribe, SubscriberAfterTheEndOfAServedStreamIsRefused) {
    subscribe(0);
    publisher->complete();
    EXPECT_EQ(refusalOf([this] { publisher->subscribe(std::make_shared<Recorder>()); }),
              "Only one subscription allowed.");
}

TEST_F(CachedValuePublisherSubscribe, OnSubscribeIsCalledOnceAndFirst) {
    publisher->publish(1);
    subscriber->whenNext = [this](int) { EXPECT_EQ(subscriber->subscriptions, 1); };
    subscribe(1);
    EXPECT_EQ(subscriber->subscriptions, 1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherSubscribe, SubscriptionIsHandedOutWeakly) {
    subscribe(0);
    ASSERT_FALSE(subscriber->subscription.expired());
    publisher.reset();
    EXPECT_TRUE(subscriber->subscription.expired());
}

TEST_F(CachedValuePublisherSubscribe, SubscriptionDoesNotKeepThePublisherAlive) {
    subscribe(0);
    const auto subscription = subscriber->subscription.lock();
    const std::weak_ptr<Stream> observed = publisher;
    publisher.reset();
    EXPECT_TRUE(observed.expired());
    EXPECT_NE(subscription, nullptr);
}

TEST_F(CachedValuePublisherSubscribe, PublisherKeepsItsSubscriberAlive) {
    subscribe(0);
    const std::weak_ptr<Recorder> observed = subscriber;
    subscriber.reset();
    EXPECT_FALSE(observed.expired());
}

TEST_F(CachedValuePublisherSubscribe, RequestInsideOnSubscribeDeliversTheQueuedValue) {
    publisher->publish(1);
    subscriber->whenSubscribed = [this] { subscriber->request(1); };
    subscribe(0);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherSubscribe, CancelInsideOnSubscribeEndsTheStream) {
    publisher->publish(1);
    subscriber->whenSubscribed = [this] { subscriber->cancel(); };
    subscribe(0);
    publisher->publish(2);
    EXPECT_EQ(endings, 1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherSubscribe, NothingIsDeliveredBeforeARequest) {
    publisher->publish(1);
    subscribe(0);
    publisher->publish(2);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherSubscribe, CompletedStreamOpensAndCompletesForALateSubscriber) {
    publisher->complete();
    subscriber->whenComplete = [this] { EXPECT_EQ(subscriber->subscriptions, 1); };
    subscribe(0);
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherSubscribe, FailedStreamOpensAndFailsForALateSubscriber) {
    const auto error = std::make_exception_ptr(std::runtime_error("broken"));
    publisher->fail(error);
    subscriber->whenError = [this] { EXPECT_EQ(subscriber->subscriptions, 1); };
    subscribe(0);
    EXPECT_THAT(subscriber->errors, ElementsAre(error));
    EXPECT_EQ(subscriber->completions, 0);
}

TEST_F(CachedValuePublisherSubscribe, LateSubscriberOfAnEndedStreamDoesNotRunTheHookAgain) {
    publisher->complete();
    subscribe(0);
    EXPECT_EQ(endings, 1);
}

TEST_F(CachedValuePublisherSubscribe, CompletingStreamDeliversToALateSubscriberAndCompletes) {
    publisher->publish(1);
    publisher->complete();
    subscribe(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherSubscribe, ExceptionOfOnSubscribeReachesTheCaller) {
    subscriber->whenSubscribed = [] { throw std::runtime_error("subscribe"); };
    EXPECT_THROW(publisher->subscribe(subscriber), std::runtime_error);
}

TEST_F(CachedValuePublisherSubscribe, SubscriberWhoseOnSubscribeThrewStaysSubscribed) {
    subscriber->whenSubscribed = [] { throw std::runtime_error("subscribe"); };
    EXPECT_THROW(publisher->subscribe(subscriber), std::runtime_error);
    subscriber->request(1);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherSubscribe, PublisherWithoutASharedOwnerCannotBeSubscribed) {
    Stream unowned(1, [] {});
    EXPECT_THROW(unowned.subscribe(subscriber), std::bad_weak_ptr);
    EXPECT_EQ(subscriber->subscriptions, 0);
}

}  // namespace
}  // namespace velkor::reactive_streams
