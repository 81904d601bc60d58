#include "framework/detail/SharedFutureState.hpp"
#include "tests/framework/FutureTesting.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <functional>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "framework/Future.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::Promise;
using velkor::detail::Continuation;
using velkor::testing::alreadyResolved;
using velkor::testing::alreadyTaken;
using velkor::testing::brokenPromise;
using velkor::testing::completes;
using velkor::testing::invalidArgument;
using velkor::testing::Latch;
using velkor::testing::raceRounds;
using velkor::testing::thrownText;

using State = velkor::detail::SharedFutureState<int>;

constexpr auto nothingThrown = "<nothing thrown>";

// A continuation made of two functions: one to be invoked, one for the destructor.
class Scripted : public Continuation<int> {
public:
    using OnInvoke = std::function<void(Future<int>&&)>;
    using OnDestruction = std::function<void()>;

    explicit Scripted(
        OnInvoke invoked, OnDestruction destroyed = [] {})
        : onInvoke(std::move(invoked)), onDestruction(std::move(destroyed)) {}
    ~Scripted() override { onDestruction(); }
    Scripted(const Scripted&) = delete;
    Scripted& operator=(const Scripted&) = delete;

    void invoke(Future<int>&& future) override { onInvoke(std::move(future)); }

private:
    OnInvoke onInvoke;
    OnDestruction onDestruction;
};

template <class... Functions>
std::unique_ptr<Continuation<int>> continuation(Functions&&... functions) {
    return std::make_unique<Scripted>(std::forward<Functions>(functions)...);
}

std::string resultText(Future<int>&& future) {
    try {
        return "value " + std::to_string(future.get());
    } catch (const std::exception& error) {
        return error.what();
    }
}

// What has become of `state`, seen through a continuation that is attached to it.
std::string observe(const std::shared_ptr<State>& state) {
    std::string seen = "pending";
    bool destroyed = false;
    state->attach(continuation([&](Future<int>&& future) { seen = resultText(std::move(future)); },
                               [&] { destroyed = true; }),
                  state);
    if (seen != "pending") return seen;
    if (destroyed) return "cancelled";
    state->cancel();  // takes the continuation, which refers to this frame, out of the state
    return seen;
}

// Every event in every status. The row says what is thrown and what has become of the state->

enum class Status { pending, value, exception, cancelled };
enum class Event { setValue, setException, cancel, abandon, retrieveFuture };

struct Transition {
    Status from;
    Event event;
    const char* thrown;
    const char* observed;
};

const char* name(Status status) {
    switch (status) {
        case Status::pending:
            return "Pending";
        case Status::value:
            return "Value";
        case Status::exception:
            return "Exception";
        case Status::cancelled:
            return "Cancelled";
    }
    return "";
}

const char* name(Event event) {
    switch (event) {
        case Event::setValue:
            return "SetValue";
        case Event::setException:
            return "SetException";
        case Event::cancel:
            return "Cancel";
        case Event::abandon:
            return "Abandon";
        case Event::retrieveFuture:
            return "RetrieveFuture";
    }
    return "";
}

std::ostream& operator<<(std::ostream& out, const Transition& row) {
    return out << name(row.from) << '-' << name(row.event);
}

std::shared_ptr<State> stateIn(Status status) {
    auto state = std::make_shared<State>();
    if (status == Status::value) state->setValue(std::make_unique<int>(1), state);
    if (status == Status::exception) state->setException(invalidArgument("first"), state);
    if (status == Status::cancelled) state->cancel();
    return state;
}

void apply(Event event, const std::shared_ptr<State>& state) {
    switch (event) {
        case Event::setValue:
            return state->setValue(std::make_unique<int>(2), state);
        case Event::setException:
            return state->setException(invalidArgument("second"), state);
        case Event::cancel:
            return state->cancel();
        case Event::abandon:
            return state->abandon(state);
        case Event::retrieveFuture:
            state->retrieveFuture(state);
    }
}

class SharedFutureStateTransition : public ::testing::TestWithParam<Transition> {};

TEST_P(SharedFutureStateTransition, LeadsToTheStateInTheTable) {
    const auto state = stateIn(GetParam().from);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { apply(GetParam().event, state); }),
              GetParam().thrown);
    EXPECT_EQ(observe(state), GetParam().observed);
}

