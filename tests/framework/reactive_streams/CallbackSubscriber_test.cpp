#include "framework/reactive_streams/CallbackSubscriber.hpp"

#include <gmock/gmock.h>

#include <algorithm>
#include <exception>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;

class CallbackSubscriberTest : public PublisherFixture {
protected:
    Callbacks<int> recordValues() {
        return {[this](int value) { values.push_back(value); }};
    }

    /// Callbacks whose first value is an error to them.
    Callbacks<int> failOnFirstValue() {
        return {[this](int value) {
            values.push_back(value);
            if (values.size() == 1) throw std::runtime_error("first");
        }};
    }

    std::vector<int> values;
};

TEST_F(CallbackSubscriberTest, UnboundedDemandDeliversEveryValueAsItIsPublished) {
    const auto watch = reactive_streams::subscribe(*publisher, recordValues(), Demand::unbounded);
    publisher->publish(1);
    publisher->publish(2);
    EXPECT_THAT(values, ElementsAre(1, 2));
}

TEST_F(CallbackSubscriberTest, DemandIsUnboundedUnlessSaidOtherwise) {
    const auto watch = reactive_streams::subscribe(*publisher, {[this](int value) {
        values.push_back(value);
        if (value < 3) publisher->publish(value + 1);
    }});
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1, 2, 3));
}

TEST_F(CallbackSubscriberTest, ValueThatWaitsIsDeliveredBeforeSubscribeReturns) {
    publisher->publish(7);
    const auto watch = reactive_streams::subscribe(*publisher, recordValues());
    EXPECT_THAT(values, ElementsAre(7));
}

TEST_F(CallbackSubscriberTest, OneAtATimeAsksForTheNextValueAfterTheCallback) {
    const auto watch = reactive_streams::subscribe(*publisher, recordValues(), Demand::oneAtATime);
    publisher->publish(1);
    publisher->publish(2);
    publisher->publish(3);
    EXPECT_THAT(values, ElementsAre(1, 2, 3));
}

TEST_F(CallbackSubscriberTest, OneAtATimeSeesTheNewestOfTheValuesPublishedMeanwhile) {
    const auto watch = reactive_streams::subscribe(*publisher, {[this](int value) {
        values.push_back(value);
        if (value != 1) return;
        publisher->publish(2);
        publisher->publish(3);
        EXPECT_THAT(values, ElementsAre(1));
    }},
                                                   Demand::oneAtATime);
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1, 3));
}

TEST_F(CallbackSubscriberTest, OneAtATimeDoesNotRecurseWithTheNumberOfValues) {
    int depth = 0;
    int deepest = 0;
    const auto watch = reactive_streams::subscribe(*publisher, {[&](int value) {
        deepest = std::max(deepest, ++depth);
        if (value < 100) publisher->publish(value + 1);
        --depth;
    }},
                                                   Demand::oneAtATime);
    publisher->publish(1);
    EXPECT_EQ(deepest, 1);
}

TEST_F(CallbackSubscriberTest, CompletionIsPassedOn) {
    int completions = 0;
    const auto watch =
        reactive_streams::subscribe(*publisher, {[](int) {}, [&] { ++completions; }});
    publisher->complete();
    EXPECT_EQ(completions, 1);
}

TEST_F(CallbackSubscriberTest, FailureIsPassedOnWithItsError) {
    std::exception_ptr error;
    const auto watch = reactive_streams::subscribe(
        *publisher, {[](int) {}, {}, [&](const std::exception_ptr& reason) { error = reason; }});
    const auto reason = std::make_exception_ptr(std::runtime_error("broken"));
    publisher->fail(reason);
    EXPECT_EQ(error, reason);
}

TEST_F(CallbackSubscriberTest, CompletionWithoutACallbackForItIsIgnored) {
    const auto watch = reactive_streams::subscribe(*publisher, recordValues());
    publisher->complete();
    EXPECT_EQ(endings, 1);
}

TEST_F(CallbackSubscriberTest, FailureWithoutACallbackForItIsIgnored) {
    const auto watch = reactive_streams::subscribe(*publisher, recordValues());
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(endings, 1);
}

