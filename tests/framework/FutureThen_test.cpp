#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include "framework/Future.hpp"
#include "tests/framework/CountedValue.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::alreadyTaken;
using velkor::testing::brokenPromise;
using velkor::testing::completes;
using velkor::testing::CountedValue;
using velkor::testing::Latch;
using velkor::testing::raceRounds;
using velkor::testing::thrownText;

class FutureThen : public ::testing::Test {
protected:
    int runs = 0;  // outlives the promise, whose destructor runs a continuation that still waits
    Promise<int> promise;
    Future<int> future = promise.getFuture();
};

int takeIt(Future<int>&& result) {
    return result.get();
}

TEST_F(FutureThen, GivesAFutureOfWhatTheCallableReturns) {
    Future<std::string> text =
        future.then([](Future<int>&& result) { return std::to_string(result.get()); });
    promise.setValue(12);
    EXPECT_EQ(text.get(), "12");
}

TEST_F(FutureThen, DoesNotRunBeforeThereIsAResult) {
    future.then([this](Future<int>&&) { return ++runs; });
    EXPECT_EQ(runs, 0);
}

TEST_F(FutureThen, RunsExactlyOnce) {
    future.then([this](Future<int>&&) { return ++runs; });
    promise.setValue(1);
    EXPECT_THROW(promise.setValue(2), std::runtime_error);
    EXPECT_EQ(runs, 1);
}

TEST_F(FutureThen, RunsOnTheThreadThatSetsTheValue) {
    std::thread::id ranOn;
    future.then([&](Future<int>&&) {
        ranOn = std::this_thread::get_id();
        return true;
    });
    std::thread producer([this] { promise.setValue(1); });
    const std::thread::id producerId = producer.get_id();
    producer.join();
    EXPECT_EQ(ranOn, producerId);
}

TEST_F(FutureThen, RunsAtOnceOnThisThreadWhenTheValueIsThere) {
    std::thread::id ranOn;
    promise.setValue(1);
    future.then([&](Future<int>&&) {
        ranOn = std::this_thread::get_id();
        return true;
    });
    EXPECT_EQ(ranOn, std::this_thread::get_id());
}

TEST_F(FutureThen, RunsAtOnceOnAReadyMadeFailure) {
    makeFailedFuture<int>(std::make_exception_ptr(1)).then([&](Future<int>&&) { return ++runs; });
    EXPECT_EQ(runs, 1);
}

TEST_F(FutureThen, CallableCanTakeTheResult) {
    int seen = 0;
    future.then([&](Future<int>&& result) { return seen = result.get(); });
    promise.setValue(8);
    EXPECT_EQ(seen, 8);
}

TEST_F(FutureThen, CallableReceivesAValidFuture) {
    bool valid = false;
    future.then([&](Future<int>&& result) { return valid = result.valid(); });
    promise.setValue(8);
    EXPECT_TRUE(valid);
}

TEST_F(FutureThen, CallableMeetsTheExceptionInGet) {
    Future<std::string> text = future.then([](Future<int>&& result) {
        return thrownText<std::invalid_argument>([&] { result.get(); });
    });
    promise.setException(std::make_exception_ptr(std::invalid_argument("reason")));
    EXPECT_EQ(text.get(), "reason");
}

TEST_F(FutureThen, CallableMeetsTheBrokenPromise) {
    Future<std::string> text = future.then(
        [](Future<int>&& result) { return thrownText<std::runtime_error>([&] { result.get(); }); });
    promise = Promise<int>();
    EXPECT_EQ(text.get(), brokenPromise);
}

TEST_F(FutureThen, ExceptionPassesDownAChainThatDoesNotHandleIt) {
    Future<int> last = future.then(takeIt).then(takeIt).then(takeIt);
    promise.setException(std::make_exception_ptr(std::invalid_argument("reason")));
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { last.get(); }), "reason");
}

TEST_F(FutureThen, ValuePassesDownAChain) {
    const auto addOne = [](Future<int>&& result) { return result.get() + 1; };
    Future<int> last = future.then(addOne).then(addOne).then(addOne);
    promise.setValue(1);
    EXPECT_EQ(last.get(), 4);
}

TEST_F(FutureThen, WhatTheCallableThrowsGoesDownstream) {
    Future<int> next =
        future.then([](Future<int>&&) -> int { throw std::out_of_range("too far"); });
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::out_of_range>([&] { next.get(); }), "too far");
}

