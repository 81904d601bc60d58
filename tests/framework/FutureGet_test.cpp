#include <gtest/gtest.h>

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
#include "tests/framework/ResultSamples.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::completes;
using velkor::testing::CountedValue;
using velkor::testing::FailsToMove;
using velkor::testing::ResultSample;
using velkor::testing::thrownText;

constexpr auto alreadyTaken =
    "Future already returned it's value or has an associated continuation.";

std::exception_ptr invalidArgument(const std::string& text) {
    return std::make_exception_ptr(std::invalid_argument(text));
}

// What every type of result has in common.

template <class T>
class FutureOfEachResult : public ::testing::Test {
protected:
    using Sample = ResultSample<T>;

    Promise<T> promise;
    Future<T> future = promise.getFuture();
};

TYPED_TEST_SUITE(FutureOfEachResult, velkor::testing::ResultTypes, velkor::testing::ResultNames);

TYPED_TEST(FutureOfEachResult, GetGivesTheValueThatWasSet) {
    this->promise.setValue(TestFixture::Sample::make());
    EXPECT_TRUE(TestFixture::Sample::matches(this->future.get()));
}

TYPED_TEST(FutureOfEachResult, ReadyMadeFutureGivesItsValue) {
    Future<TypeParam> ready = makeReadyFuture<TypeParam>(TestFixture::Sample::make());
    EXPECT_TRUE(TestFixture::Sample::matches(ready.get()));
}

TYPED_TEST(FutureOfEachResult, ReadyMadeFailureThrowsItsException) {
    Future<TypeParam> failed = makeFailedFuture<TypeParam>(invalidArgument("reason"));
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { failed.get(); }), "reason");
}

TYPED_TEST(FutureOfEachResult, GetWaitsForAValueFromAnotherThread) {
    bool matched = false;
    std::thread producer([&] { this->promise.setValue(TestFixture::Sample::make()); });
    EXPECT_TRUE(completes([&] { matched = TestFixture::Sample::matches(this->future.get()); }));
    producer.join();
    EXPECT_TRUE(matched);
}

TYPED_TEST(FutureOfEachResult, GetThrowsTheExceptionThatWasSet) {
    this->promise.setException(invalidArgument("reason"));
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { this->future.get(); }), "reason");
}

TYPED_TEST(FutureOfEachResult, SecondGetThrows) {
    this->promise.setValue(TestFixture::Sample::make());
    this->future.get();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { this->future.get(); }), alreadyTaken);
}

TYPED_TEST(FutureOfEachResult, DestroyedPromiseFailsTheFuture) {
    { const Promise<TypeParam> abandoned = std::move(this->promise); }
    EXPECT_EQ(thrownText<std::runtime_error>([&] { this->future.get(); }),
              "Promise destroyed before it provided a value.");
}

TYPED_TEST(FutureOfEachResult, ValueAfterCancellationIsDropped) {
    this->future.cancel();
    EXPECT_NO_THROW(this->promise.setValue(TestFixture::Sample::make()));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { this->future.get(); }),
              "Future has been cancelled.");
}

TYPED_TEST(FutureOfEachResult, ContinuationReceivesTheValue) {
    Future<bool> matched = this->future.then(
        [](Future<TypeParam>&& result) { return TestFixture::Sample::matches(result.get()); });
    this->promise.setValue(TestFixture::Sample::make());
    EXPECT_TRUE(matched.get());
}

TYPED_TEST(FutureOfEachResult, SecondValueIsRefused) {
    this->promise.setValue(TestFixture::Sample::make());
    EXPECT_EQ(thrownText<std::runtime_error>(
                  [&] { this->promise.setValue(TestFixture::Sample::make()); }),
              "Promise already resolved.");
    EXPECT_TRUE(TestFixture::Sample::matches(this->future.get()));
}

// The fixed texts, one each; suites below lean on them.

TEST(FutureErrorText, MovedFromPromiseRefusesGetFuture) {
    Promise<int> promise;
    const Promise<int> owner = std::move(promise);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.getFuture(); }),
              "Promise state isn't valid!");
}

