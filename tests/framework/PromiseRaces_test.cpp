#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>

#include "framework/Future.hpp"
#include "tests/framework/FutureTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::Future;
using velkor::Promise;
using velkor::testing::alreadyResolved;
using velkor::testing::Latch;
using velkor::testing::raceRounds;
using velkor::testing::thrownText;

TEST(PromiseRaces, OneOfTwoThreadsResolvesAndTheOtherOneIsRefused) {
    for (int round = 0; round < raceRounds(); ++round) {
        Promise<int> promise;
        Future<int> future = promise.getFuture();
        Latch start(2);
        std::string otherText;
        std::thread other([&] {
            EXPECT_TRUE(start.arriveAndWait());
            otherText = thrownText<std::runtime_error>([&] { promise.setValue(1); });
        });
        EXPECT_TRUE(start.arriveAndWait());
        const std::string text = thrownText<std::runtime_error>([&] {
            promise.setException(std::make_exception_ptr(std::invalid_argument("reason")));
        });
        other.join();
        const bool otherWon = text == alreadyResolved;
        EXPECT_EQ(otherText == alreadyResolved, !otherWon);
        if (otherWon) {
            EXPECT_EQ(future.get(), 1);
        } else {
            EXPECT_THROW(future.get(), std::invalid_argument);
        }
    }
}

TEST(PromiseRaces, OneOfTwoThreadsGetsTheFuture) {
    for (int round = 0; round < raceRounds(); ++round) {
        Promise<int> promise;
        Latch start(2);
        std::atomic<int> futures{0};
        const auto take = [&] {
            EXPECT_TRUE(start.arriveAndWait());
            if (thrownText<std::runtime_error>([&] { promise.getFuture(); }) ==
                "<nothing thrown>") {
                ++futures;
            }
        };
        std::thread other(take);
        take();
        other.join();
        EXPECT_EQ(futures, 1);
    }
}

TEST(PromiseRaces, ConsumerDestroysThePromiseAsSoonAsItHasTheResult) {
    for (int round = 0; round < raceRounds(); ++round) {
        auto promise = std::make_unique<Promise<int>>();
        Future<int> future = promise->getFuture();
        Latch start(2);
        std::thread producer([&start, target = promise.get()] {
            EXPECT_TRUE(start.arriveAndWait());
            target->setValue(1);
        });
        EXPECT_TRUE(start.arriveAndWait());
        EXPECT_EQ(future.get(), 1);
        promise.reset();
        producer.join();
    }
}

}  // namespace