TEST_F(CallbackSubscriberTest, MissingValueCallbackIsRefused) {
    try {
        const auto watch = reactive_streams::subscribe(*publisher, Callbacks<int>{});
        FAIL() << "accepted";
    } catch (const std::invalid_argument& error) {
        EXPECT_STREQ(error.what(), "A callback for values is needed.");
    }
}

TEST_F(CallbackSubscriberTest, RefusedCallbacksLeaveThePublisherFree) {
    EXPECT_THROW(auto watch = reactive_streams::subscribe(*publisher, Callbacks<int>{}),
                 std::invalid_argument);
    const auto watch = reactive_streams::subscribe(*publisher, recordValues());
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1));
}

TEST_F(CallbackSubscriberTest, SecondSubscriptionIsRefusedAndLeavesTheFirstAlone) {
    const auto watch = reactive_streams::subscribe(*publisher, recordValues());
    EXPECT_THROW(auto second = reactive_streams::subscribe(*publisher, {[](int) {}}),
                 std::invalid_argument);
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1));
}

TEST_F(CallbackSubscriberTest, CallbackMayTakeTheValueOver) {
    const auto texts = std::make_shared<StreamOf<std::string>>(1, [] {});
    std::string taken;
    const auto watch = reactive_streams::subscribe(
        *texts, {[&](std::string&& value) { taken = std::move(value); }});
    texts->publish("a value that is too long to be stored inside the string");
    EXPECT_EQ(taken, "a value that is too long to be stored inside the string");
}

TEST_F(CallbackSubscriberTest, ValueThatThePublisherKeepsIsCopied) {
    std::string received;
    CallbackSubscriber<std::string> subscriber(
        {[&](std::string&& value) { received = std::move(value); }}, Demand::unbounded,
        std::make_shared<SubscriptionLink>());
    const std::string kept = "kept";
    subscriber.onNext(kept);
    EXPECT_EQ(received, "kept");
    EXPECT_EQ(kept, "kept");
}

TEST_F(CallbackSubscriberTest, ExceptionReachesThePublishersCaller) {
    const auto watch = reactive_streams::subscribe(*publisher, failOnFirstValue());
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
}

TEST_F(CallbackSubscriberTest, ExceptionDoesNotEndUnboundedDemand) {
    const auto watch = reactive_streams::subscribe(*publisher, failOnFirstValue());
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    publisher->publish(2);
    EXPECT_THAT(values, ElementsAre(1, 2));
}

TEST_F(CallbackSubscriberTest, ExceptionDoesNotEndDemandOfOneAtATime) {
    const auto watch =
        reactive_streams::subscribe(*publisher, failOnFirstValue(), Demand::oneAtATime);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    publisher->publish(2);
    publisher->publish(3);
    EXPECT_THAT(values, ElementsAre(1, 2, 3));
}

TEST_F(CallbackSubscriberTest, ValuePublishedBeforeTheCallbackThrowsIsStillDelivered) {
    const auto watch = reactive_streams::subscribe(*publisher, {[this](int value) {
        values.push_back(value);
        if (value != 1) return;
        publisher->publish(2);
        throw std::runtime_error("first");
    }},
                                                   Demand::oneAtATime);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    EXPECT_THAT(values, ElementsAre(1, 2));
}

TEST_F(CallbackSubscriberTest,
       ValueQueuedBeforeADrainedCallbackThrowsWaitsForThePublicationOfAnother) {
    publisher = makeStream(2);
    const auto watch = reactive_streams::subscribe(*publisher, {[this](int value) {
        values.push_back(value);
        if (value < 3) publisher->publish(value + 1);
        if (value == 2) throw std::runtime_error("2");
    }},
                                                   Demand::oneAtATime);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    EXPECT_THAT(values, ElementsAre(1, 2));
    publisher->publish(4);
    EXPECT_THAT(values, ElementsAre(1, 2, 3, 4));
}

TEST_F(CallbackSubscriberTest, ExceptionForAWaitingValueLeavesSubscribeAndCancels) {
    publisher->publish(1);
    EXPECT_THROW(auto watch = reactive_streams::subscribe(*publisher, failOnFirstValue()),
                 std::runtime_error);
    EXPECT_EQ(endings, 1);
}