TEST_F(FutureThen, SetValueDoesNotMeetWhatTheCallableThrows) {
    future.then([](Future<int>&&) -> int { throw std::out_of_range("too far"); });
    EXPECT_NO_THROW(promise.setValue(1));
}

TEST_F(FutureThen, DestructorOfThePromiseDoesNotMeetWhatTheCallableThrows) {
    Future<int> next =
        future.then([](Future<int>&&) -> int { throw std::out_of_range("too far"); });
    promise = Promise<int>();
    EXPECT_EQ(thrownText<std::out_of_range>([&] { next.get(); }), "too far");
}

TEST_F(FutureThen, ThenItselfDoesNotThrowWhatTheCallableThrows) {
    promise.setValue(1);
    Future<int> next;
    EXPECT_NO_THROW(
        next = future.then([](Future<int>&&) -> int { throw std::out_of_range("too far"); }));
    EXPECT_THROW(next.get(), std::out_of_range);
}

struct ThrowsWhenMoved {
    ThrowsWhenMoved() = default;
    ThrowsWhenMoved(const ThrowsWhenMoved&) { throw std::out_of_range("can't be boxed"); }
    ThrowsWhenMoved& operator=(const ThrowsWhenMoved&) = delete;
};

TEST_F(FutureThen, ResultThatCannotBeBoxedFailsDownstream) {
    ThrowsWhenMoved returned;
    Future<ThrowsWhenMoved> next =
        future.then([&](Future<int>&&) -> ThrowsWhenMoved& { return returned; });
    EXPECT_NO_THROW(promise.setValue(1));
    EXPECT_EQ(thrownText<std::out_of_range>([&] { next.get(); }), "can't be boxed");
}

// What may be given to then

TEST_F(FutureThen, TakesAMoveOnlyCallable) {
    Future<int> next = future.then([owned = std::make_unique<int>(40)](Future<int>&& result) {
        return *owned + result.get();
    });
    promise.setValue(2);
    EXPECT_EQ(next.get(), 42);
}

TEST_F(FutureThen, TakesACallableThatChangesItself) {
    Future<int> next = future.then([calls = 0](Future<int>&&) mutable { return ++calls; });
    promise.setValue(2);
    EXPECT_EQ(next.get(), 1);
}

TEST_F(FutureThen, TakesAFunction) {
    Future<int> next = future.then(takeIt);
    promise.setValue(2);
    EXPECT_EQ(next.get(), 2);
}

TEST_F(FutureThen, TakesAMemberFunctionOfTheFuture) {
    Future<int> next = future.then(&Future<int>::get);
    promise.setValue(2);
    EXPECT_EQ(next.get(), 2);
}

TEST_F(FutureThen, LeavesAnLvalueCallableUnharmed) {
    const auto shared = std::make_shared<int>(1);
    auto callable = [shared](Future<int>&& result) { return *shared + result.get(); };
    Future<int> next = future.then(callable);
    promise.setValue(2);
    EXPECT_EQ(next.get(), 3);
    EXPECT_EQ(callable(makeReadyFuture(5)), 6);
}

TEST_F(FutureThen, PassesAMoveOnlyResultOn) {
    Future<std::unique_ptr<int>> next =
        future.then([](Future<int>&& result) { return std::make_unique<int>(result.get()); });
    promise.setValue(2);
    EXPECT_EQ(*next.get(), 2);
}

TEST_F(FutureThen, ReturnedReferenceBecomesAValue) {
    std::string text = "before";
    auto next = future.then([&](Future<int>&&) -> const std::string& { return text; });
    static_assert(std::is_same_v<decltype(next), Future<std::string>>);
    promise.setValue(2);
    text = "after";
    EXPECT_EQ(next.get(), "before");
}

TEST_F(FutureThen, NeverCopiesTheResult) {
    CountedValue::copies = 0;
    Promise<CountedValue> source;
    Future<CountedValue> next = source.getFuture().then(
        [](Future<CountedValue>&& result) { return CountedValue(result.get().number + 1); });
    source.setValue(CountedValue{1});
    EXPECT_EQ(next.get().number, 2);
    EXPECT_EQ(CountedValue::copies, 0);
}

