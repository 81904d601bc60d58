#include <gtest/gtest.h>

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>

#include "framework/Future.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::makeReadyFuture;
using velkor::Promise;
using velkor::testing::brokenPromise;
using velkor::testing::completes;
using velkor::testing::Latch;
using velkor::testing::raceRounds;
using velkor::testing::thrownText;

constexpr auto cancelled = "Future has been cancelled.";

class FutureCancel : public ::testing::Test {
protected:
    std::string textOfGet() {
        return thrownText<std::runtime_error>([this] { future.get(); });
    }

    Promise<int> promise;
    Future<int> future = promise.getFuture();
};

TEST_F(FutureCancel, GetThrows) {
    future.cancel();
    EXPECT_EQ(textOfGet(), cancelled);
}

TEST_F(FutureCancel, SecondCancelDoesNothing) {
    future.cancel();
    EXPECT_NO_THROW(future.cancel());
    EXPECT_EQ(textOfGet(), cancelled);
}

TEST_F(FutureCancel, FutureStaysValid) {
    future.cancel();
    EXPECT_TRUE(future.valid());
}

TEST_F(FutureCancel, DoesNothingToAnInvalidFuture) {
    Future<int> invalid;
    EXPECT_NO_THROW(invalid.cancel());
    EXPECT_FALSE(invalid.valid());
}

TEST_F(FutureCancel, MovedFromFutureDoesNotCancelItsFormerState) {
    Future<int> owner = std::move(future);
    future.cancel();
    promise.setValue(1);
    EXPECT_EQ(owner.get(), 1);
}

TEST_F(FutureCancel, ComesTooLateForAValue) {
    promise.setValue(1);
    future.cancel();
    EXPECT_EQ(future.get(), 1);
}

TEST_F(FutureCancel, ComesTooLateForAnException) {
    promise.setException(std::make_exception_ptr(std::invalid_argument("reason")));
    future.cancel();
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { future.get(); }), "reason");
}

TEST_F(FutureCancel, LaterValueIsDroppedWithoutAnError) {
    future.cancel();
    EXPECT_NO_THROW(promise.setValue(1));
    EXPECT_EQ(textOfGet(), cancelled);
}

TEST_F(FutureCancel, LaterValuesAreAllDropped) {
    future.cancel();
    promise.setValue(1);
    EXPECT_NO_THROW(promise.setValue(2));
}

TEST_F(FutureCancel, LaterExceptionIsDroppedWithoutAnError) {
    future.cancel();
    EXPECT_NO_THROW(promise.setException(std::make_exception_ptr(std::invalid_argument(""))));
    EXPECT_EQ(textOfGet(), cancelled);
}

TEST_F(FutureCancel, PromiseGivesNoFurtherFuture) {
    future.cancel();
    EXPECT_EQ(thrownText<std::runtime_error>([this] { promise.getFuture(); }),
              "Promise already returned a future.");
}

TEST_F(FutureCancel, DroppedValueIsDestroyedWithoutALock) {
    struct Probing {
        explicit Probing(Future<std::shared_ptr<Probing>>* observed) : shared(observed) {}
        Probing(const Probing&) = delete;
        Probing& operator=(const Probing&) = delete;
        ~Probing() {
            EXPECT_TRUE(completes([observed = shared] { observed->cancel(); }));
        }
        Future<std::shared_ptr<Probing>>* shared;
    };
    Promise<std::shared_ptr<Probing>> source;
    Future<std::shared_ptr<Probing>> observed = source.getFuture();
    observed.cancel();
    source.setValue(std::make_shared<Probing>(&observed));
}

TEST_F(FutureCancel, WakesAWaitingGet) {
    Latch waiting;
    std::string text;
    std::thread canceller([&] {
        EXPECT_TRUE(waiting.wait());
        future.cancel();
    });
    EXPECT_TRUE(completes([&] {
        waiting.countDown();
        text = textOfGet();
    }));
    canceller.join();
    EXPECT_EQ(text, cancelled);
}