TEST_F(CallbackSubscriberTest, CancelledCallbackThatThrowsAsksForNothingMore) {
    std::optional<SubscriptionHandle> watch;
    watch = reactive_streams::subscribe(*publisher, {[&](int value) {
        values.push_back(value);
        watch.reset();
        throw std::runtime_error("last");
    }},
                                        Demand::oneAtATime);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    publisher->publish(2);
    EXPECT_THAT(values, ElementsAre(1));
}

TEST_F(CallbackSubscriberTest, HandleDestroyedInsideTheCallbackStopsTheDelivery) {
    std::optional<SubscriptionHandle> watch;
    watch = reactive_streams::subscribe(*publisher, {[&](int value) {
        values.push_back(value);
        watch.reset();
    }});
    publisher->publish(1);
    publisher->publish(2);
    EXPECT_THAT(values, ElementsAre(1));
    EXPECT_EQ(endings, 1);
}

TEST_F(CallbackSubscriberTest, NoCallbackBeginsAfterTheCancelThoughValuesAreQueued) {
    publisher = makeStream(3);
    std::optional<SubscriptionHandle> watch;
    watch = reactive_streams::subscribe(*publisher, {[&](int value) {
        values.push_back(value);
        if (value != 1) return watch.reset();
        publisher->publish(2);
        publisher->publish(3);
    }},
                                        Demand::oneAtATime);
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1, 2));
}

TEST_F(CallbackSubscriberTest, HandleOwnedByTheCallbackKeepsNothingAlive) {
    const auto watch = std::make_shared<SubscriptionHandle>();
    *watch = reactive_streams::subscribe(*publisher, {[watch](int) {}});
    const std::weak_ptr<Stream> observed = publisher;
    publisher.reset();
    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(watch.use_count(), 1);
}

TEST_F(CallbackSubscriberTest, CallbackMayDestroyTheHandleThatItOwns) {
    auto watch = std::make_shared<SubscriptionHandle>();
    *watch = reactive_streams::subscribe(*publisher, {[this, watch](int value) {
        values.push_back(value);
        *watch = SubscriptionHandle();
        values.push_back(-value);
    }});
    watch.reset();
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1, -1));
}

TEST_F(CallbackSubscriberTest, CallbacksAreReleasedByTheCancel) {
    const auto state = std::make_shared<int>();
    auto watch = reactive_streams::subscribe(*publisher, {[state](int) {}});
    watch.cancel();
    EXPECT_EQ(state.use_count(), 1);
}

TEST_F(CallbackSubscriberTest, CompletionIsNotPassedOnAfterACancel) {
    int completions = 0;
    auto watch = reactive_streams::subscribe(*publisher, {[](int) {}, [&] { ++completions; }});
    watch.cancel();
    publisher.reset();
    EXPECT_EQ(completions, 0);
}

TEST_F(CallbackSubscriberTest, EndThatComesAfterACancelAllTheSameIsNotPassedOn) {
    int endings = 0;
    const auto link = std::make_shared<SubscriptionLink>();
    CallbackSubscriber<int> subscriber(
        {[](int) {}, [&] { ++endings; }, [&](const std::exception_ptr&) { ++endings; }},
        Demand::unbounded, link);
    link->cancel();
    subscriber.onComplete();
    subscriber.onError(std::make_exception_ptr(0));
    EXPECT_EQ(endings, 0);
}

TEST_F(CallbackSubscriberTest, CancelDoesNotWaitForACallbackOnAnotherThread) {
    velkor::testing::Latch started;
    velkor::testing::Latch cancelled;
    bool cancelledMeanwhile = false;
    auto watch = reactive_streams::subscribe(*publisher, {[&](int) {
        started.countDown();
        cancelledMeanwhile = cancelled.wait();
    }});
    std::thread publishing([this] { publisher->publish(1); });
    EXPECT_TRUE(started.wait());
    watch.cancel();
    cancelled.countDown();
    publishing.join();
    EXPECT_TRUE(cancelledMeanwhile);
}

TEST_F(CallbackSubscriberTest, CallbacksMayTakeAnyPublisherThroughItsInterface) {
    PublisherAPI<int>& stream = *publisher;
    const auto watch = reactive_streams::subscribe(stream, recordValues());
    publisher->publish(1);
    EXPECT_THAT(values, ElementsAre(1));
}

}  // namespace
}  // namespace velkor::reactive_streams
