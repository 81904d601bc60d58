#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/FreeMutex.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;
using testing::textOf;
using Subscriber = testing::RecordingSubscriber<ConfigurationValue>;

/// A store that calls the protected members of its base with a lock of its own.
class DerivedStore : public ConfigurationImpl {
public:
    void refresh(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        updatePublishers(lock, key);
    }

    bool holds(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return doHas(lock, key);
    }

    ConfigurationValue value(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return doGet(lock, key);
    }

    Option option(const std::string& key) {
        std::unique_lock<std::recursive_mutex> lock(mutex);
        return doGetOption(lock, key);
    }

    // Whether another thread would get the mutex now, without waiting.
    bool isFree() { return testing::isFreeForOthers(mutex); }
};

// What a source changes in the registry while the derived store's own lock is the only level, or
// one within an operation.
class DerivedStoreTest : public testing::StoreTest {
protected:
    DerivedStoreTest() { store = derived; }

    void SetUp() override {
        auto owned = addHooked("early", "", -5, {{"a", 1}});
        early = owned.get();
        early->whenDestroyed = [this] {
            ++destructions;
            destroyedFree = derived != nullptr && derived->isFree();
        };
        subscriber = std::make_shared<Subscriber>(testing::allValues);
        store->watchOption("a")->subscribe(subscriber);
        subscriber->values.clear();
    }

    void TearDown() override {
        store.reset();
        derived.reset();
    }

    static std::function<void()> once(std::function<void()> action) {
        return [action = std::move(action), done = false]() mutable {
            if (!std::exchange(done, true)) action();
        };
    }

    // Removes the source that is being called, and asks the store once more.
    std::function<void()> removesItself() {
        return once([this] {
            EXPECT_TRUE(store->removeSource("early").get());
            store->has("b");
            EXPECT_EQ(destructions, 0);
        });
    }

    std::shared_ptr<DerivedStore> derived = std::make_shared<DerivedStore>();
    std::shared_ptr<Subscriber> subscriber;
    HookedSource* early = nullptr;
    int destructions = 0;
    bool destroyedFree = false;
};

TEST_F(DerivedStoreTest, UpdateSurvivesASourceThatRemovesItselfInHas) {
    early->whenHas = removesItself();
    derived->refresh("a");
    EXPECT_EQ(textOf(subscriber->values.back()), "int 1");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(destroyedFree);
}

TEST_F(DerivedStoreTest, UpdateSurvivesASourceThatRemovesItselfInGet) {
    early->whenGet = removesItself();
    derived->refresh("a");
    EXPECT_EQ(textOf(subscriber->values.back()), "int 1");
    EXPECT_EQ(destructions, 1);
}

TEST_F(DerivedStoreTest, UpdateWithinASetKeepsTheSourceThatIsWritten) {
    add("late", "", 5, {{"a", 3}});
    early->whenSet = once([this] {
        store->removeSource("early");
        derived->refresh("a");
        EXPECT_EQ(destructions, 0);
    });
    EXPECT_EQ(textOf(store->set("a", 2, "early").get()), "int 1");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(destroyedFree);
}

TEST_F(DerivedStoreTest, UpdateWithinAReadKeepsTheListThatIsWalked) {
    add("late", "", 5, {{"b", 3}});
    early->whenHas = once([this] {
        store->removeSource("early");
        store->set("a", 5);
        derived->refresh("a");
        EXPECT_EQ(destructions, 0);
    });
    EXPECT_EQ(valueOf("b"), "int 3");
    EXPECT_EQ(destructions, 1);
}

TEST_F(DerivedStoreTest, UpdateWithinADeliveryLeavesTheWritersLevelHeld) {
    const auto other = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("b")->subscribe(other);
    store->set("b", 1);
    bool freeMeanwhile = true;
    other->whenNext = [&](const ConfigurationValue&) { freeMeanwhile = derived->isFree(); };
    subscriber->whenNext = [this](const ConfigurationValue&) { derived->refresh("b"); };
    store->set("a", 2, "early");
    EXPECT_FALSE(freeMeanwhile);
    EXPECT_TRUE(derived->isFree());
}

TEST_F(DerivedStoreTest, ReadsSurviveASourceThatRemovesItself) {
    early->whenHas = removesItself();
    EXPECT_TRUE(derived->holds("a"));
    // The mutex was the caller's: what was let go of goes with the next operation.
    store->has("b");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(destroyedFree);
}

TEST_F(DerivedStoreTest, ValueSurvivesASourceThatRemovesItself) {
    early->whenGet = removesItself();
    EXPECT_EQ(textOf(derived->value("a")), "int 1");
}

TEST_F(DerivedStoreTest, OptionSurvivesASourceThatRemovesItself) {
    early->whenGet = removesItself();
    EXPECT_EQ(derived->option("a").source, "early");
}

TEST_F(DerivedStoreTest, RemovalAfterAnUpdateDestroysTheSourceAtOnce) {
    derived->refresh("a");
    store->removeSource("early");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(destroyedFree);
}

TEST_F(DerivedStoreTest, RemovalAfterADeliveryDestroysTheSourceAtOnce) {
    add("new", "", -9, {{"a", 4}});
    store->set("a", 5, "new");
    store->removeSource("new");
    EXPECT_THAT(subscriber->values.size(), 3U);
    store->removeSource("early");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(destroyedFree);
}

}  // namespace
}  // namespace velkor::configuration
