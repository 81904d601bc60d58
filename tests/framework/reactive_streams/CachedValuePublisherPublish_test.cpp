#include <gmock/gmock.h>

#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/framework/reactive_streams/TrackedValue.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using CachedValuePublisherPublish = PublisherFixture;

TEST_F(CachedValuePublisherPublish, ValueGoesStraightToAWaitingSubscriber) {
    subscribe(1);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherPublish, ValuesArriveInTheOrderOfPublication) {
    subscribe(allValues);
    for (const int value : {3, 1, 2}) publisher->publish(value);
    EXPECT_THAT(subscriber->values, ElementsAre(3, 1, 2));
}

TEST_F(CachedValuePublisherPublish, EqualValuesAreDeliveredEachTime) {
    subscribe(allValues);
    publisher->publish(1);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 1));
}

TEST_F(CachedValuePublisherPublish, NewestValuePublishedBeforeTheSubscriberCameIsKept) {
    publisher->publish(1);
    publisher->publish(2);
    subscribe(1);
    EXPECT_THAT(subscriber->values, ElementsAre(2));
}

TEST_F(CachedValuePublisherPublish, NewestValuePublishedWithoutDemandIsKept) {
    subscribe(0);
    publisher->publish(1);
    publisher->publish(2);
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, ElementsAre(2));
}

TEST_F(CachedValuePublisherPublish, FirstValueIsKeptWhenNothingElseIs) {
    publisher->publishFirst(1);
    subscribe(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherPublish, FirstValueThatWasOvertakenIsDropped) {
    publisher->publish(2);
    publisher->publishFirst(1);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(2));
}

TEST_F(CachedValuePublisherPublish, FirstValueIsDroppedOnceTheStreamHasEnded) {
    publisher->complete();
    publisher->publishFirst(1);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherPublish, KeptValueIsDeliveredOnlyOnce) {
    publisher->publish(1);
    subscribe(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherPublish, CapacityDecidesHowManyOfTheNewestAreKept) {
    publisher = makeStream(3);
    for (int value = 1; value <= 5; ++value) publisher->publish(value);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(3, 4, 5));
}

TEST_F(CachedValuePublisherPublish, GreatestCapacityKeepsEverything) {
    publisher = makeStream(allValues);
    for (int value = 1; value <= 100; ++value) publisher->publish(value);
    subscribe(allValues);
    EXPECT_EQ(subscriber->values.size(), 100U);
}

TEST_F(CachedValuePublisherPublish, PublishInsideOnNextIsDeliveredNestedWhileDemandIsLeft) {
    std::vector<std::string> steps;
    subscriber->whenNext = [&](int value) {
        steps.push_back("begin " + std::to_string(value));
        if (value < 3) publisher->publish(value + 1);
        steps.push_back("end " + std::to_string(value));
    };
    subscribe(allValues);
    publisher->publish(1);
    EXPECT_THAT(steps, ElementsAre("begin 1", "begin 2", "begin 3", "end 3", "end 2", "end 1"));
}