// The future that was given a continuation

TEST_F(FutureThen, StaysValid) {
    future.then(takeIt);
    EXPECT_TRUE(future.valid());
}

TEST_F(FutureThen, RefusesGetWhileTheContinuationWaits) {
    future.then(takeIt);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), alreadyTaken);
}

TEST_F(FutureThen, RefusesGetAfterTheContinuationTookTheResult) {
    future.then(takeIt);
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), alreadyTaken);
}

TEST_F(FutureThen, RefusesGetAfterTheContinuationLeftTheResult) {
    future.then([](Future<int>&&) { return true; });
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), alreadyTaken);
}

TEST_F(FutureThen, RefusesASecondContinuation) {
    future.then(takeIt);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.then(takeIt); }), alreadyTaken);
}

TEST_F(FutureThen, RefusesASecondContinuationAfterTheFirstRan) {
    future.then([](Future<int>&&) { return true; });
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.then(takeIt); }), alreadyTaken);
}

TEST_F(FutureThen, IsRefusedOnceTheResultIsTaken) {
    promise.setValue(1);
    future.get();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.then(takeIt); }), alreadyTaken);
}

TEST_F(FutureThen, IsRefusedOnAnInvalidFuture) {
    Future<int> invalid;
    EXPECT_EQ(thrownText<std::runtime_error>([&] { invalid.then(takeIt); }),
              "Future state isn't valid!");
}

TEST_F(FutureThen, RefusedCallableDoesNotRun) {
    promise.setValue(1);
    future.get();
    EXPECT_THROW(future.then([&](Future<int>&&) { return ++runs; }), std::runtime_error);
    EXPECT_EQ(runs, 0);
}

struct FailsToBeCaptured {
    FailsToBeCaptured() = default;
    FailsToBeCaptured(const FailsToBeCaptured&) { throw std::out_of_range("can't be kept"); }
    FailsToBeCaptured& operator=(const FailsToBeCaptured&) = delete;
    bool operator()(Future<int>&&) const { return true; }
};

TEST_F(FutureThen, CallableThatCannotBeKeptLeavesTheFutureUsable) {
    const FailsToBeCaptured callable;
    EXPECT_EQ(thrownText<std::out_of_range>([&] { future.then(callable); }), "can't be kept");
    promise.setValue(1);
    EXPECT_EQ(future.get(), 1);
}

// What is left in the state afterwards

TEST_F(FutureThen, PromiseGivesAFutureOnceMoreAfterwards) {
    future.then(takeIt);
    EXPECT_THROW(promise.getFuture(), std::runtime_error);
    promise.setValue(1);
    EXPECT_TRUE(promise.getFuture().valid());
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.getFuture(); }),
              "Promise already returned a future.");
}

TEST_F(FutureThen, ResultThatTheCallableLeftAnswersOnceMore) {
    future.then([](Future<int>&&) { return true; });
    promise.setValue(1);
    EXPECT_EQ(promise.getFuture().get(), 1);
}

TEST_F(FutureThen, ResultThatTheCallableTookDoesNotAnswerAgain) {
    future.then(takeIt);
    promise.setValue(1);
    Future<int> again = promise.getFuture();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { again.get(); }), alreadyTaken);
}

TEST_F(FutureThen, CallableMayKeepTheFutureForLater) {
    Future<int> kept;
    future.then([&](Future<int>&& result) {
        kept = std::move(result);
        return true;
    });
    promise.setValue(1);
    EXPECT_EQ(kept.get(), 1);
}

TEST_F(FutureThen, CallableMayAttachAnotherOneToTheFutureItReceives) {
    int seen = 0;
    future.then([&](Future<int>&& result) {
        result.then([&](Future<int>&& again) { return seen = again.get(); });
        return true;
    });
    promise.setValue(6);
    EXPECT_EQ(seen, 6);
}

TEST_F(FutureThen, CallableIsDestroyedOnceItRan) {
    const auto witness = std::make_shared<int>(0);
    Future<bool> next = future.then([witness](Future<int>&&) { return true; });
    promise.setValue(1);
    EXPECT_EQ(witness.use_count(), 1);
}

TEST_F(FutureThen, CallableIsDestroyedOnceItThrew) {
    const auto witness = std::make_shared<int>(0);
    Future<bool> next = future.then([witness](Future<int>&&) -> bool { throw *witness; });
    promise.setValue(1);
    EXPECT_EQ(witness.use_count(), 1);
}

