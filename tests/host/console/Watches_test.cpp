#include "host/console/Watches.hpp"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/console/ValueText.hpp"
#include "tests/support/BoundedWait.hpp"

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

// Shows values through a function; each copy of it tells when it is destroyed.
struct TellingShow {
    using Shown = std::function<void(const std::string&)>;

    TellingShow(Shown whenShown, std::function<void()> whenDestroyed)
        : shown(std::move(whenShown)), destroyed(std::move(whenDestroyed)) {}
    TellingShow(const TellingShow&) = default;
    TellingShow& operator=(const TellingShow&) = delete;
    ~TellingShow() { destroyed(); }

    void operator()(const std::string& key, const configuration::ConfigurationValue&) const {
        shown(key);
    }

    Shown shown;
    std::function<void()> destroyed;
};

// While a value of the first watch is shown, the key is removed and added again.
class ReplacedWatchTest : public WatchesTest {
protected:
    void addAndReplace() {
        store->set("a", 1);
        const TellingShow telling([this](const std::string& key) { replace(key); },
                                  [this] { useWatches(); });
        replaced = std::make_unique<Watches>(store, telling);
        EXPECT_TRUE(replaced->add("a"));
    }

    void replace(const std::string& key) {
        shown.push_back(key);
        if (std::exchange(replacing, true)) return;
        replaced->remove(key);
        readded = replaced->add(key);
        hasReplaced = true;
    }

    void useWatches() {
        if (std::exchange(hasReplaced, false)) replaced->remove("other");
    }

    bool replacing = false;
    bool readded = false;
    bool hasReplaced = false;
    std::unique_ptr<Watches> replaced;
};

TEST_F(ReplacedWatchTest, TheOlderOneEndsWithoutTheMutex) {
    ASSERT_TRUE(velkor::testing::completes([this] { addAndReplace(); }));
    EXPECT_TRUE(readded);
}

TEST_F(ReplacedWatchTest, ShowsEachFurtherValueOnce) {
    ASSERT_TRUE(velkor::testing::completes([this] { addAndReplace(); }));
    shown.clear();
    store->set("a", 2);
    EXPECT_EQ(shown, Words{"a"});
}

TEST_F(ReplacedWatchTest, EndsWhenItIsRemoved) {
    ASSERT_TRUE(velkor::testing::completes([this] { addAndReplace(); }));
    shown.clear();
    EXPECT_TRUE(replaced->remove("a"));
    store->set("a", 2);
    EXPECT_EQ(shown, Words{});
}

TEST_F(WatchesTest, OneThatFailsLeavesTheWatchThatReplacedItAlone) {
    store->set("a", 1);
    bool replacing = false;
    std::unique_ptr<Watches> replaced;
    replaced = std::make_unique<Watches>(store, [&](const auto& key, const auto& value) {
        shown.push_back(optionText(key, value));
        if (std::exchange(replacing, true)) return;
        replaced->remove(key);
        replaced->add(key);
        throw std::runtime_error("no");
    });
    EXPECT_THROW(replaced->add("a"), std::runtime_error);
    shown.clear();
    store->set("a", 2);
    EXPECT_EQ(shown, Words{"a = 2"});
}

TEST_F(WatchesTest, NameTheirKeys) {
    watches.add("b");
    watches.add("a");
    EXPECT_EQ(watches.keys(), (std::vector<std::string>{"a", "b"}));
}

}  // namespace
}  // namespace velkor::host
