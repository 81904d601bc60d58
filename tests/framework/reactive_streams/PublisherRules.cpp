#include "tests/framework/reactive_streams/PublisherRules.hpp"

#include <algorithm>
#include <limits>
#include <stdexcept>
#include <thread>
#include <utility>

#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {

namespace {

using Numbers = std::vector<int>;

std::exception_ptr broken() {
    return std::make_exception_ptr(std::runtime_error("broken"));
}

template <class Callable>
bool isRefused(Callable&& callable) {
    try {
        callable();
    } catch (const std::invalid_argument&) {
        return true;
    }
    return false;
}

void deliversNoMoreThanRequested(Examination& exam) {
    exam.subscribe(2);
    exam.publish(1, 5);
    exam.require(exam.subscriber->values.size() <= 2, "two values requested, more delivered");
}

void mayDeliverLessThanRequestedAndEnd(Examination& exam) {
    exam.subscribe(10);
    exam.publish(1, 2);
    exam.stream.complete();
    exam.require(exam.subscriber->values == Numbers{1, 2}, "both values delivered");
    exam.require(exam.subscriber->completions == 1, "completed with demand left");
}

void deliveriesOfQueuedValuesDoNotOverlap(Examination& exam) {
    int depth = 0;
    exam.subscriber->whenNext = [&](int) {
        exam.require(++depth == 1, "one delivery at a time");
        exam.subscriber->request(1);
        --depth;
    };
    exam.publish(1, 5);
    exam.subscribe(2);
}

void failureIsSignalledAsAnError(Examination& exam) {
    const auto error = broken();
    exam.subscribe(1);
    exam.stream.fail(error);
    exam.require(exam.subscriber->errors == std::vector<std::exception_ptr>{error},
                 "the error signalled once");
}

void completionIsSignalled(Examination& exam) {
    exam.subscribe(0);
    exam.stream.complete();
    exam.require(exam.subscriber->completions == 1, "completion signalled once");
}

void endRevokesTheSubscription(Examination& exam) {
    exam.subscribe(1);
    exam.stream.complete();
    if (const auto subscription = exam.subscriber->subscription.lock()) subscription->request(5);
    exam.publish(1, 1);
    exam.require(exam.subscriber->values.empty(), "no value after the end");
}

void nothingFollowsCompletion(Examination& exam) {
    exam.subscribe(5);
    exam.stream.complete();
    exam.publish(1, 2);
    exam.stream.complete();
    exam.stream.fail(broken());
    exam.require(exam.subscriber->values.empty(), "no value after completion");
    exam.require(exam.subscriber->completions == 1, "one completion");
    exam.require(exam.subscriber->errors.empty(), "no error after completion");
}

void nothingFollowsAnError(Examination& exam) {
    exam.subscribe(5);
    exam.stream.fail(broken());
    exam.publish(1, 2);
    exam.stream.fail(broken());
    exam.stream.complete();
    exam.require(exam.subscriber->values.empty(), "no value after the error");
    exam.require(exam.subscriber->completions == 0, "no completion after the error");
    exam.require(exam.subscriber->errors.size() == 1, "one error");
}

void cancelStopsTheSignals(Examination& exam) {
    exam.subscribe(5);
    exam.subscriber->cancel();
    exam.publish(1, 2);
    exam.stream.complete();
    exam.require(exam.subscriber->values.empty(), "no value after the cancel");
    exam.require(exam.subscriber->completions == 0, "no completion after the cancel");
}

void onSubscribeIsTheFirstSignal(Examination& exam) {
    exam.subscriber->whenNext = [&](int) {
        exam.require(exam.subscriber->subscriptions == 1, "subscribed before the first value");
    };
    exam.publish(1, 1);
    exam.subscribe(1);
    exam.require(exam.subscriber->subscriptions == 1, "subscribed once");
}

void endedStreamSignalsOnSubscribeFirst(Examination& exam) {
    exam.stream.complete();
    exam.subscriber->whenComplete = [&] {
        exam.require(exam.subscriber->subscriptions == 1, "subscribed before the completion");
    };
    exam.subscribe(0);
    exam.require(exam.subscriber->completions == 1, "completion signalled to a late subscriber");
}

void nullSubscriberIsRefused(Examination& exam) {
    exam.require(isRefused([&] { exam.stream.publisher->subscribe(nullptr); }),
                 "a null subscriber refused by an exception");
}

void sameSubscriberIsRefusedTheSecondTime(Examination& exam) {
    exam.subscribe(0);
    exam.require(isRefused([&] { exam.stream.publisher->subscribe(exam.subscriber); }),
                 "the same subscriber refused by an exception");
    exam.require(exam.subscriber->subscriptions == 1, "subscribed once");
}

void secondSubscriberIsRefused(Examination& exam) {
    exam.subscribe(1);
    const auto second = std::make_shared<velkor::testing::RecordingSubscriber<int>>(5);
    exam.require(isRefused([&] { exam.stream.publisher->subscribe(second); }),
                 "a second subscriber refused by an exception");
    exam.publish(1, 1);
    exam.require(exam.subscriber->values == Numbers{1}, "the first subscriber served");
    exam.require(second->subscriptions == 0, "no signal to the second subscriber");
}

void anotherThreadMayRequest(Examination& exam) {
    exam.publish(1, 1);
    exam.subscribe(0);
    std::thread([&] { exam.subscriber->request(1); }).join();
    exam.require(exam.subscriber->values == Numbers{1}, "the value delivered");
}

void requestWorksInsideSignals(Examination& exam) {
    exam.subscriber->whenSubscribed = [&] { exam.subscriber->request(1); };
    exam.subscriber->whenNext = [&](int) { exam.subscriber->request(1); };
    exam.publish(1, 3);
    exam.subscribe(0);
    exam.require(exam.subscriber->values == Numbers{1, 2, 3}, "all values delivered");
}

void requestInsideOnNextDoesNotRecurse(Examination& exam) {
    int depth = 0;
    int deepest = 0;
    exam.subscriber->whenNext = [&](int) {
        deepest = std::max(deepest, ++depth);
        exam.subscriber->request(1);
        --depth;
    };
    exam.publish(1, 8);
    exam.subscribe(1);
    exam.require(exam.subscriber->values.size() == 8, "all values delivered");
    exam.require(deepest == 1, "no recursion");
}

void requestReturnsWhileADeliveryRuns(Examination& exam) {
    exam.subscriber->whenNext = [&](int) {
        exam.require(exam.completesElsewhere([subscription = exam.subscriber->subscription.lock()] {
            subscription->request(1);
        }),
                     "request on another thread returns during a delivery");
    };
    exam.subscribe(1);
    exam.publish(1, 1);
}

void cancelReturnsWhileADeliveryRuns(Examination& exam) {
    exam.subscriber->whenNext = [&](int) {
        exam.require(exam.completesElsewhere([subscription = exam.subscriber->subscription.lock()] {
            subscription->cancel();
        }),
                     "cancel on another thread returns during a delivery");
    };
    exam.subscribe(1);
    exam.publish(1, 1);
}

void requestAfterCancelDoesNothing(Examination& exam) {
    exam.publish(1, 2);
    exam.subscribe(0);
    const auto subscription = exam.subscriber->subscription.lock();
    subscription->cancel();
    subscription->request(2);
    exam.require(exam.subscriber->values.empty(), "nothing delivered");
}

void cancelAfterCancelDoesNothing(Examination& exam) {
    exam.subscribe(1);
    const auto subscription = exam.subscriber->subscription.lock();
    subscription->cancel();
    subscription->cancel();
    exam.publish(1, 1);
    exam.require(exam.subscriber->values.empty(), "nothing delivered");
    exam.require(!exam.stream.publisher->getCompletionFuture().get(), "cancelled");
}

void requestsAddUp(Examination& exam) {
    exam.subscribe(1);
    exam.subscriber->request(2);
    exam.publish(1, 5);
    exam.require(exam.subscriber->values == Numbers{1, 2, 3}, "one and two values delivered");
}

void requestMayDeliverBeforeItReturns(Examination& exam) {
    exam.publish(1, 2);
    exam.subscribe(0);
    exam.subscriber->request(2);
    exam.require(exam.subscriber->values == Numbers{1, 2}, "delivered by the request");
}

void requestMayEndTheStreamBeforeItReturns(Examination& exam) {
    exam.publish(1, 1);
    exam.stream.complete();
    exam.subscribe(0);
    exam.require(exam.subscriber->completions == 0, "open while a value is queued");
    exam.subscriber->request(1);
    exam.require(exam.subscriber->completions == 1, "completed by the request");
}

void cancelForgetsTheDemand(Examination& exam) {
    exam.subscribe(3);
    exam.publish(1, 1);
    exam.subscriber->cancel();
    exam.publish(2, 3);
    exam.require(exam.subscriber->values == Numbers{1}, "nothing delivered after the cancel");
}

void cancelReleasesTheSubscriber(Examination& exam) {
    exam.subscribe(1);
    exam.subscriber->cancel();
    exam.require(exam.subscriber.use_count() == 1, "no reference kept");
}

void cancelEndsTheStream(Examination& exam) {
    exam.subscribe(1);
    exam.subscriber->cancel();
    exam.require(!exam.stream.publisher->getCompletionFuture().get(), "ended as cancelled");
}

void cancelReturnsNormallyInEveryState(Examination& exam) {
    exam.subscribe(1);
    const auto subscription = exam.subscriber->subscription.lock();
    exam.stream.complete();
    subscription->cancel();
    exam.stream = {};
    subscription->cancel();
}

void requestReturnsNormallyInEveryState(Examination& exam) {
    exam.subscribe(1);
    const auto subscription = exam.subscriber->subscription.lock();
    exam.stream.complete();
    subscription->request(1);
    exam.stream = {};
    subscription->request(1);
}

void greatestDemandIsNotExhausted(Examination& exam) {
    exam.subscribe(std::numeric_limits<std::int64_t>::max());
    exam.subscriber->request(velkor::testing::allValues);
    exam.subscriber->request(velkor::testing::allValues);
    exam.publish(1, 5);
    exam.require(exam.subscriber->values.size() == 5, "all values delivered");
}

}  // namespace

