#include "layers/OwnThread.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>

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

}  // namespace
}  // namespace velkor::layers
