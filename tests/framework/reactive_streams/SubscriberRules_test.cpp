#include <gmock/gmock.h>

#include <cstdint>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

/// Writes down what a subscriber asks for.
class RecordingSubscription final : public Subscription {
public:
    void request(std::uint64_t n) override { requests.push_back(n); }
    void cancel() override { ++cancels; }

    std::vector<std::uint64_t> requests;
    int cancels = 0;
};

/// The subscriber made of callbacks on one side, the test in the publisher's place on the other.
class SubscriberRules : public ::testing::Test {
protected:
    std::shared_ptr<CallbackSubscriber<int>> makeSubscriber(Demand demand) {
        return std::make_shared<CallbackSubscriber<int>>(
            Callbacks<int>{[this](int value) {
                               values.push_back(value);
                               if (whenValue) whenValue();
                           },
                           [this] { ++completions; },
                           [this](const std::exception_ptr& error) { errors.push_back(error); }},
            demand, link);
    }

    void open() { subscriber->onSubscribe(subscription); }

    std::function<void()> whenValue;
    std::vector<int> values;
    std::vector<std::exception_ptr> errors;
    int completions = 0;
    std::shared_ptr<SubscriptionLink> link = std::make_shared<SubscriptionLink>();
    std::shared_ptr<RecordingSubscription> subscription = std::make_shared<RecordingSubscription>();
    std::shared_ptr<CallbackSubscriber<int>> subscriber = makeSubscriber(Demand::oneAtATime);
};

TEST_F(SubscriberRules, Rule2_1_DemandIsSignalledByRequest) {
    open();
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
    subscriber->onNext(7);
    EXPECT_THAT(subscription->requests, ElementsAre(1U, 1U));
}

TEST_F(SubscriberRules, Rule2_1_UnboundedDemandIsSignalledOnce) {
    subscriber = makeSubscriber(Demand::unbounded);
    open();
    subscriber->onNext(7);
    EXPECT_THAT(subscription->requests, ElementsAre(std::numeric_limits<std::uint64_t>::max()));
}

TEST_F(SubscriberRules, Rule2_2_SubscriberTakesNoLockThatAnotherThreadHoldsDuringACallback) {
    velkor::testing::Latch started;
    velkor::testing::Latch finished;
    bool finishedMeanwhile = false;
    open();
    whenValue = [&] {
        started.countDown();
        finishedMeanwhile = finished.wait();
    };
    std::thread delivering([this] { subscriber->onNext(1); });
    EXPECT_TRUE(started.wait());
    subscriber->onComplete();
    finished.countDown();
    delivering.join();
    EXPECT_TRUE(finishedMeanwhile);
}

TEST_F(SubscriberRules, Rule2_3_CompletionMakesNoCallOnTheSubscription) {
    open();
    subscriber->onComplete();
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
    EXPECT_EQ(subscription->cancels, 0);
}

TEST_F(SubscriberRules, Rule2_3_ErrorMakesNoCallOnTheSubscription) {
    open();
    subscriber->onError(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
    EXPECT_EQ(subscription->cancels, 0);
}

TEST_F(SubscriberRules, Rule2_4_SubscriptionCountsAsCancelledAfterCompletion) {
    open();
    subscriber->onComplete();
    subscriber->onNext(1);
    link->cancel();
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
    EXPECT_EQ(subscription->cancels, 0);
}

TEST_F(SubscriberRules, Rule2_4_SubscriptionCountsAsCancelledAfterAnError) {
    open();
    subscriber->onError(std::make_exception_ptr(std::runtime_error("broken")));
    link->cancel();
    EXPECT_EQ(subscription->cancels, 0);
}

TEST_F(SubscriberRules, Rule2_5_SecondSubscriptionIsCancelled) {
    const auto second = std::make_shared<RecordingSubscription>();
    open();
    subscriber->onSubscribe(second);
    EXPECT_EQ(second->cancels, 1);
    EXPECT_THAT(second->requests, IsEmpty());
    EXPECT_EQ(subscription->cancels, 0);
}

TEST_F(SubscriberRules, Rule2_6_SubscriptionNoLongerNeededIsCancelled) {
    open();
    { const SubscriptionHandle handle(link); }
    EXPECT_EQ(subscription->cancels, 1);
}

TEST_F(SubscriberRules, Rule2_7_RequestFollowsTheCallbackOnTheSameThread) {
    open();
    whenValue = [this] { EXPECT_THAT(subscription->requests, ElementsAre(1U)); };
    subscriber->onNext(1);
    EXPECT_THAT(subscription->requests, ElementsAre(1U, 1U));
}

TEST_F(SubscriberRules, Rule2_8_ValueAfterACancelIsAcceptedAndDropped) {
    open();
    link->cancel();
    subscriber->onNext(1);
    EXPECT_THAT(values, IsEmpty());
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
}

TEST_F(SubscriberRules, Rule2_9_CompletionIsAcceptedWithoutARequest) {
    subscriber->onComplete();
    EXPECT_EQ(completions, 1);
}

TEST_F(SubscriberRules, Rule2_9_CompletionIsAcceptedAfterARequest) {
    open();
    subscriber->onComplete();
    EXPECT_EQ(completions, 1);
}

TEST_F(SubscriberRules, Rule2_10_ErrorIsAcceptedWithoutARequest) {
    subscriber->onError(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(errors.size(), 1U);
}

TEST_F(SubscriberRules, Rule2_10_ErrorIsAcceptedAfterARequest) {
    open();
    subscriber->onError(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(errors.size(), 1U);
}

TEST_F(SubscriberRules, Rule2_11_SignalIsProcessedBeforeItReturns) {
    open();
    subscriber->onNext(1);
    EXPECT_THAT(values, ElementsAre(1));
}

TEST_F(SubscriberRules, Rule2_12_SecondOnSubscribeAsksForNothing) {
    open();
    subscriber->onSubscribe(subscription);
    EXPECT_THAT(subscription->requests, ElementsAre(1U));
}

TEST_F(SubscriberRules, Rule2_13_SignalsReturnNormally) {
    EXPECT_NO_THROW(open());
    EXPECT_NO_THROW(subscriber->onNext(1));
    EXPECT_NO_THROW(subscriber->onComplete());
}

TEST_F(SubscriberRules, Rule2_13_ExceptionOfACallbackPassesOnAndDemandGoesOn) {
    open();
    whenValue = [] { throw std::runtime_error("callback"); };
    EXPECT_THROW(subscriber->onNext(1), std::runtime_error);
    EXPECT_THAT(subscription->requests, ElementsAre(1U, 1U));
}

TEST_F(SubscriberRules, Rule2_13_SubscriptionThatHasGoneIsAccepted) {
    EXPECT_NO_THROW(subscriber->onSubscribe({}));
    EXPECT_NO_THROW(subscriber->onNext(1));
}

}  // namespace
}  // namespace velkor::reactive_streams
