#include "tests/framework/reactive_streams/PublisherRules.hpp"

#include <gmock/gmock.h>

#include <algorithm>
#include <atomic>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/framework/reactive_streams/BrokenPublisher.hpp"
#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {

void PrintTo(const PublisherRule& rule, std::ostream* out) {
    *out << rule.number;
}

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

template <class Publisher, class Make>
StreamFactory streamsMadeBy(Make make, std::chrono::milliseconds patience) {
    const auto create = [make] {
        const std::shared_ptr<Publisher> publisher = make();
        const std::weak_ptr<Publisher> weak = publisher;
        return StreamUnderTest{
            publisher, [weak](int value) { weak.lock()->publish(value); },
            [weak] { weak.lock()->complete(); },
            [weak](const std::exception_ptr& error) { weak.lock()->fail(error); }};
    };
    return {create, patience};
}

/// How a rule is named among the tests: its number, then its claim.
std::string nameOf(const PublisherRule& rule) {
    std::string number = rule.number;
    number.replace(number.find('.'), 1, "_");
    return "Rule" + number + "_" + rule.name;
}

class PublisherRules : public ::testing::TestWithParam<PublisherRule> {};

TEST_P(PublisherRules, CachedValuePublisherKeepsTo) {
    using Stream = StreamOf<int>;
    const auto streams = streamsMadeBy<Stream>([] { return std::make_shared<Stream>(8, [] {}); },
                                               velkor::testing::patience);
    EXPECT_EQ(objectionTo(GetParam(), streams), "");
}

INSTANTIATE_TEST_SUITE_P(ReactiveStreams, PublisherRules, ::testing::ValuesIn(publisherRules()),
                         [](const auto& row) { return nameOf(row.param); });

/// The rules themselves are tested against publishers that are known to be wrong.
class PublisherRulesThemselves : public ::testing::Test {
protected:
    static std::vector<std::string> rulesBrokenBy(Defects defects) {
        // Long enough for a thread to get through where nothing is wrong; only a defect waits.
        constexpr std::chrono::milliseconds brief{500};
        const auto streams = streamsMadeBy<BrokenPublisher>(
            [defects] { return std::make_shared<BrokenPublisher>(defects); },
            defects.holdsItsLockWhileDelivering ? brief : velkor::testing::patience);
        std::vector<std::string> names;
        for (const auto& rule : publisherRules()) {
            if (!objectionTo(rule, streams).empty()) names.emplace_back(rule.name);
        }
        return names;
    }
};

TEST_F(PublisherRulesThemselves, PublisherWithoutADefectBreaksNone) {
    EXPECT_THAT(rulesBrokenBy({}), IsEmpty());
}

TEST_F(PublisherRulesThemselves, PublisherThatIgnoresDemandIsFound) {
    Defects defects;
    defects.ignoresDemand = true;
    EXPECT_THAT(rulesBrokenBy(defects),
                ElementsAre("DeliversNoMoreThanRequested", "RequestAfterCancelDoesNothing",
                            "RequestsAddUp", "RequestMayEndTheStreamBeforeItReturns"));
}

TEST_F(PublisherRulesThemselves, PublisherThatSignalsAfterTheEndIsFound) {
    Defects defects;
    defects.signalsAfterTheEnd = true;
    EXPECT_THAT(rulesBrokenBy(defects),
                ElementsAre("EndRevokesTheSubscription", "NothingFollowsCompletion",
                            "NothingFollowsAnError", "CancelStopsTheSignals",
                            "RequestAfterCancelDoesNothing", "CancelAfterCancelDoesNothing",
                            "CancelForgetsTheDemand", "CancelReleasesTheSubscriber"));
}

TEST_F(PublisherRulesThemselves, PublisherThatHoldsItsLockWhileDeliveringIsFound) {
    Defects defects;
    defects.holdsItsLockWhileDelivering = true;
    EXPECT_THAT(rulesBrokenBy(defects),
                ElementsAre("RequestReturnsWhileADeliveryRuns", "CancelReturnsWhileADeliveryRuns"));
}

/// Where the publisher departs from the rules on purpose.
using PublisherDeviations = PublisherFixture;

TEST_F(PublisherDeviations, Rule1_3_PublishFromInsideOnNextIsDeliveredNested) {
    int depth = 0;
    int deepest = 0;
    subscriber->whenNext = [&](int value) {
        deepest = std::max(deepest, ++depth);
        if (value == 1) publisher->publish(2);
        --depth;
    };
    subscribe(allValues);
    publisher->publish(1);
    EXPECT_EQ(deepest, 2);
}

TEST_F(PublisherDeviations, Rule1_3_DeliveriesOfTwoThreadsMayOverlap) {
    /// Lets every delivery wait for another one.
    class Meeting final : public Subscriber<int> {
    public:
        using Subscriber<int>::onNext;
        void onSubscribe(std::weak_ptr<Subscription> opened) override { opened.lock()->request(2); }
        void onNext(int&&) override { met = both.arriveAndWait(); }
        void onComplete() override {}
        void onError(const std::exception_ptr&) override {}

        velkor::testing::Latch both{2};
        std::atomic<bool> met{false};
    };
    const auto meeting = std::make_shared<Meeting>();
    publisher->subscribe(meeting);
    std::thread other([this] { publisher->publish(1); });
    publisher->publish(2);
    other.join();
    EXPECT_TRUE(meeting->met);
}

