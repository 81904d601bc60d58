// Every allocation of an operation fails in turn. The operation leaves with `std::bad_alloc` or
// does what it says, what it was called on works afterwards, nothing is kept, and no result is
// lost.

#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "framework/Future.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/ScarceMemory.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeFailedFuture;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::brokenPromise;
using velkor::testing::failEachAllocation;
using velkor::testing::ScarceMemory;
using velkor::testing::thrownText;

int addOne(Future<int>&& result) {
    return result.get() + 1;
}

template <class T>
std::string brokenText(Future<T>& future) {
    return thrownText<std::runtime_error>([&] { future.get(); });
}

TEST(FutureWithoutMemory, MakingAPromiseFailsCleanly) {
    failEachAllocation([](ScarceMemory& memory) {
        const bool passed = memory.allows([] { const Promise<int> promise; });
        EXPECT_NE(passed, memory.hasRunOut());
    });
}

TEST(FutureWithoutMemory, MakingAReadyFutureFailsCleanly) {
    failEachAllocation([](ScarceMemory& memory) {
        Future<int> future;
        const bool passed = memory.allows([&] { future = makeReadyFuture(4); });
        EXPECT_EQ(future.valid(), passed);
    });
}

TEST(FutureWithoutMemory, MakingAFailedFutureFailsCleanly) {
    const std::exception_ptr error = std::make_exception_ptr(std::invalid_argument("reason"));
    failEachAllocation([&](ScarceMemory& memory) {
        Future<int> future;
        const bool passed = memory.allows([&] { future = makeFailedFuture<int>(error); });
        EXPECT_EQ(future.valid(), passed);
    });
}

TEST(FutureWithoutMemory, RefusedValueLeavesThePromiseUsable) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        if (!memory.allows([&] { promise.setValue(4); })) promise.setValue(4);
        EXPECT_EQ(future.get(), 4);
    });
}

TEST(FutureWithoutMemory, RefusedValueMayBeFollowedByTheDestructor) {
    failEachAllocation([](ScarceMemory& memory) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        const bool passed = memory.allows([&] { promise->setValue(4); });
        promise.reset();
        if (passed) return;
        EXPECT_EQ(brokenText(future), brokenPromise);
    });
}

TEST(FutureWithoutMemory, ExceptionIsPassedOn) {
    const std::exception_ptr error = std::make_exception_ptr(std::invalid_argument("reason"));
    failEachAllocation([&](ScarceMemory& memory) {
        std::string text;
        text.reserve(100);
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        EXPECT_TRUE(memory.allows([&] {
            promise.setException(error);
            try {
                future.get();
            } catch (const std::invalid_argument& caught) {
                text = caught.what();
            }
        }));
        EXPECT_EQ(text, "reason");
    });
}

TEST(FutureWithoutMemory, RefusedThenLeavesAPendingFutureUsable) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        Future<int> next;
        if (!memory.allows([&] { next = future.then(addOne); })) next = future.then(addOne);
        promise.setValue(4);
        EXPECT_EQ(next.get(), 5);
    });
}

// What the callable returns can't always be boxed: that failure is the result of the next future.
TEST(FutureWithoutMemory, RefusedThenLeavesAReadyFutureUsable) {
    failEachAllocation([](ScarceMemory& memory) {
        Future<int> future = makeReadyFuture(4);
        Future<int> next;
        if (!memory.allows([&] { next = future.then(addOne); })) {
            EXPECT_EQ(future.get(), 4);
        } else if (memory.hasRunOut()) {
            EXPECT_THROW(next.get(), std::bad_alloc);
        } else {
            EXPECT_EQ(next.get(), 5);
        }
    });
}

TEST(FutureWithoutMemory, RefusedThenLeavesItsCallableAlone) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        auto number = std::make_unique<int>(4);
        auto callable = [owned = std::move(number)](Future<int>&&) { return *owned; };
        Future<int> next;
        if (!memory.allows([&] { next = future.then(std::move(callable)); })) {
            next = future.then(std::move(callable));
        }
        promise.setValue(1);
        EXPECT_EQ(next.get(), 4);
    });
}

TEST(FutureWithoutMemory, ChainEndsWithItsValueOrWithTheShortage) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> last = promise.getFuture().then(addOne).then(addOne).then(addOne);
        const bool passed = memory.allows([&] { promise.setValue(1); });
        if (!passed) promise.setValue(1);
        if (passed && memory.hasRunOut()) {
            EXPECT_THROW(last.get(), std::bad_alloc);
        } else {
            EXPECT_EQ(last.get(), 4);
        }
    });
}

TEST(FutureWithoutMemory, DestroyedPromiseFailsItsFuture) {
    failEachAllocation([](ScarceMemory& memory) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        EXPECT_TRUE(memory.allows([&] { promise.reset(); }));
        EXPECT_EQ(brokenText(future), brokenPromise);
    });
}

TEST(FutureWithoutMemory, DestroyedPromiseFailsTheEndOfAChain) {
    failEachAllocation([](ScarceMemory& memory) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> last = promise->getFuture().then(addOne).then(addOne);
        EXPECT_TRUE(memory.allows([&] { promise.reset(); }));
        EXPECT_EQ(brokenText(last), brokenPromise);
    });
}

TEST(FutureWithoutMemory, GetNamesTheDestroyedPromise) {
    failEachAllocation([](ScarceMemory& memory) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        promise.reset();
        bool named = false;
        EXPECT_TRUE(memory.allows([&] {
            try {
                future.get();
            } catch (const std::runtime_error& error) {
                named = error.what() == std::string_view(brokenPromise);
            }
        }));
        EXPECT_TRUE(named);
    });
}

TEST(FutureWithoutMemory, CancelFailsTheEndOfAChain) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        Future<int> last = future.then(addOne).then(addOne);
        EXPECT_TRUE(memory.allows([&] { future.cancel(); }));
        EXPECT_EQ(brokenText(last), brokenPromise);
    });
}

TEST(FutureWithoutMemory, ThenOnACancelledFutureFailsCleanly) {
    failEachAllocation([](ScarceMemory& memory) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        future.cancel();
        Future<int> next;
        if (memory.allows([&] { next = future.then(addOne); })) {
            EXPECT_EQ(brokenText(next), brokenPromise);
        }
    });
}

}  // namespace
