#include "layers/OwnThread.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <csignal>
#include <cstdlib>
#include <memory>

#include "tests/layers/ProcessEnd.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers {
namespace {

TEST(OwnThread, IsWaitedFor) {
    std::atomic<bool> done{false};
    {
        const OwnThread thread([&] { done = true; });
    }
    EXPECT_TRUE(done);
}

TEST(OwnThread, GoesOnAloneWhenItEndsItsOwner) {
    const auto owner = std::make_shared<std::unique_ptr<OwnThread>>();
    const auto owned = std::make_shared<velkor::testing::Latch>();
    const auto finished = std::make_shared<velkor::testing::Latch>();

    *owner = std::make_unique<OwnThread>([owner, owned, finished] {
        if (!owned->wait()) return;
        owner->reset();
        finished->countDown();
    });
    owned->countDown();

    EXPECT_TRUE(finished->wait());
}

using Owner = std::unique_ptr<OwnThread>;

[[noreturn]] void endWhileOneGoesOnAlone() {
    const auto owner = std::make_shared<Owner>();
    const auto owned = std::make_shared<velkor::testing::Latch>();
    const auto ended = std::make_shared<velkor::testing::Latch>();
    *owner = std::make_unique<OwnThread>([owner, owned, ended] {
        if (!owned->wait()) return;
        owner->reset();
        ended->countDown();
        velkor::testing::outlastTheEnd();
    });
    owned->countDown();
    if (!ended->wait()) std::_Exit(EXIT_FAILURE);
    velkor::testing::endProcess();
}

[[noreturn]] void endWhileOneHasTheLastReference() {
    auto owner = std::make_shared<Owner>();
    const auto borrowed = std::make_shared<velkor::testing::Latch>();
    *owner = std::make_unique<OwnThread>([weak = std::weak_ptr(owner), borrowed] {
        const OwnThread::Borrowing waitedFor;
        const auto borrowedOwner = weak.lock();
        borrowed->countDown();
        velkor::testing::outlastTheEnd();
    });
    if (!borrowed->wait()) std::_Exit(EXIT_FAILURE);
    owner.reset();
    velkor::testing::endProcess();
}

TEST(OwnThread, IsWaitedForByTheEndOfTheProcessWhenItGoesOnAlone) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(endWhileOneGoesOnAlone(), ::testing::ExitedWithCode(0), "waited for");
}

TEST(OwnThread, IsWaitedForByTheEndOfTheProcessWhileItBorrows) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(endWhileOneHasTheLastReference(), ::testing::ExitedWithCode(0), "waited for");
}

bool blocks(int signal) {
    sigset_t blocked;
    ::pthread_sigmask(SIG_SETMASK, nullptr, &blocked);
    return ::sigismember(&blocked, signal) == 1;
}

TEST(OwnThread, LeavesTheSignalsOfTheProcessToOthers) {
    bool blocksThere = false;
    {
        const OwnThread thread([&] { blocksThere = blocks(SIGINT) && blocks(SIGWINCH); });
    }
    EXPECT_TRUE(blocksThere);
    EXPECT_FALSE(blocks(SIGINT));
}

}  // namespace
}  // namespace velkor::layers
