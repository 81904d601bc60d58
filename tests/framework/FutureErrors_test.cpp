#include <gtest/gtest.h>

#include <exception>
#include <stdexcept>
#include <string>
#include <utility>

#include "framework/Future.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::alreadyResolved;
using velkor::testing::invalidArgument;
using velkor::testing::thrownText;

// The fixed texts, one each.

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
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setValue(2); }), alreadyResolved);
}

TEST(FutureErrorText, ValueAfterExceptionIsRefused) {
    Promise<int> promise;
    promise.setException(invalidArgument("first"));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setValue(2); }), alreadyResolved);
}

TEST(FutureErrorText, ExceptionAfterValueIsRefused) {
    Promise<int> promise;
    promise.setValue(1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setException(invalidArgument("")); }),
              alreadyResolved);
}

TEST(FutureErrorText, ExceptionAfterExceptionIsRefused) {
    Promise<int> promise;
    promise.setException(invalidArgument("first"));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { promise.setException(invalidArgument("")); }),
              alreadyResolved);
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

}  // namespace
