#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "framework/Future.hpp"
#include "tests/framework/CountedValue.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/framework/ResultSamples.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::alreadyResolved;
using velkor::testing::alreadyTaken;
using velkor::testing::completes;
using velkor::testing::CountedValue;
using velkor::testing::invalidArgument;
using velkor::testing::ObservedMove;
using velkor::testing::raceRounds;
using velkor::testing::ResultSample;
using velkor::testing::thrownText;

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
              alreadyResolved);
    EXPECT_TRUE(TestFixture::Sample::matches(this->future.get()));
}

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

TEST(FutureGet, NoLockIsHeldWhileTheValueIsMoved) {
    Promise<ObservedMove> promise;
    Future<ObservedMove> future = promise.getFuture();
    int moves = 0;
    promise.setValue(ObservedMove([&] {
        ++moves;
        EXPECT_TRUE(completes([&] {
            EXPECT_THROW(promise.getFuture(), std::runtime_error);  // takes the lock
        }));
    }));
    EXPECT_EQ(moves, 1);
    future.get();
    EXPECT_EQ(moves, 2);
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
    for (int round = 0; round < raceRounds(); ++round) {
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
    for (int round = 0; round < raceRounds(); ++round) {
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

}  // namespace
