#include "host/console/InterruptibleWait.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <csignal>
#include <exception>
#include <stdexcept>
#include <string>
#include <thread>

#include "host/console/Interruption.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;

TEST(InterruptibleWait, GivesAResultThatIsThere) {
    EXPECT_TRUE(resultUnlessInterrupted(makeReadyFuture(true)));
    EXPECT_FALSE(resultUnlessInterrupted(makeReadyFuture(false)));
}

TEST(InterruptibleWait, WaitsForAResult) {
    Promise<bool> promise;
    std::atomic<bool> isThere{false};
    auto pending = promise.getFuture();
    std::thread other([&] {
        isThere = true;
        promise.setValue(true);
    });
    EXPECT_TRUE(resultUnlessInterrupted(std::move(pending)));
    EXPECT_TRUE(isThere);
    other.join();
}

TEST(InterruptibleWait, ThrowsWhatWentWrong) {
    auto failed = makeFailedFuture<bool>(std::make_exception_ptr(std::runtime_error("no luck")));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { resultUnlessInterrupted(std::move(failed)); }),
              "no luck");
}

TEST(InterruptibleWait, ThrowsWhenTheResultNeverComes) {
    auto abandoned = Promise<bool>().getFuture();
    EXPECT_EQ(
        thrownText<std::runtime_error>([&] { resultUnlessInterrupted(std::move(abandoned)); }),
        "Promise destroyed before it provided a value.");
}

TEST(InterruptibleWait, EndsAtControlC) {
    Promise<bool> promise;
    const Interruption interruption;
    std::raise(SIGINT);
    EXPECT_THROW(resultUnlessInterrupted(promise.getFuture()), Interrupted);
    promise.setValue(true);  // nobody is waiting any more
}

TEST(InterruptibleWait, EndsAtControlCWhileItWaits) {
    Promise<bool> promise;
    const Interruption interruption;
    const auto waiting = ::pthread_self();
    std::thread other([waiting] { ::pthread_kill(waiting, SIGINT); });
    EXPECT_THROW(resultUnlessInterrupted(promise.getFuture()), Interrupted);
    other.join();
}

}  // namespace
}  // namespace velkor::host
