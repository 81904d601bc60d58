#include "host/console/Watches.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/console/ValueText.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

class WatchesTest : public ::testing::Test {
protected:
    Watches::Show show() {
        return
            [this](const auto& key, const auto& value) { shown.push_back(optionText(key, value)); };
    }

    Words shown;
    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    Watches watches{store, show()};
};

TEST_F(WatchesTest, ShowTheCurrentValueAtOnce) {
    store->set("a", 1);
    EXPECT_TRUE(watches.add("a"));
    EXPECT_EQ(shown, Words{"a = 1"});
}

TEST_F(WatchesTest, ShowNothingWhileThereIsNoValue) {
    EXPECT_TRUE(watches.add("a"));
    EXPECT_EQ(shown, Words{});
}

TEST_F(WatchesTest, ShowEveryChangeInOrder) {
    watches.add("a");
    store->set("a", 1);
    store->set("b", 5);
    store->set("a", std::string("x"));
    EXPECT_EQ(shown, (Words{"a = 1", "a = 'x'"}));
}

TEST_F(WatchesTest, ShowSeveralKeys) {
    watches.add("a");
    watches.add("b");
    store->set("b", 1);
    store->set("a", 2);
    EXPECT_EQ(shown, (Words{"b = 1", "a = 2"}));
}

TEST_F(WatchesTest, ShowAKeyOnceHoweverOftenItIsAdded) {
    EXPECT_TRUE(watches.add("a"));
    EXPECT_FALSE(watches.add("a"));
    store->set("a", 1);
    EXPECT_EQ(shown, Words{"a = 1"});
}

TEST_F(WatchesTest, ShowNothingAfterRemoval) {
    watches.add("a");
    EXPECT_TRUE(watches.remove("a"));
    store->set("a", 1);
    EXPECT_EQ(shown, Words{});
}

TEST_F(WatchesTest, SayWhenThereIsNothingToRemove) {
    EXPECT_FALSE(watches.remove("a"));
}

TEST_F(WatchesTest, MayBeAddedAgain) {
    watches.add("a");
    watches.remove("a");
    EXPECT_TRUE(watches.add("a"));
    store->set("a", 1);
    EXPECT_EQ(shown, Words{"a = 1"});
}

TEST_F(WatchesTest, EndWithTheirOwner) {
    {
        Watches shortLived(store, show());
        shortLived.add("a");
    }
    store->set("a", 1);
    EXPECT_EQ(shown, Words{});
}

TEST_F(WatchesTest, AreNotAddedWhenTheValueCantBeShown) {
    store->set("a", 1);
    Watches throwing(store, [](const auto&, const auto&) { throw std::runtime_error("no"); });
    EXPECT_THROW(throwing.add("a"), std::runtime_error);
    EXPECT_FALSE(throwing.remove("a"));
}

TEST_F(WatchesTest, MayBeRemovedWhileAValueIsShown) {
    store->set("a", 1);
    std::unique_ptr<Watches> impatient;
    impatient = std::make_unique<Watches>(store, [&](const auto& key, const auto& value) {
        shown.push_back(optionText(key, value));
        impatient->remove(key);
    });
    EXPECT_TRUE(impatient->add("a"));
    store->set("a", 2);
    EXPECT_EQ(shown, Words{"a = 1"});
}

}  // namespace
}  // namespace velkor::host
