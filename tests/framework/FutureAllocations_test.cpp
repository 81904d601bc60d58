#include <gtest/gtest.h>

#include <cstddef>
#include <exception>
#include <memory>
#include <string>
#include <utility>

#include "framework/Future.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace {

using velkor::Future;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::countAllocations;

TEST(FutureAllocations, ReadyMadeFutureMakesTwo) {
    EXPECT_EQ(countAllocations([] { makeReadyFuture(1); }), 2U);
}

TEST(FutureAllocations, ReadyMadeFutureOfALongTextMakesTwo) {
    std::string text(1000, 'x');
    EXPECT_EQ(countAllocations([&] { makeReadyFuture(std::move(text)); }), 2U);
}

TEST(FutureAllocations, GetMakesNone) {
    Future<int> future = makeReadyFuture(1);
    EXPECT_EQ(countAllocations([&] { future.get(); }), 0U);
}

TEST(FutureAllocations, GetOfALongTextMakesNone) {
    Future<std::string> future = makeReadyFuture(std::string(1000, 'x'));
    EXPECT_EQ(countAllocations([&] { future.get(); }), 0U);
}

TEST(FutureAllocations, PromiseWithItsFutureMakesOne) {
    Future<int> future;
    std::unique_ptr<Promise<int>> promise;
    const std::size_t objectItself = 1;
    EXPECT_EQ(countAllocations([&] {
                  promise = std::make_unique<Promise<int>>();
                  future = promise->getFuture();
              }),
              objectItself + 1U);
}

TEST(FutureAllocations, SetValueMakesOne) {
    Promise<int> promise;
    EXPECT_EQ(countAllocations([&] { promise.setValue(1); }), 1U);
}

TEST(FutureAllocations, SetExceptionMakesNone) {
    Promise<int> promise;
    const std::exception_ptr error = std::make_exception_ptr(1);
    EXPECT_EQ(countAllocations([&] { promise.setException(error); }), 0U);
}

TEST(FutureAllocations, CancelMakesNone) {
    Promise<int> promise;
    Future<int> future = promise.getFuture();
    EXPECT_EQ(countAllocations([&] { future.cancel(); }), 0U);
}

TEST(FutureAllocations, DisabledLogRecordMakesNone) {
    const velkor::common::DiagnosticLogger logger("future-allocation-tests");
    const std::string key = "some.key";
    EXPECT_EQ(countAllocations([&] { logger.write(velkor::common::debug, "get: ", key); }), 0U);
}

}  // namespace