INSTANTIATE_TEST_SUITE_P(
    Table, SharedFutureStateTransition,
    ::testing::Values(
        Transition{Status::pending, Event::setValue, nothingThrown, "value 2"},
        Transition{Status::pending, Event::setException, nothingThrown, "second"},
        Transition{Status::pending, Event::cancel, nothingThrown, "cancelled"},
        Transition{Status::pending, Event::abandon, nothingThrown, brokenPromise},
        Transition{Status::pending, Event::retrieveFuture, nothingThrown, "pending"},
        Transition{Status::value, Event::setValue, alreadyResolved, "value 1"},
        Transition{Status::value, Event::setException, alreadyResolved, "value 1"},
        Transition{Status::value, Event::cancel, nothingThrown, "value 1"},
        Transition{Status::value, Event::abandon, nothingThrown, "value 1"},
        Transition{Status::value, Event::retrieveFuture, nothingThrown, "value 1"},
        Transition{Status::exception, Event::setValue, alreadyResolved, "first"},
        Transition{Status::exception, Event::setException, alreadyResolved, "first"},
        Transition{Status::exception, Event::cancel, nothingThrown, "first"},
        Transition{Status::exception, Event::abandon, nothingThrown, "first"},
        Transition{Status::exception, Event::retrieveFuture, nothingThrown, "first"},
        Transition{Status::cancelled, Event::setValue, nothingThrown, "cancelled"},
        Transition{Status::cancelled, Event::setException, nothingThrown, "cancelled"},
        Transition{Status::cancelled, Event::cancel, nothingThrown, "cancelled"},
        Transition{Status::cancelled, Event::abandon, nothingThrown, "cancelled"},
        Transition{Status::cancelled, Event::retrieveFuture, nothingThrown, "cancelled"}),
    [](const auto& row) { return std::string(name(row.param.from)) + name(row.param.event); });

// Continuations

class SharedFutureStateContinuation : public ::testing::Test {
protected:
    // Attaches a continuation that counts its runs and takes nothing.
    void attachCounting() {
        state->attach(continuation([this](Future<int>&&) { ++runs; }), state);
    }

    void setValue(int value) { state->setValue(std::make_unique<int>(value), state); }

    const std::shared_ptr<State> state = std::make_shared<State>();
    int runs = 0;
};

TEST_F(SharedFutureStateContinuation, WaitsOnAPendingState) {
    attachCounting();
    EXPECT_EQ(runs, 0);
}

TEST_F(SharedFutureStateContinuation, RunsOnTheResolvingThread) {
    std::thread::id ranOn;
    state->attach(continuation([&](Future<int>&&) { ranOn = std::this_thread::get_id(); }), state);
    std::thread producer([this] { setValue(1); });
    const std::thread::id producerId = producer.get_id();
    producer.join();
    EXPECT_EQ(ranOn, producerId);
}

TEST_F(SharedFutureStateContinuation, RunsForAnException) {
    attachCounting();
    state->setException(invalidArgument("reason"), state);
    EXPECT_EQ(runs, 1);
}

TEST_F(SharedFutureStateContinuation, RunsWhenTheProducerGoes) {
    attachCounting();
    state->abandon(state);
    EXPECT_EQ(runs, 1);
}

TEST_F(SharedFutureStateContinuation, RunsOnlyOnceWhenTheProducerGoesAfterResolving) {
    attachCounting();
    setValue(1);
    state->abandon(state);
    EXPECT_EQ(runs, 1);
}

TEST_F(SharedFutureStateContinuation, RunsAtOnceOnTheAttachingThreadOfAResolvedState) {
    setValue(1);
    std::thread::id ranOn;
    state->attach(continuation([&](Future<int>&&) { ranOn = std::this_thread::get_id(); }), state);
    EXPECT_EQ(ranOn, std::this_thread::get_id());
}

TEST_F(SharedFutureStateContinuation, SecondOneIsRefused) {
    attachCounting();
    EXPECT_EQ(thrownText<std::runtime_error>([this] { attachCounting(); }), alreadyTaken);
    setValue(1);
    EXPECT_EQ(runs, 1);
}

TEST_F(SharedFutureStateContinuation, IsRefusedOnceTheResultIsTaken) {
    setValue(1);
    state->get();
    EXPECT_EQ(thrownText<std::runtime_error>([this] { attachCounting(); }), alreadyTaken);
    EXPECT_EQ(runs, 0);
}

TEST_F(SharedFutureStateContinuation, GetIsRefusedWhileItWaits) {
    attachCounting();
    EXPECT_EQ(thrownText<std::runtime_error>([this] { state->get(); }), alreadyTaken);
}

