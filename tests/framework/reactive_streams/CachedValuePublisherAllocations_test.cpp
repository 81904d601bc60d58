#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::reactive_streams {
namespace {

using velkor::testing::countAllocations;

/// Takes every value and keeps none.
template <class T>
class Sink final : public Subscriber<T> {
public:
    using Subscriber<T>::onNext;
    void onSubscribe(std::weak_ptr<Subscription> opened) override {
        subscription = std::move(opened);
    }
    void onComplete() override {}
    void onNext(T&&) override { ++received; }
    void onError(const std::exception_ptr&) override {}

    std::weak_ptr<Subscription> subscription;
    int received = 0;
};

template <class T>
class CachedValuePublisherAllocations : public ::testing::Test {
protected:
    void waitForValues() {
        publisher->subscribe(sink);
        sink->subscription.lock()->request(velkor::testing::allValues);
    }

    std::shared_ptr<StreamOf<T>> publisher = std::make_shared<StreamOf<T>>(1, [] {});
    std::shared_ptr<Sink<T>> sink = std::make_shared<Sink<T>>();
};

using CachedValuePublisherNumberAllocations = CachedValuePublisherAllocations<int>;
using CachedValuePublisherTextAllocations = CachedValuePublisherAllocations<std::string>;

TEST_F(CachedValuePublisherNumberAllocations, DeliveryToAWaitingSubscriberAllocatesNothing) {
    waitForValues();
    EXPECT_EQ(countAllocations([this] { publisher->publish(1); }), 0U);
    EXPECT_EQ(sink->received, 1);
}

TEST_F(CachedValuePublisherTextAllocations, DeliveryToAWaitingSubscriberAllocatesTheCopyOnly) {
    const std::string text(1000, 'x');
    waitForValues();
    EXPECT_EQ(countAllocations([&] { publisher->publish(text); }), 1U);
    EXPECT_EQ(sink->received, 1);
}

TEST_F(CachedValuePublisherNumberAllocations, ValueThatIsKeptTakesOneAllocation) {
    EXPECT_EQ(countAllocations([this] { publisher->publish(1); }), 1U);
}

TEST_F(CachedValuePublisherNumberAllocations, ValueForAnEndedStreamAllocatesNothing) {
    publisher->complete();
    EXPECT_EQ(countAllocations([this] { publisher->publish(1); }), 0U);
}

TEST_F(CachedValuePublisherNumberAllocations, SubscribeAllocatesTheSubscriptionOnly) {
    EXPECT_EQ(countAllocations([this] { publisher->subscribe(sink); }), 1U);
}

TEST_F(CachedValuePublisherNumberAllocations, RequestAndCancelAllocateNothing) {
    publisher->publish(1);
    publisher->subscribe(sink);
    const auto subscription = sink->subscription.lock();
    EXPECT_EQ(countAllocations([&] {
                  subscription->request(1);
                  subscription->cancel();
              }),
              0U);
}

TEST_F(CachedValuePublisherNumberAllocations, FailedAllocationOfAKeptValueLeavesTheStreamUsable) {
    {
        const velkor::testing::AllocationFailure failure(0);
        EXPECT_THROW(publisher->publish(1), std::bad_alloc);
    }
    publisher->publish(2);
    waitForValues();
    EXPECT_EQ(sink->received, 1);
}

TEST_F(CachedValuePublisherNumberAllocations, FailedSubscriptionLeavesThePublisherFree) {
    {
        const velkor::testing::AllocationFailure failure(0);
        EXPECT_THROW(publisher->subscribe(sink), std::bad_alloc);
    }
    EXPECT_NO_THROW(publisher->subscribe(sink));
}

}  // namespace
}  // namespace velkor::reactive_streams