// What the callable may do

TEST_F(FutureThen, NoLockIsHeldWhileTheCallableRuns) {
    bool free = false;
    Future<bool> next = future.then([&](Future<int>&& result) {
        const auto probe = std::make_shared<Future<int>>(std::move(result));
        return free = completes([probe] { probe->get(); });
    });
    promise.setValue(1);
    EXPECT_TRUE(free);
}

TEST_F(FutureThen, NoLockIsHeldWhileTheCallableRunsAtOnce) {
    promise.setValue(1);
    Future<bool> free = future.then([](Future<int>&& result) {
        const auto probe = std::make_shared<Future<int>>(std::move(result));
        return completes([probe] { probe->get(); });
    });
    EXPECT_TRUE(free.get());
}

TEST_F(FutureThen, CallableMayResolveOtherPromises) {
    Promise<int> other;
    future.then([&](Future<int>&& result) {
        other.setValue(result.get());
        return true;
    });
    promise.setValue(4);
    EXPECT_EQ(other.getFuture().get(), 4);
}

TEST_F(FutureThen, CallableMayDestroyThePromiseAndTheFuture) {
    auto ownPromise = std::make_unique<Promise<int>>();
    auto ownFuture = std::make_unique<Future<int>>(ownPromise->getFuture());
    ownFuture->then([&](Future<int>&& result) {
        ownFuture.reset();
        ownPromise.reset();
        return result.get();
    });
    ownPromise->setValue(1);
    EXPECT_EQ(ownPromise, nullptr);
}

TEST_F(FutureThen, CallableThatRunsAtOnceMayDestroyTheFuture) {
    auto ownFuture = std::make_unique<Future<int>>(makeReadyFuture(1));
    Future<int> next = ownFuture->then([&](Future<int>&& result) {
        ownFuture.reset();
        return result.get();
    });
    EXPECT_EQ(next.get(), 1);
}

// The downstream future

TEST_F(FutureThen, DroppedDownstreamFutureChangesNothing) {
    {
        const Future<int> dropped = future.then([&](Future<int>&&) { return ++runs; });
    }
    EXPECT_NO_THROW(promise.setValue(1));
    EXPECT_EQ(runs, 1);
}

TEST_F(FutureThen, CancelledDownstreamFutureDropsTheReturnedValue) {
    Future<int> next = future.then([&](Future<int>&&) { return ++runs; });
    next.cancel();
    EXPECT_NO_THROW(promise.setValue(1));
    EXPECT_EQ(runs, 1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { next.get(); }), "Future has been cancelled.");
}

TEST_F(FutureThen, WaiterDownstreamWakes) {
    Future<int> next = future.then(takeIt);
    std::thread producer([this] { promise.setValue(9); });
    int seen = 0;
    EXPECT_TRUE(completes([&] { seen = next.get(); }));
    producer.join();
    EXPECT_EQ(seen, 9);
}

// Races

TEST(FutureThenRace, AttachingWhileTheValueArrivesRunsTheCallableOnce) {
    for (int round = 0; round < raceRounds(); ++round) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        Latch start(2);
        std::atomic<int> runs{0};
        std::thread producer([&] {
            EXPECT_TRUE(start.arriveAndWait());
            promise.setValue(round);
        });
        EXPECT_TRUE(start.arriveAndWait());
        Future<int> next = future.then([&](Future<int>&& result) {
            ++runs;
            return result.get();
        });
        EXPECT_EQ(next.get(), round);
        producer.join();
        EXPECT_EQ(runs, 1);
    }
}

TEST(FutureThenRace, AttachingWhileThePromiseDiesRunsTheCallableOnce) {
    for (int round = 0; round < raceRounds(); ++round) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        Latch start(2);
        std::atomic<int> runs{0};
        std::thread producer([&] {
            EXPECT_TRUE(start.arriveAndWait());
            promise.reset();
        });
        EXPECT_TRUE(start.arriveAndWait());
        Future<int> next = future.then([&](Future<int>&&) { return ++runs; });
        EXPECT_EQ(next.get(), 1);
        producer.join();
        EXPECT_EQ(runs, 1);
    }
}

}  // namespace