TEST_F(SharedFutureStateContinuation, TakesTheResultAlthoughAFutureWasRetrieved) {
    const Future<int> retrieved = state->retrieveFuture(state);
    int seen = 0;
    state->attach(continuation([&](Future<int>&& future) { seen = future.get(); }), state);
    setValue(5);
    EXPECT_EQ(seen, 5);
}

TEST_F(SharedFutureStateContinuation, ClearsBothFlagsBeforeItIsInvoked) {
    const Future<int> retrieved = state->retrieveFuture(state);
    bool retrievedAgain = false;
    state->attach(continuation([&](Future<int>&&) {
                      Future<int> again = state->retrieveFuture(state);
                      retrievedAgain = again.get() == 5;
                  }),
                  state);
    setValue(5);
    EXPECT_TRUE(retrievedAgain);
}

TEST_F(SharedFutureStateContinuation, AnotherOneCanFollowIt) {
    attachCounting();
    setValue(5);
    attachCounting();
    EXPECT_EQ(runs, 2);
}

TEST_F(SharedFutureStateContinuation, ResultItLeftCanBeTakenAfterwards) {
    attachCounting();
    setValue(5);
    EXPECT_EQ(state->retrieveFuture(state).get(), 5);
}

TEST_F(SharedFutureStateContinuation, ResultItTookIsGone) {
    state->attach(continuation([](Future<int>&& future) { future.get(); }), state);
    setValue(5);
    EXPECT_EQ(thrownText<std::runtime_error>([this] { state->retrieveFuture(state).get(); }),
              alreadyTaken);
}

TEST_F(SharedFutureStateContinuation, IsDestroyedBeforeTheResolvingCallReturns) {
    std::vector<std::string> steps;
    state->attach(continuation([&](Future<int>&&) { steps.push_back("invoked"); },
                               [&] { steps.push_back("destroyed"); }),
                  state);
    setValue(1);
    steps.push_back("returned");
    EXPECT_EQ(steps, (std::vector<std::string>{"invoked", "destroyed", "returned"}));
}

TEST_F(SharedFutureStateContinuation, ExceptionReachesWhoeverSetTheValue) {
    state->attach(continuation([](Future<int>&&) { throw std::out_of_range("from inside"); }),
                  state);
    EXPECT_EQ(thrownText<std::out_of_range>([this] { setValue(1); }), "from inside");
}

TEST_F(SharedFutureStateContinuation, ExceptionReachesWhoeverAttached) {
    setValue(1);
    EXPECT_EQ(thrownText<std::out_of_range>([this] {
                  state->attach(
                      continuation([](Future<int>&&) { throw std::out_of_range("from inside"); }),
                      state);
              }),
              "from inside");
}

TEST_F(SharedFutureStateContinuation, IsDestroyedWhenItThrows) {
    bool destroyed = false;
    state->attach(continuation([](Future<int>&&) { throw std::out_of_range("from inside"); },
                               [&] { destroyed = true; }),
                  state);
    EXPECT_THROW(setValue(1), std::out_of_range);
    EXPECT_TRUE(destroyed);
}

TEST_F(SharedFutureStateContinuation, ExceptionLeavesTheStateResolved) {
    state->attach(continuation([](Future<int>&&) { throw std::out_of_range("from inside"); }),
                  state);
    EXPECT_THROW(setValue(1), std::out_of_range);
    EXPECT_EQ(observe(state), "value 1");
}

TEST_F(SharedFutureStateContinuation, NoLockIsHeldWhileItIsInvoked) {
    bool free = false;
    state->attach(continuation([&](Future<int>&&) {
                      free = completes([shared = state] { shared->cancel(); });
                  }),
                  state);
    setValue(1);
    EXPECT_TRUE(free);
}

TEST_F(SharedFutureStateContinuation, NoLockIsHeldWhileItIsDestroyedAfterItsRun) {
    bool free = false;
    state->attach(continuation([](Future<int>&&) {},
                               [&] { free = completes([shared = state] { shared->cancel(); }); }),
                  state);
    setValue(1);
    EXPECT_TRUE(free);
}

TEST_F(SharedFutureStateContinuation, NoLockIsHeldWhileACancelDestroysIt) {
    bool free = false;
    state->attach(continuation([](Future<int>&&) {},
                               [&] { free = completes([shared = state] { shared->cancel(); }); }),
                  state);
    state->cancel();
    EXPECT_TRUE(free);
}

