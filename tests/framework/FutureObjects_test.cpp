#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include "framework/Future.hpp"
#include "tests/framework/CountedValue.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::alreadyTaken;
using velkor::testing::completes;
using velkor::testing::FailsToMove;
using velkor::testing::thrownText;

TEST(FutureObject, IsMoveOnly) {
    EXPECT_FALSE(std::is_copy_constructible_v<Future<int>>);
    EXPECT_FALSE(std::is_copy_assignable_v<Future<int>>);
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<Future<int>>);
    EXPECT_TRUE(std::is_nothrow_move_assignable_v<Future<int>>);
}

TEST(FutureObject, DefaultConstructedIsInvalid) {
    EXPECT_FALSE(Future<int>().valid());
}

TEST(FutureObject, MadeFromANullStateIsInvalid) {
    EXPECT_FALSE(Future<int>(nullptr).valid());
}

TEST(FutureObject, MadeByAPromiseIsValid) {
    Promise<int> promise;
    EXPECT_TRUE(promise.getFuture().valid());
}

TEST(FutureObject, MovedFromIsInvalid) {
    Future<int> future = makeReadyFuture(1);
    const Future<int> owner = std::move(future);
    EXPECT_FALSE(future.valid());
}

TEST(FutureObject, MovedToKeepsTheResult) {
    Future<int> future = makeReadyFuture(1);
    Future<int> owner = std::move(future);
    EXPECT_EQ(owner.get(), 1);
}

TEST(FutureObject, MovedToRemembersItsContinuation) {
    Future<int> future = makeReadyFuture(1);
    future.then([](Future<int>&&) { return true; });
    Future<int> owner = std::move(future);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { owner.get(); }), alreadyTaken);
}

TEST(FutureObject, MoveAssignmentReplacesAFutureWithAContinuation) {
    Future<int> future = makeReadyFuture(1);
    future.then([](Future<int>&&) { return true; });
    future = makeReadyFuture(2);
    EXPECT_EQ(future.get(), 2);
}

TEST(FutureObject, MoveAssignmentLetsTheOldResultGo) {
    const auto witness = std::make_shared<int>(0);
    Future<std::shared_ptr<int>> future = makeReadyFuture(witness);
    future = Future<std::shared_ptr<int>>();
    EXPECT_EQ(witness.use_count(), 1);
}

TEST(FutureObject, SurvivesMoveAssignmentToItself) {
    Future<int> future = makeReadyFuture(1);
    Future<int>& same = future;
    future = std::move(same);
    EXPECT_EQ(future.get(), 1);
}

TEST(FutureObject, DestructionLeavesTheProducerAlone) {
    Promise<int> promise;
    { const Future<int> dropped = promise.getFuture(); }
    EXPECT_NO_THROW(promise.setValue(1));
}

TEST(FutureObject, DroppedFutureStillRunsItsContinuation) {
    Promise<int> promise;
    int seen = 0;
    promise.getFuture().then([&](Future<int>&& result) { return seen = result.get(); });
    promise.setValue(3);
    EXPECT_EQ(seen, 3);
}

TEST(PromiseObject, IsMoveOnly) {
    EXPECT_FALSE(std::is_copy_constructible_v<Promise<int>>);
    EXPECT_FALSE(std::is_copy_assignable_v<Promise<int>>);
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<Promise<int>>);
    EXPECT_TRUE(std::is_nothrow_move_assignable_v<Promise<int>>);
}

// What a continuation lets out of the destructor ends the process.
TEST(PromiseObject, DestructorNeverThrows) {
    EXPECT_TRUE(std::is_nothrow_destructible_v<Promise<int>>);
}

TEST(PromiseObject, IsValidUntilMovedFrom) {
    Promise<int> promise;
    EXPECT_TRUE(promise.valid());
    const Promise<int> owner = std::move(promise);
    EXPECT_FALSE(promise.valid());
    EXPECT_TRUE(owner.valid());
}

TEST(PromiseObject, StaysValidOnceResolved) {
    Promise<int> promise;
    promise.setValue(1);
    EXPECT_TRUE(promise.valid());
}

TEST(PromiseObject, MovedFromDoesNotResolveItsStateWhenDestroyed) {
    Promise<int> owner;
    Future<int> future = owner.getFuture();
    {
        Promise<int> promise = std::move(owner);
        owner = std::move(promise);
    }
    owner.setValue(1);
    EXPECT_EQ(future.get(), 1);
}

TEST(PromiseObject, MoveAssignmentAbandonsTheOldState) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    promise = Promise<int>();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }),
              "Promise destroyed before it provided a value.");
}

TEST(PromiseObject, SurvivesMoveAssignmentToItself) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    Promise<int>& same = promise;
    promise = std::move(same);
    promise.setValue(1);
    EXPECT_EQ(future.get(), 1);
}

TEST(PromiseObject, FutureCanBeHadAfterTheValueWasSet) {
    Promise<int> promise;
    promise.setValue(1);
    EXPECT_EQ(promise.getFuture().get(), 1);
}

TEST(PromiseObject, DestructionAfterAValueKeepsIt) {
    Future<int> future;
    {
        Promise<int> promise;
        future = promise.getFuture();
        promise.setValue(1);
    }
    EXPECT_EQ(future.get(), 1);
}

TEST(PromiseObject, DestructionAfterACancellationKeepsIt) {
    Future<int> future;
    {
        Promise<int> promise;
        future = promise.getFuture();
        future.cancel();
    }
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), "Future has been cancelled.");
}

TEST(PromiseObject, NullExceptionLeavesTheResultPending) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    EXPECT_THROW(promise.setException(nullptr), std::invalid_argument);
    promise.setValue(1);
    EXPECT_EQ(future.get(), 1);
}

TEST(PromiseObject, RefusedSecondValueIsDestroyed) {
    const auto witness = std::make_shared<int>(0);
    Promise<std::shared_ptr<int>> promise;
    promise.setValue(nullptr);
    EXPECT_THROW(promise.setValue(witness), std::runtime_error);
    EXPECT_EQ(witness.use_count(), 1);
}

TEST(PromiseObject, ValueThatFailsToMoveLeavesTheResultPending) {
    Promise<FailsToMove> promise;
    Future<FailsToMove> future = promise.getFuture();
    EXPECT_THROW(promise.setValue(FailsToMove{true}), std::runtime_error);
    promise.setValue(FailsToMove{false});
    EXPECT_FALSE(future.get().armed);
}

TEST(PromiseObject, ValueThatFailsToMoveLeavesNoLockBehind) {
    Promise<FailsToMove> promise;
    Future<FailsToMove> future = promise.getFuture();
    EXPECT_THROW(promise.setValue(FailsToMove{true}), std::runtime_error);
    EXPECT_TRUE(completes([&] { future.cancel(); }));
}

TEST(PromiseObject, ContinuationWaitsOnWhenAValueFailsToMove) {
    Promise<FailsToMove> promise;
    int runs = 0;
    promise.getFuture().then([&](Future<FailsToMove>&&) { return ++runs; });
    EXPECT_THROW(promise.setValue(FailsToMove{true}), std::runtime_error);
    EXPECT_EQ(runs, 0);
    promise.setValue(FailsToMove{false});
    EXPECT_EQ(runs, 1);
}

}  // namespace
