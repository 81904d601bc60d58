#include "http/detail/routes/ChangeHub.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <string>
#include <thread>

#include "configuration/ConfigurationImpl.hpp"

namespace velkor::http::detail {
namespace {

TEST(ChangeHub, TellsWhoHasJoinedOfEveryLaterChange) {
    constexpr int rounds = 2000;
    const auto store = std::make_shared<configuration::ConfigurationImpl>();
    int missed = 0;
    for (int round = 0; round < rounds; ++round) {
        const auto hub = std::make_shared<ChangeHub>();
        const auto own = std::make_shared<PendingChanges>("own", 10);
        const auto others = std::make_shared<PendingChanges>("other", 10);
        std::atomic<int> ready{0};
        const auto joinAndChange = [&](const std::string& key, const ChangeHub::Changes& changes) {
            ++ready;
            while (ready < 2) std::this_thread::yield();
            hub->join(*store, changes);
            store->set(key, round);
        };
        std::thread other([&] { joinAndChange("other", others); });
        joinAndChange("own", own);
        other.join();
        if (own->take() == nullptr || others->take() == nullptr) ++missed;
    }
    EXPECT_EQ(missed, 0);
}

}  // namespace
}  // namespace velkor::http::detail
