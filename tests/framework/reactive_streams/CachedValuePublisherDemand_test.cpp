#include <gmock/gmock.h>

#include <algorithm>
#include <cstdint>
#include <limits>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr std::uint64_t most = std::numeric_limits<std::uint64_t>::max();

struct Addition {
    const char* name;
    std::uint64_t demand;
    std::uint64_t more;
    std::uint64_t sum;
};

void PrintTo(const Addition& addition, std::ostream* out) {
    *out << addition.demand << " + " << addition.more;
}

class AddDemand : public ::testing::TestWithParam<Addition> {};

TEST_P(AddDemand, AddsUpToTheGreatestDemandAndNoFurther) {
    EXPECT_EQ(addDemand(GetParam().demand, GetParam().more), GetParam().sum);
}

INSTANTIATE_TEST_SUITE_P(Boundaries, AddDemand,
                         ::testing::Values(Addition{"ZeroAndZero", 0, 0, 0},
                                           Addition{"ZeroAndOne", 0, 1, 1},
                                           Addition{"OneAndZero", 1, 0, 1},
                                           Addition{"OneAndOne", 1, 1, 2},
                                           Addition{"ZeroAndMost", 0, most, most},
                                           Addition{"MostAndZero", most, 0, most},
                                           Addition{"OneBelowMostAndOne", most - 1, 1, most},
                                           Addition{"OneAndOneBelowMost", 1, most - 1, most},
                                           Addition{"OneBelowMostAndTwo", most - 1, 2, most},
                                           Addition{"MostAndOne", most, 1, most},
                                           Addition{"MostAndMost", most, most, most}),
                         [](const auto& row) { return std::string(row.param.name); });

TEST(AddDemandAtCompileTime, IsAConstantExpression) {
    constexpr std::uint64_t saturated = addDemand(most - 1, 5);
    EXPECT_EQ(saturated, most);
}

using CachedValuePublisherDemand = PublisherFixture;

TEST_F(CachedValuePublisherDemand, EachValueUsesUpOneOfTheDemand) {
    subscribe(2);
    for (int value = 1; value <= 4; ++value) publisher->publish(value);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(CachedValuePublisherDemand, RequestsAddUp) {
    subscribe(1);
    subscriber->request(2);
    for (int value = 1; value <= 4; ++value) publisher->publish(value);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherDemand, RequestOfZeroAddsNothing) {
    subscribe(0);
    subscriber->request(0);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherDemand, RequestOfZeroIsNoError) {
    subscribe(0);
    EXPECT_NO_THROW(subscriber->request(0));
    EXPECT_THAT(subscriber->errors, IsEmpty());
}

TEST_F(CachedValuePublisherDemand, GreatestRequestOnTopOfDemandDoesNotWrap) {
    subscribe(2);
    subscriber->request(most);
    for (int value = 1; value <= 3; ++value) publisher->publish(value);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherDemand, TwoGreatestRequestsDoNotWrap) {
    subscribe(most);
    subscriber->request(most);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
}

TEST_F(CachedValuePublisherDemand, DemandIsKeptForValuesThatComeLater) {
    publisher->publish(1);
    subscribe(3);
    publisher->publish(2);
    publisher->publish(3);
    publisher->publish(4);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherDemand, RequestDeliversOnlyAsManyOfTheQueueAsItAsksFor) {
    publisher = makeStream(3);
    for (int value = 1; value <= 3; ++value) publisher->publish(value);
    subscribe(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(CachedValuePublisherDemand, RequestInsideOnNextDoesNotRecurse) {
    publisher = makeStream(50);
    for (int value = 1; value <= 50; ++value) publisher->publish(value);
    int depth = 0;
    int deepest = 0;
    subscriber->whenNext = [&](int) {
        deepest = std::max(deepest, ++depth);
        subscriber->request(1);
        --depth;
    };
    subscribe(1);
    EXPECT_EQ(subscriber->values.size(), 50U);
    EXPECT_EQ(deepest, 1);
}

TEST_F(CachedValuePublisherDemand, RequestInsideADirectDeliveryIsServedAtMostOneLevelDeeper) {
    publisher = makeStream(50);
    int depth = 0;
    int deepest = 0;
    subscriber->whenNext = [&](int value) {
        deepest = std::max(deepest, ++depth);
        if (value == 0) {
            for (int more = 1; more <= 50; ++more) publisher->publish(more);
        }
        subscriber->request(1);
        --depth;
    };
    subscribe(1);
    publisher->publish(0);
    EXPECT_EQ(subscriber->values.size(), 51U);
    EXPECT_EQ(deepest, 2);
}

TEST_F(CachedValuePublisherDemand, RequestAfterCompletionDeliversNothing) {
    subscribe(0);
    publisher->complete();
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(CachedValuePublisherDemand, RequestAfterFailureDeliversNothing) {
    subscribe(0);
    publisher->publish(1);
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
    EXPECT_EQ(subscriber->errors.size(), 1U);
}

TEST_F(CachedValuePublisherDemand, RequestAfterCancellationDeliversNothing) {
    subscribe(0);
    publisher->publish(1);
    subscriber->cancel();
    subscriber->request(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
}

TEST_F(CachedValuePublisherDemand, RequestAfterThePublisherHasGoneDoesNothing) {
    subscribe(0);
    const auto subscription = subscriber->subscription.lock();
    publisher.reset();
    EXPECT_NO_THROW(subscription->request(1));
}

TEST_F(CachedValuePublisherDemand, ExceptionOfADrainedDeliveryReachesTheCallerOfRequest) {
    publisher->publish(1);
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    subscribe(0);
    EXPECT_THROW(subscriber->request(1), std::runtime_error);
}

TEST_F(CachedValuePublisherDemand, DrainStopsAtAnExceptionAndTheRestStaysQueued) {
    publisher = makeStream(3);
    for (int value = 1; value <= 3; ++value) publisher->publish(value);
    subscriber->whenNext = [](int value) {
        if (value == 1) throw std::runtime_error("next");
    };
    subscribe(0);
    EXPECT_THROW(subscriber->request(allValues), std::runtime_error);
    EXPECT_THAT(subscriber->values, ElementsAre(1));
    subscriber->request(0);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherDemand, PublishAfterAnExceptionDrainsWhatWasLeft) {
    publisher = makeStream(3);
    publisher->publish(1);
    publisher->publish(2);
    subscriber->whenNext = [](int value) {
        if (value == 1) throw std::runtime_error("next");
    };
    subscribe(0);
    EXPECT_THROW(subscriber->request(allValues), std::runtime_error);
    publisher->publish(3);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2, 3));
}

TEST_F(CachedValuePublisherDemand, ExceptionOfTheDrainAfterOnSubscribeReachesTheCaller) {
    publisher->publish(1);
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    subscriber->firstRequest = 1;
    EXPECT_THROW(publisher->subscribe(subscriber), std::runtime_error);
}

}  // namespace
}  // namespace velkor::reactive_streams