TEST_F(PublisherDeviations,
       Rule1_8_CancelOnAnotherThreadStillLetsQueuedValuesWithinTheDemandBegin) {
    publisher = makeStream(2);
    publisher->publish(1);
    publisher->publish(2);
    subscriber->whenNext = [this](int value) {
        if (value == 1) std::thread([this] { subscriber->cancel(); }).join();
    };
    subscribe(3);
    publisher->publish(3);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(PublisherDeviations, Rule1_9_EndOnAnotherThreadMayOvertakeOnSubscribe) {
    subscriber->whenSubscribed = [this] {
        std::thread([this] { publisher->complete(); }).join();
        EXPECT_EQ(subscriber->completions, 1);
    };
    subscribe(0);
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(PublisherDeviations, Rule2_13_ExceptionOfASignalReachesThePublishersCaller) {
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    subscribe(allValues);
    EXPECT_THROW(publisher->publish(1), std::runtime_error);
    EXPECT_EQ(endings, 0);
}

TEST_F(PublisherDeviations, Rule3_9_RequestOfZeroAddsNothingAndIsNoError) {
    subscribe(0);
    subscriber->request(0);
    publisher->publish(1);
    EXPECT_THAT(subscriber->values, IsEmpty());
    EXPECT_THAT(subscriber->errors, IsEmpty());
}

TEST_F(PublisherDeviations, Rule3_12_CancelDuringOnNextStillDeliversWhatWasQueuedWithinTheDemand) {
    publisher = makeStream(2);
    publisher->publish(1);
    publisher->publish(2);
    subscriber->whenNext = [this](int value) {
        if (value == 1) subscriber->cancel();
    };
    subscribe(2);
    EXPECT_THAT(subscriber->values, ElementsAre(1, 2));
}

TEST_F(PublisherDeviations, Rule3_15_ExceptionOfTheHookReachesTheCallerOfCancel) {
    whenDone = [] { throw std::runtime_error("hook"); };
    subscribe(0);
    EXPECT_THROW(subscriber->cancel(), std::runtime_error);
}

TEST_F(PublisherDeviations, Rule3_16_ExceptionOfOnNextReachesTheCallerOfRequest) {
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    publisher->publish(1);
    subscribe(0);
    EXPECT_THROW(subscriber->request(1), std::runtime_error);
}

/// A number that stops at a gate, if it has one, when it is moved. The way of a value to a callback
/// that takes it by value is one move: the callback begins after the gate has opened.
class Travelling {
public:
    struct Gate {
        velkor::testing::Latch reached;
        velkor::testing::Latch opened;
    };

    explicit Travelling(int value, Gate* onItsWay = nullptr) : number(value), gate(onItsWay) {}
    Travelling(const Travelling& other) = default;
    Travelling(Travelling&& other) noexcept : number(other.number), gate(other.gate) {
        if (gate == nullptr) return;
        gate->reached.countDown();
        EXPECT_TRUE(gate->opened.wait());
    }
    Travelling& operator=(const Travelling&) = delete;
    Travelling& operator=(Travelling&&) = delete;
    ~Travelling() = default;

    const int number;

private:
    Gate* const gate;
};

/// What happens while another thread has a value in its hands.
class PublisherDeviationsOnTwoThreads : public ::testing::Test {
protected:
    /// Callbacks that write down in which order they begin.
    Callbacks<Travelling> recording() {
        return {[this](Travelling value) { begun.push_back(std::to_string(value.number)); },
                [this] { begun.emplace_back("complete"); }};
    }

    /// Runs `meanwhile` when a value that `deliver` hands over on another thread is on its way.
    template <class Deliver, class Meanwhile>
    void whileOnItsWay(Deliver deliver, Meanwhile meanwhile) {
        std::thread other(deliver);
        EXPECT_TRUE(gate.reached.wait());
        meanwhile();
        gate.opened.countDown();
        other.join();
    }

    Travelling::Gate gate;
    std::vector<std::string> begun;
    std::shared_ptr<StreamOf<Travelling>> publisher =
        std::make_shared<StreamOf<Travelling>>(1, [] {});
    SubscriptionHandle watch;
};

TEST_F(PublisherDeviationsOnTwoThreads, Rule1_3_QueuedValueMayBeginAfterANewerOne) {
    publisher->publishFirst(Travelling(1, &gate));
    whileOnItsWay([this] { watch = reactive_streams::subscribe(*publisher, recording()); },
                  [this] { publisher->publish(Travelling(2)); });
    EXPECT_THAT(begun, ElementsAre("2", "1"));
}

TEST_F(PublisherDeviationsOnTwoThreads, Rule1_7_ValueMayBeginAfterCompletion) {
    watch = reactive_streams::subscribe(*publisher, recording());
    whileOnItsWay([this] { publisher->publish(Travelling(1, &gate)); },
                  [this] { publisher->complete(); });
    EXPECT_THAT(begun, ElementsAre("complete", "1"));
}

}  // namespace
}  // namespace velkor::reactive_streams