Examination::Examination(const StreamFactory& factory)
    : stream(factory.make()),
      subscriber(std::make_shared<velkor::testing::RecordingSubscriber<int>>()),
      patience(factory.patience) {}

void Examination::subscribe(std::uint64_t demand) {
    stream.publisher->subscribe(subscriber);
    if (demand > 0) subscriber->request(demand);
}

void Examination::publish(int first, int last) {
    for (int value = first; value <= last; ++value) stream.publish(value);
}

void Examination::require(bool holds, const std::string& claim) {
    if (!holds && objection.empty()) objection = "not " + claim;
}

bool Examination::completesElsewhere(std::function<void()> call) const {
    return velkor::testing::completesWithin(patience, std::move(call));
}

const std::vector<PublisherRule>& publisherRules() {
    static const std::vector<PublisherRule> rules{
        {"1.1", "DeliversNoMoreThanRequested", deliversNoMoreThanRequested},
        {"1.2", "MayDeliverLessThanRequestedAndEnd", mayDeliverLessThanRequestedAndEnd},
        {"1.3", "DeliveriesOfQueuedValuesDoNotOverlap", deliveriesOfQueuedValuesDoNotOverlap},
        {"1.4", "FailureIsSignalledAsAnError", failureIsSignalledAsAnError},
        {"1.5", "CompletionIsSignalled", completionIsSignalled},
        {"1.6", "EndRevokesTheSubscription", endRevokesTheSubscription},
        {"1.7", "NothingFollowsCompletion", nothingFollowsCompletion},
        {"1.7", "NothingFollowsAnError", nothingFollowsAnError},
        {"1.8", "CancelStopsTheSignals", cancelStopsTheSignals},
        {"1.9", "OnSubscribeIsTheFirstSignal", onSubscribeIsTheFirstSignal},
        {"1.9", "EndedStreamSignalsOnSubscribeFirst", endedStreamSignalsOnSubscribeFirst},
        {"1.9", "NullSubscriberIsRefused", nullSubscriberIsRefused},
        {"1.10", "SameSubscriberIsRefusedTheSecondTime", sameSubscriberIsRefusedTheSecondTime},
        {"1.11", "SecondSubscriberIsRefused", secondSubscriberIsRefused},
        {"3.1", "AnotherThreadMayRequest", anotherThreadMayRequest},
        {"3.2", "RequestWorksInsideSignals", requestWorksInsideSignals},
        {"3.3", "RequestInsideOnNextDoesNotRecurse", requestInsideOnNextDoesNotRecurse},
        {"3.4", "RequestReturnsWhileADeliveryRuns", requestReturnsWhileADeliveryRuns},
        {"3.5", "CancelReturnsWhileADeliveryRuns", cancelReturnsWhileADeliveryRuns},
        {"3.6", "RequestAfterCancelDoesNothing", requestAfterCancelDoesNothing},
        {"3.7", "CancelAfterCancelDoesNothing", cancelAfterCancelDoesNothing},
        {"3.8", "RequestsAddUp", requestsAddUp},
        {"3.10", "RequestMayDeliverBeforeItReturns", requestMayDeliverBeforeItReturns},
        {"3.11", "RequestMayEndTheStreamBeforeItReturns", requestMayEndTheStreamBeforeItReturns},
        {"3.12", "CancelForgetsTheDemand", cancelForgetsTheDemand},
        {"3.13", "CancelReleasesTheSubscriber", cancelReleasesTheSubscriber},
        {"3.14", "CancelEndsTheStream", cancelEndsTheStream},
        {"3.15", "CancelReturnsNormallyInEveryState", cancelReturnsNormallyInEveryState},
        {"3.16", "RequestReturnsNormallyInEveryState", requestReturnsNormallyInEveryState},
        {"3.17", "GreatestDemandIsNotExhausted", greatestDemandIsNotExhausted},
    };
    return rules;
}

std::string objectionTo(const PublisherRule& rule, const StreamFactory& factory) {
    Examination exam(factory);
    try {
        rule.check(exam);
    } catch (const std::exception& error) {
        exam.require(false, std::string("without an exception: ") + error.what());
    }
    return exam.objection;
}

}  // namespace velkor::reactive_streams