TEST_F(SharedFutureStateContinuation, NoLockIsHeldWhileACancelledStateRefusesIt) {
    bool free = false;
    state->cancel();
    state->attach(continuation([](Future<int>&&) {},
                               [&] { free = completes([shared = state] { shared->cancel(); }); }),
                  state);
    EXPECT_TRUE(free);
}

TEST_F(SharedFutureStateContinuation, NoLockIsHeldWhileARefusedOneIsDestroyed) {
    bool free = false;
    attachCounting();
    EXPECT_THROW(
        state->attach(
            continuation([](Future<int>&&) {},
                         [&] { free = completes([shared = state] { shared->cancel(); }); }),
            state),
        std::runtime_error);
    EXPECT_TRUE(free);
}

TEST_F(SharedFutureStateContinuation, IsDestroyedWithoutHavingRunWhenTheStateDies) {
    bool destroyed = false;
    auto owned = std::make_shared<State>();
    owned->attach(continuation([this](Future<int>&&) { ++runs; }, [&] { destroyed = true; }),
                  owned);
    owned.reset();
    EXPECT_TRUE(destroyed);
    EXPECT_EQ(runs, 0);
}

// Lifetime

TEST(SharedFutureState, LivesAsLongAsAnyFuture) {
    std::weak_ptr<State> observer;
    Future<int> future;
    {
        const auto state = std::make_shared<State>();
        observer = state;
        future = state->retrieveFuture(state);
    }
    EXPECT_FALSE(observer.expired());
    future = Future<int>();
    EXPECT_TRUE(observer.expired());
}

TEST(SharedFutureState, BornWithAValueHandsOutItsFutureOnce) {
    const auto state = std::make_shared<State>(std::make_unique<int>(3));
    EXPECT_EQ(state->retrieveFuture(state).get(), 3);
    EXPECT_THROW(state->retrieveFuture(state), std::runtime_error);
}

TEST(SharedFutureState, BornWithAValueRefusesAnother) {
    const auto state = std::make_shared<State>(std::make_unique<int>(3));
    EXPECT_EQ(
        thrownText<std::runtime_error>([&] { state->setValue(std::make_unique<int>(4), state); }),
        alreadyResolved);
}

// What a `get` throws that waits when `event` comes. Of two that ask one is refused as soon as the
// other waits.
template <class Event>
std::string thrownBehind(Event event) {
    struct Scene {
        const std::shared_ptr<State> state = std::make_shared<State>();
        Latch refused;
        Latch answered;
        std::string text;
    };
    const auto scene = std::make_shared<Scene>();
    for (int number = 0; number < 2; ++number) {
        std::thread([scene] {
            const std::string text = thrownText<std::runtime_error>([&] { scene->state->get(); });
            if (text == alreadyTaken) return scene->refused.countDown();
            scene->text = text;
            scene->answered.countDown();
        }).detach();
    }
    EXPECT_TRUE(scene->refused.wait());
    event(scene->state);
    return scene->answered.wait() ? scene->text : "<waits on>";
}

TEST(SharedFutureState, WakesWhoWaits) {
    using StatePtr = std::shared_ptr<State>;
    EXPECT_EQ(thrownBehind(
                  [](const StatePtr& state) { state->setValue(std::make_unique<int>(1), state); }),
              nothingThrown);
    EXPECT_EQ(thrownBehind([](const StatePtr& state) {
                  state->setException(std::make_exception_ptr(std::runtime_error("reason")), state);
              }),
              "reason");
    EXPECT_EQ(thrownBehind([](const StatePtr& state) { state->cancel(); }),
              "Future has been cancelled.");
    EXPECT_EQ(thrownBehind([](const StatePtr& state) { state->abandon(state); }), brokenPromise);
}

TEST(SharedFutureState, ManyThreadsSettleItOnce) {
    constexpr int producers = 4;
    for (int round = 0; round < raceRounds(); ++round) {
        const auto state = std::make_shared<State>();
        Latch start(producers);
        std::atomic<int> settled{0};
        std::vector<std::thread> threads;
        for (int value = 0; value < producers; ++value) {
            threads.emplace_back([&, value] {
                EXPECT_TRUE(start.arriveAndWait());
                const std::string text = thrownText<std::runtime_error>(
                    [&] { state->setValue(std::make_unique<int>(value), state); });
                EXPECT_TRUE(text == nothingThrown || text == alreadyResolved) << text;
                if (text == nothingThrown) ++settled;
            });
        }
        EXPECT_LT(state->get(), producers);
        for (std::thread& thread : threads) thread.join();
        EXPECT_EQ(settled, 1);
    }
}

}  // namespace
