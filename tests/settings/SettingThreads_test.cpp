#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "settings/Setting.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::settings::testing {
namespace {

/// A number whose conversion runs what the test has given.
struct Slow {
    static inline std::function<void()> whenConverted;
    int number = 0;
};

}  // namespace
}  // namespace velkor::settings::testing

template <>
struct velkor::settings::Conversion<velkor::settings::testing::Slow> {
    using Slow = testing::Slow;

    static std::string typeName() { return "slow int"; }

    static Converted<Slow> from(const configuration::ConfigurationValue& value) {
        if (const auto hook = std::exchange(Slow::whenConverted, nullptr)) hook();
        return Conversion<int>::from(value).then(
            [](int number) -> Converted<Slow> { return Slow{number}; });
    }

    static std::string show(const Slow& slow) { return std::to_string(slow.number); }
};

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationImpl;
using velkor::testing::Latch;

// Lets other threads go on, so that what does not wait has gone on when this returns.
void linger() {
    for (int i = 0; i < 10'000; ++i) std::this_thread::yield();
}

class SettingThreads : public ::testing::Test {
protected:
    /// Whether the callback of `setting` has ended when `end`, called while it runs, returns.
    bool waits(Setting<int>& setting, ChangeHandle& handle, const std::function<void()>& end) {
        Latch running;
        Latch ending;
        std::atomic<bool> finished{false};
        handle = setting.onChange([&](int, int) {
            running.countDown();
            EXPECT_TRUE(ending.wait());
            linger();
            finished = true;
        });
        std::thread writer([this] { store->set("key", 1); });
        EXPECT_TRUE(running.wait());
        ending.countDown();
        end();
        const bool hasWaited = finished;
        writer.join();
        return hasWaited;
    }

    const std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
};

TEST_F(SettingThreads, DestructionWaitsForACallbackOnAnotherThread) {
    // The last setting of a store waits for the store as well, which would hide it.
    const Setting<int> another(store, "another", 0);
    std::optional<Setting<int>> setting(std::in_place, store, "key", 0);
    ChangeHandle handle;
    EXPECT_TRUE(waits(*setting, handle, [&] { setting.reset(); }));
}

TEST_F(SettingThreads, AHandleWaitsForItsCallbackOnAnotherThread) {
    Setting<int> setting(store, "key", 0);
    ChangeHandle handle;
    EXPECT_TRUE(waits(setting, handle, [&] { handle.cancel(); }));
}

TEST_F(SettingThreads, AChangeThatIsMadeDuringConstructionIsNotMissed) {
    store->set("key", 1);
    std::thread writer;
    Slow::whenConverted = [&] {
        writer = std::thread([this] { store->set("key", 2); });
        linger();
    };
    const Setting<Slow> setting(store, "key");
    writer.join();
    EXPECT_EQ(setting.get().number, 2);
}

}  // namespace
}  // namespace velkor::settings::testing