TEST_F(FutureCancel, ContinuationIsDestroyedAtOnce) {
    const auto witness = std::make_shared<int>(0);
    future.then([witness](Future<int>&&) { return true; });
    future.cancel();
    EXPECT_EQ(witness.use_count(), 1);
}

TEST_F(FutureCancel, ContinuationNeverRuns) {
    int runs = 0;
    future.then([&](Future<int>&&) { return ++runs; });
    future.cancel();
    promise.setValue(1);
    EXPECT_EQ(runs, 0);
}

TEST_F(FutureCancel, FutureOfTheContinuationFails) {
    Future<bool> next = future.then([](Future<int>&&) { return true; });
    future.cancel();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { next.get(); }), brokenPromise);
}

TEST_F(FutureCancel, FailureReachesTheEndOfAChain) {
    const auto pass = [](Future<int>&& result) { return result.get(); };
    Future<int> last = future.then(pass).then(pass).then(pass);
    future.cancel();
    EXPECT_EQ(thrownText<std::runtime_error>([&] { last.get(); }), brokenPromise);
}

TEST_F(FutureCancel, ContinuationGivenAfterwardsNeverRuns) {
    int runs = 0;
    future.cancel();
    Future<int> next = future.then([&](Future<int>&&) { return ++runs; });
    EXPECT_EQ(runs, 0);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { next.get(); }), brokenPromise);
}

TEST_F(FutureCancel, ContinuationGivenAfterwardsIsDestroyedAtOnce) {
    const auto witness = std::make_shared<int>(0);
    future.cancel();
    future.then([witness](Future<int>&&) { return true; });
    EXPECT_EQ(witness.use_count(), 1);
}

TEST_F(FutureCancel, DownstreamCancelLeavesTheSourceAlone) {
    int seen = 0;
    future.then([&](Future<int>&& result) { return seen = result.get(); }).cancel();
    promise.setValue(1);
    EXPECT_EQ(seen, 1);
}

TEST_F(FutureCancel, ContinuationMayDestroyTheFutureWhenItIsCancelled) {
    auto owner = std::make_unique<Future<int>>(std::move(future));
    std::shared_ptr<void> destroysOwner(nullptr, [&](void*) { owner.reset(); });
    owner->then([held = std::move(destroysOwner)](Future<int>&&) { return true; });
    owner->cancel();
    EXPECT_EQ(owner, nullptr);
}

TEST_F(FutureCancel, ReleasesAContinuationThatOwnsThePromise) {
    const auto witness = std::make_shared<int>(0);
    future.then([witness, owned = std::move(promise)](Future<int>&&) { return owned.valid(); });
    future.cancel();
    EXPECT_EQ(witness.use_count(), 1);
}

// Races

TEST(FutureCancelRace, EitherTheValueOrTheCancellationWins) {
    for (int round = 0; round < raceRounds(); ++round) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        Latch start(2);
        std::thread producer([&] {
            EXPECT_TRUE(start.arriveAndWait());
            promise.setValue(round);
        });
        EXPECT_TRUE(start.arriveAndWait());
        future.cancel();
        producer.join();
        try {
            EXPECT_EQ(future.get(), round);
        } catch (const std::runtime_error& error) {
            EXPECT_STREQ(error.what(), cancelled);
        }
    }
}

TEST(FutureCancelRace, ContinuationRunsOrIsDroppedButEndsInAnyCase) {
    for (int round = 0; round < raceRounds(); ++round) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        const auto witness = std::make_shared<int>(round);
        Future<int> next = future.then([witness](Future<int>&& result) { return result.get(); });
        Latch start(2);
        std::thread producer([&] {
            EXPECT_TRUE(start.arriveAndWait());
            promise.setValue(round);
        });
        EXPECT_TRUE(start.arriveAndWait());
        future.cancel();
        producer.join();
        try {
            EXPECT_EQ(next.get(), round);
        } catch (const std::runtime_error& error) {
            EXPECT_STREQ(error.what(), brokenPromise);
        }
        EXPECT_EQ(witness.use_count(), 1);
    }
}

}  // namespace