TEST(FutureErrorText, MovedFromPromiseRefusesSetValue) {
    Promise<int> promise;
    const Promise<int> owner = std::move(promise);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setValue(1); }),
              "Promise state isn't valid!");
}

TEST(FutureErrorText, MovedFromPromiseRefusesSetException) {
    Promise<int> promise;
    const Promise<int> owner = std::move(promise);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setException(invalidArgument("")); }),
              "Promise state isn't valid!");
}

TEST(FutureErrorText, SecondGetFutureIsRefused) {
    Promise<int> promise;
    const Future<int> future = promise.getFuture();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.getFuture(); }),
              "Promise already returned a future.");
}

TEST(FutureErrorText, ValueAfterValueIsRefused) {
    Promise<int> promise;
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setValue(2); }),
              "Promise already resolved.");
}

TEST(FutureErrorText, ValueAfterExceptionIsRefused) {
    Promise<int> promise;
    promise.setException(invalidArgument("first"));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setValue(2); }),
              "Promise already resolved.");
}

TEST(FutureErrorText, ExceptionAfterValueIsRefused) {
    Promise<int> promise;
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setException(invalidArgument("")); }),
              "Promise already resolved.");
}

TEST(FutureErrorText, ExceptionAfterExceptionIsRefused) {
    Promise<int> promise;
    promise.setException(invalidArgument("first"));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setException(invalidArgument("")); }),
              "Promise already resolved.");
}

TEST(FutureErrorText, AbandonedPromiseIsNamed) {
    Future<int> future;
    {
        Promise<int> promise;
        future = promise.getFuture();
    }
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }),
              "Promise destroyed before it provided a value.");
}

TEST(FutureErrorText, DefaultConstructedFutureRefusesGet) {
    Future<int> future;
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), "Future state isn't valid!");
}

TEST(FutureErrorText, SecondGetKeepsItsSpelling) {
    Future<int> future = makeReadyFuture(1);
    future.get();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }),
              "Future already returned it's value or has an associated continuation.");
}

TEST(FutureErrorText, CancelledFutureRefusesGet) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    future.cancel();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), "Future has been cancelled.");
}

// No sequence of calls reaches this one: it guards against a damaged state.
TEST(FutureErrorText, InvalidStateKeepsItsText) {
    EXPECT_STREQ(velkor::detail::future_errors::invalidState, "Invalid Future state reached.");
}

TEST(FutureErrorText, NullExceptionIsAnInvalidArgument) {
    Promise<int> promise;
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { promise.setException(nullptr); }),
              "A promise can't be resolved with a null exception.");
}

TEST(FutureErrorText, NullReadyMadeFailureIsAnInvalidArgument) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { makeFailedFuture<int>(nullptr); }),
              "A promise can't be resolved with a null exception.");
}

// get

TEST(FutureGet, SecondGetAfterAnExceptionMeetsTheClaim) {
    Future<int> future = makeFailedFuture<int>(invalidArgument("reason"));
    EXPECT_THROW(future.get(), std::invalid_argument);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), alreadyTaken);
}

TEST(FutureGet, SecondGetAfterACancellationMeetsTheClaim) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    future.cancel();
    EXPECT_THROW(future.get(), std::runtime_error);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { future.get(); }), alreadyTaken);
}

TEST(FutureGet, FutureStaysValid) {
    Future<int> future = makeReadyFuture(1);
    future.get();
    EXPECT_TRUE(future.valid());
}

TEST(FutureGet, GivesTheProducersOwnExceptionObject) {
    const std::exception_ptr error = invalidArgument("reason");
    Future<int> future = makeFailedFuture<int>(error);
    std::exception_ptr caught;
    try {
        future.get();
    } catch (...) {
        caught = std::current_exception();
    }
    EXPECT_EQ(caught, error);
}

TEST(FutureGet, WrappedExceptionIsUnwrapped) {
    Future<int> future =
        makeFailedFuture<int>(std::make_exception_ptr(invalidArgument("inner reason")));
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { future.get(); }), "inner reason");
}

