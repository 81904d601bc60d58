#include "settings/testing/Override.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "settings/Setting.hpp"
#include "tests/configuration/StoreTesting.hpp"

namespace velkor::settings::testing {
namespace {

using namespace std::chrono_literals;

using OverrideTest = velkor::testing::StoreTest;

TEST_F(OverrideTest, LastsForItsScope) {
    store->set("port", 1);
    const Setting<int> port(store, "port", 8080);
    {
        const Override other(store, "port", 2);
        EXPECT_EQ(port, 2);
    }
    EXPECT_EQ(port, 1);
}

TEST_F(OverrideTest, LeavesNothingBehind) {
    const auto before = names();
    { const Override other(store, "port", 2); }
    EXPECT_EQ(names(), before);
    EXPECT_FALSE(store->has("port").get());
}

TEST_F(OverrideTest, StandsInFrontOfThoseBefore) {
    const Setting<int> port(store, "port", 8080);
    const Override outer(store, "port", 1);
    {
        const Override inner(store, "port", 2);
        EXPECT_EQ(port, 2);
    }
    EXPECT_EQ(port, 1);
}

TEST_F(OverrideTest, IsNotWrittenTo) {
    const Setting<int> port(store, "port", 8080);
    {
        const Override other(store, "port", 2);
        store->set("port", 3);
        EXPECT_EQ(port, 2);
    }
    EXPECT_EQ(port, 3);
}

TEST_F(OverrideTest, TakesWhatSettingsAreOf) {
    const Setting<std::chrono::milliseconds> timeout(store, "timeout", 1s);
    const Setting<std::string> name(store, "name", "none");
    const Override shorter(store, "timeout", 5ms);
    const Override named(store, "name", "test");
    EXPECT_EQ(timeout.get(), 5ms);
    EXPECT_EQ(name.get(), "test");
}

}  // namespace
}  // namespace velkor::settings::testing