TEST_F(CachedValuePublisherPublish, PublishInsideOnNextWithoutDemandLeftIsKept) {
    subscriber->whenNext = [&](int value) {
        if (value == 1) publisher->publish(2);
    };
    subscribe(1);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(CachedValuePublisherPublish, PublishInsideADrainedDeliveryIsNestedOnceTheQueueIsEmpty) {
    std::vector<std::string> steps;
    subscriber->whenNext = [&](int value) {
        steps.push_back("begin " + std::to_string(value));
        if (value == 1) publisher->publish(2);
        steps.push_back("end " + std::to_string(value));
    };
    publisher->publish(1);
    subscribe(2);
    EXPECT_THAT(steps, ElementsAre("begin 1", "begin 2", "end 2", "end 1"));
}

TEST_F(CachedValuePublisherPublish, PublishInsideADrainQueuesBehindWhatIsQueued) {
    publisher = makeStream(3);
    subscriber->whenNext = [&](int value) {
        if (value == 1) publisher->publish(3);
    };
    publisher->publish(1);
    publisher->publish(2);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherPublish, ExceptionOfADirectDeliveryReachesTheCaller) {
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    subscribe(1);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
}

TEST_F(CachedValuePublisherPublish, ExceptionOfADirectDeliveryUsesUpItsDemand) {
    subscriber->whenNext = [](int value) {
        if (value == 1) throw std::runtime_error("next");
    };
    subscribe(1);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    publisher->publish(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherPublish, NextValueIsDeliveredAfterAnException) {
    subscriber->whenNext = [](int value) {
        if (value == 1) throw std::runtime_error("next");
    };
    subscribe(2);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    publisher->publish(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(CachedValuePublisherPublish, NothingIsDeliveredAfterCompletion) {
    subscribe(allValues);
    publisher->complete();
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherPublish, NothingIsDeliveredAfterFailure) {
    subscribe(allValues);
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherPublish, NothingIsDeliveredAfterCancellation) {
    subscribe(allValues);
    subscriber->cancel();
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherPublish, CompletingStreamStillTakesValues) {
    publisher = makeStream(2);
    publisher->publish(1);
    publisher->complete();
    publisher->publish(2);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherPublish, PublisherWithoutASharedOwnerKeepsValues) {
    Stream unowned(1, [] {});
    EXPECT_NO_THROW(unowned.publish(1));
}

TEST_F(CachedValuePublisherPublish, HookMayBeAnyCallable) {
    int calls = 0;
    const auto hook = [&calls] { ++calls; };
    auto stream = std::make_shared<CachedValuePublisher<int, decltype(hook)>>(1, hook);
    stream->complete();
    EXPECT_EQ(calls, 1);
}

TEST_F(CachedValuePublisherPublish, MillionValuesWithoutDemandLeaveTheLastOne) {
    for (int value = 1; value <= 1'000'000; ++value) publisher->publish(value);
    subscribe(allValues);
    EXPECT_THAT(subscriber->values, ElementsAre(1'000'000));
}

/// Streams of values that keep account of themselves.
class CachedValuePublisherValues : public ::testing::Test {
protected:
    using Stream = StreamOf<TrackedValue>;
    using Recorder = velkor::testing::RecordingSubscriber<TrackedValue>;

    /// Looks at each value and lets it go.
    class Sink : public Recorder {
    public:
        using Recorder::onNext;
        using Recorder::Recorder;
        void onNext(TrackedValue&& value) override {
            if (whenNext) whenNext(value);
        }
    };

    TrackedValue value(int number) const { return {log, number}; }

    std::shared_ptr<ValueLog> log = std::make_shared<ValueLog>();
    std::shared_ptr<Stream> publisher = std::make_shared<Stream>(1, [] {});
};

TEST_F(CachedValuePublisherValues, DirectDeliveryCopiesTheValueOnce) {
    const auto sink = std::make_shared<Sink>(1);
    publisher->subscribe(sink);
    publisher->publish(value(1));
    EXPECT_EQ(log->copies, 1);
}

TEST_F(CachedValuePublisherValues, DeliveryThroughTheQueueCopiesTheValueOnce) {
    publisher->publish(value(1));
    publisher->subscribe(std::make_shared<Sink>(1));
    EXPECT_EQ(log->copies, 1);
    EXPECT_EQ(log->alive, 0);
}

TEST_F(CachedValuePublisherValues, DeliveredValueIsThePublishersOwnCopy) {
    const TrackedValue original = value(1);
    const TrackedValue* delivered = &original;
    const auto sink = std::make_shared<Sink>(1);
    sink->whenNext = [&](const TrackedValue& copy) { delivered = &copy; };
    publisher->subscribe(sink);
    publisher->publish(original);
    EXPECT_NE(delivered, &original);
}

TEST_F(CachedValuePublisherValues, ArgumentMayBeDestroyedDuringTheDelivery) {
    auto original = std::make_optional<TrackedValue>(log, 7);
    int delivered = 0;
    const auto sink = std::make_shared<Sink>(1);
    sink->whenNext = [&](const TrackedValue& copy) {
        original.reset();
        delivered = copy.number;
    };
    publisher->subscribe(sink);
    publisher->publish(*original);
    EXPECT_EQ(delivered, 7);
}

TEST_F(CachedValuePublisherValues, ValuesWithoutDemandLeaveOneAlive) {
    for (int number = 0; number < 10'000; ++number) publisher->publish(value(number));
    EXPECT_EQ(log->alive, 1);
}

TEST_F(CachedValuePublisherValues, QueueNeverHoldsMoreThanItsCapacity) {
    publisher = std::make_shared<Stream>(3, [] {});
    for (int number = 0; number < 100; ++number) {
        publisher->publish(value(number));
        EXPECT_LE(log->alive, 3);
    }
    EXPECT_EQ(log->alive, 3);
}

TEST_F(CachedValuePublisherValues, ValuePublishedAfterTheEndIsNotKept) {
    publisher->complete();
    publisher->publish(value(1));
    EXPECT_EQ(log->alive, 0);
}

TEST_F(CachedValuePublisherValues, FailureDropsWhatIsQueued) {
    publisher->publish(value(1));
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(log->alive, 0);
}

TEST_F(CachedValuePublisherValues, CancellationDropsWhatIsQueued) {
    const auto sink = std::make_shared<Sink>();
    publisher->subscribe(sink);
    publisher->publish(value(1));
    sink->cancel();
    EXPECT_EQ(log->alive, 0);
}

TEST_F(CachedValuePublisherValues, DestructionDropsWhatIsQueued) {
    publisher->publish(value(1));
    publisher.reset();
    EXPECT_EQ(log->alive, 0);
}

}  // namespace
}  // namespace velkor::reactive_streams