TEST(FutureGet, OnlyOneLevelIsUnwrapped) {
    const std::exception_ptr wrapper = std::make_exception_ptr(invalidArgument("inner reason"));
    Future<int> future = makeFailedFuture<int>(std::make_exception_ptr(wrapper));
    std::exception_ptr caught;
    try {
        future.get();
    } catch (const std::exception_ptr& stillWrapped) {
        caught = stillWrapped;
    }
    ASSERT_NE(caught, nullptr);
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { std::rethrow_exception(caught); }),
              "inner reason");
}

TEST(FutureGet, WrappedNullExceptionIsThrownAsItIs) {
    Future<int> future = makeFailedFuture<int>(std::make_exception_ptr(std::exception_ptr()));
    bool caughtNull = false;
    try {
        future.get();
    } catch (const std::exception_ptr& wrapped) {
        caughtNull = wrapped == nullptr;
    }
    EXPECT_TRUE(caughtNull);
}

TEST(FutureGet, ExceptionOfAnotherTypePasses) {
    Future<int> future = makeFailedFuture<int>(std::make_exception_ptr(42));
    EXPECT_THROW(future.get(), int);
}

TEST(FutureGet, StoredExceptionIsLetGoOf) {
    const auto witness = std::make_shared<int>(0);
    Future<int> future = makeFailedFuture<int>(std::make_exception_ptr(witness));
    EXPECT_THROW(future.get(), std::shared_ptr<int>);
    EXPECT_EQ(witness.use_count(), 1);
}

TEST(FutureGet, ValueIsLetGoOf) {
    const auto witness = std::make_shared<int>(0);
    Future<std::shared_ptr<int>> future = makeReadyFuture(witness);
    future.get();
    EXPECT_EQ(witness.use_count(), 1);
}

TEST(FutureGet, GivesAnObjectIndependentOfTheProducersCopy) {
    std::vector<int> original{1, 2, 3};
    Promise<std::vector<int>> promise;
    Future<std::vector<int>> future = promise.getFuture();
    promise.setValue(original);
    std::vector<int> received = future.get();
    received.push_back(4);
    EXPECT_EQ(original, (std::vector<int>{1, 2, 3}));
}

TEST(FutureGet, NeverCopiesAMovableValue) {
    CountedValue::copies = 0;
    Promise<CountedValue> promise;
    Future<CountedValue> future = promise.getFuture();
    promise.setValue(CountedValue{5});
    EXPECT_EQ(future.get().number, 5);
    EXPECT_EQ(CountedValue::copies, 0);
}

TEST(FutureGet, NeverCopiesAReadyMadeValue) {
    CountedValue::copies = 0;
    EXPECT_EQ(makeReadyFuture(CountedValue{5}).get().number, 5);
    EXPECT_EQ(CountedValue::copies, 0);
}

TEST(FutureGet, WakesWithTheBrokenPromiseText) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    std::string text;
    std::thread producer([owner = std::move(promise)]() mutable {
        const Promise<int> abandoned = std::move(owner);
    });
    EXPECT_TRUE(completes([&] { text = thrownText<std::runtime_error>([&] { future.get(); }); }));
    producer.join();
    EXPECT_EQ(text, "Promise destroyed before it provided a value.");
}

// The object may go away as soon as the result is in: what the producer still does must not touch
// the promise, nor a state that the consumer has let go of.
TEST(FutureGet, ConsumerMayDestroyPromiseAndFutureAsSoonAsItReturns) {
    for (int round = 0; round < 500; ++round) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        std::thread producer([shared = promise.get(), round] { shared->setValue(round); });
        EXPECT_EQ(future.get(), round);
        promise.reset();
        future = Future<int>();
        producer.join();
    }
}

TEST(FutureGet, ConsumerMayDestroyPromiseAndFutureAsSoonAsItThrows) {
    for (int round = 0; round < 500; ++round) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        std::thread producer([shared = promise.get(), error = std::make_exception_ptr(round)] {
            shared->setException(error);
        });
        EXPECT_THROW(future.get(), int);
        promise.reset();
        future = Future<int>();
        producer.join();
    }
}

// The objects themselves

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
