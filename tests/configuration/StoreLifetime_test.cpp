#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <csignal>
#include <cstddef>
#include <functional>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/FreeMutex.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;
using testing::textOf;
using Subscriber = testing::RecordingSubscriber<ConfigurationValue>;

class StoreLifetime : public testing::StoreTest {
protected:
    // Lets `source` note under `name` what happens to it.
    void record(HookedSource& source, const std::string& name) {
        source.whenDetached = [this, name] { events.push_back(name + " detached"); };
        source.whenDestroyed = [this, name] { events.push_back(name + " destroyed"); };
    }

    std::vector<std::string> events;
};

TEST_F(StoreLifetime, GetPtrGivesTheStore) {
    EXPECT_EQ(store->getPtr(), store);
    EXPECT_EQ(store->getPtr().use_count(), 2);
}

TEST_F(StoreLifetime, GetPtrOfAStoreOnTheStackThrows) {
    ConfigurationImpl local;
    EXPECT_THROW(local.getPtr(), std::bad_weak_ptr);
}

TEST_F(StoreLifetime, WatchOnAStoreOnTheStackThrows) {
    ConfigurationImpl local;
    EXPECT_THROW(local.watchOption("a"), std::bad_weak_ptr);
}

TEST_F(StoreLifetime, StoreOnTheStackAnswersEverythingElse) {
    ConfigurationImpl local;
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"b", 2}});
    EXPECT_TRUE(local.addSource("extra", "", 5, false, source).get());
    EXPECT_EQ(textOf(local.set("a", 1).get()), "int 1");
    EXPECT_EQ(textOf(local.get("b").get()), "int 2");
    EXPECT_THAT(local.keys().get(), ElementsAre("a", "b"));
    EXPECT_TRUE(local.removeSource("extra").get());
}

TEST_F(StoreLifetime, DestructionDetachesEverySourceInListOrder) {
    const auto last = addHooked("last", "", 9);
    const auto first = addHooked("first", "", -9);
    const auto middle = addHooked("middle", "", 5);
    record(*last, "last");
    record(*first, "first");
    record(*middle, "middle");
    store.reset();
    EXPECT_THAT(events, ElementsAre("first detached", "middle detached", "last detached"));
    EXPECT_FALSE(first->listener);
}

TEST_F(StoreLifetime, DestructionDetachesAllBeforeItReleasesAny) {
    record(*addHooked("one", "", -9), "one");
    record(*addHooked("two", "", 9), "two");
    store.reset();
    ASSERT_EQ(events.size(), 4U);
    EXPECT_EQ(events[0], "one detached");
    EXPECT_EQ(events[1], "two detached");
}

TEST_F(StoreLifetime, DestructionLeavesARemovedSourceAlone) {
    const auto removed = addHooked("removed", "", 5);
    store->removeSource("removed");
    record(*removed, "removed");
    store.reset();
    EXPECT_TRUE(events.empty());
}

TEST_F(StoreLifetime, DestructionReleasesTheSources) {
    const auto source = addHooked("extra", "", 5);
    store.reset();
    EXPECT_EQ(source.use_count(), 1);
}

TEST_F(StoreLifetime, DetachedSourceMayBeWrittenOn) {
    const auto source = addHooked("extra", "", 5);
    store.reset();
    source->set("a", 1);
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST_F(StoreLifetime, DestructionCompletesAWatchThatNobodyHolds) {
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("a")->subscribe(subscriber);
    EXPECT_EQ(subscriber->completions, 0);
    store.reset();
    EXPECT_EQ(subscriber->completions, 1);
}

TEST_F(StoreLifetime, SourcesAreDetachedBeforeWatchesEnd) {
    const auto source = addHooked("extra", "", 5);
    record(*source, "extra");
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    subscriber->whenComplete = [&] { events.emplace_back("completed"); };
    store->watchOption("a")->subscribe(subscriber);
    store.reset();
    EXPECT_THAT(events, ElementsAre("extra detached", "completed"));
}

TEST_F(StoreLifetime, WatchesEndBeforeSourcesAreReleased) {
    auto source = addHooked("extra", "", 5);
    source->whenDestroyed = [&] { events.emplace_back("destroyed"); };
    source.reset();
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    subscriber->whenComplete = [&] { events.emplace_back("completed"); };
    store->watchOption("a")->subscribe(subscriber);
    store.reset();
    EXPECT_THAT(events, ElementsAre("completed", "destroyed"));
}

TEST_F(StoreLifetime, SourceMayBeSharedByTwoStores) {
    const auto source = addHooked("extra", "", 5, {{"a", 1}});
    {
        ConfigurationImpl other;
        other.addSource("extra", "b", 5, false, source);
        EXPECT_EQ(textOf(other.get("b.a").get()), "int 1");
    }
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(StoreLifetime, AnswersOutliveTheStore) {
    store->set("a", std::string("text"));
    auto value = store->get("a");
    auto keys = store->keys();
    auto missing = store->get("b");
    store.reset();
    EXPECT_EQ(textOf(value.get()), "string text");
    EXPECT_THAT(keys.get(), ElementsAre("a"));
    EXPECT_THROW(missing.get(), std::runtime_error);
}

TEST_F(StoreLifetime, SourceThatIsDestroyedByItsRemovalMayDropTheStore) {
    auto source = addHooked("extra", "", 5);
    const std::weak_ptr<ConfigurationImpl> alive = store;
    source->whenDestroyed = [this] { store.reset(); };
    source.reset();
    EXPECT_TRUE(store->removeSource("extra").get());
    EXPECT_TRUE(alive.expired());
}

TEST_F(StoreLifetime, SourceMayDropTheStoreFromInsideARead) {
    auto source = addHooked("extra", "", 5, {{"a", 1}});
    const std::weak_ptr<ConfigurationImpl> alive = store;
    source->whenHas = [this] { store.reset(); };
    auto* const pointer = store.get();
    EXPECT_EQ(textOf(pointer->get("a").get()), "int 1");
    EXPECT_TRUE(alive.expired());
    EXPECT_FALSE(source->listener);
}

TEST_F(StoreLifetime, SourceMayDropTheStoreFromInsideItsRegistration) {
    const auto source = std::make_shared<HookedSource>();
    source->whenKeys = [this] { store.reset(); };
    auto* const pointer = store.get();
    EXPECT_TRUE(pointer->addSource("extra", "", 5, false, source).get());
    EXPECT_EQ(source->calls.back(), "detach");
}

TEST_F(StoreLifetime, SourceMayChangeTheRegistryWhileTheStoreIsDestroyed) {
    const auto first = addHooked("first", "", -9);
    const auto second = addHooked("second", "", -8);
    ConfigurationImpl* const dying = store.get();
    first->whenDetached = [&] {
        dying->removeSource("second");
        dying->addInMemorySource("late", "", -10, false, {});
    };
    store.reset();
    EXPECT_FALSE(first->listener);
    EXPECT_EQ(second.use_count(), 1);
}

TEST_F(StoreLifetime, SourceRegisteredWhileTheStoreIsDestroyedGetsNoListener) {
    const auto first = addHooked("first", "", -9);
    const auto late = std::make_shared<HookedSource>(HookedSource::Table{{"a", 1}});
    first->whenDetached = [&, dying = store.get()] {
        EXPECT_TRUE(dying->addSource("late", "", -10, false, late).get());
    };
    store.reset();
    EXPECT_THAT(late->calls, ElementsAre("keys", "has a", "get a"));
    EXPECT_FALSE(late->listener);
}

TEST_F(StoreLifetime, SourceRemovedWhileTheStoreIsDestroyedGoesWithTheStoreUnlocked) {
    class OpenStore : public ConfigurationImpl {
    public:
        using ConfigurationImpl::mutex;
    };
    auto open = std::make_shared<OpenStore>();
    auto first = std::make_shared<HookedSource>();
    auto second = std::make_shared<HookedSource>();
    open->addSource("first", "", -9, false, first);
    open->addSource("second", "", -8, false, second);
    bool free = false;
    second->whenDestroyed = [&free, dying = open.get()] {
        free = testing::isFreeForOthers(dying->mutex);
    };
    second.reset();
    first->whenDetached = [dying = open.get()] { dying->removeSource("second"); };
    open.reset();
    EXPECT_TRUE(free);
}

/// An operation during which something gives up the last reference to the store.
struct LastOperation {
    const char* name;
    std::function<void(ConfigurationImpl&)> operation;
    std::size_t records;  ///< How many it writes.
};

std::ostream& operator<<(std::ostream& out, const LastOperation& last) {
    return out << last.name;
}

class StoreDroppedByALogSink : public testing::StoreTest,
                               public ::testing::WithParamInterface<LastOperation> {};

TEST_P(StoreDroppedByALogSink, OutlivesTheOperationThatWritesTheRecord) {
    for (std::size_t dropAt = 1; dropAt <= GetParam().records; ++dropAt) {
        store = std::make_shared<ConfigurationImpl>();
        store->set("a", 1);
        const std::weak_ptr<ConfigurationImpl> alive = store;
        ConfigurationImpl* const plain = store.get();
        std::size_t written = 0;
        bool aliveAfterwards = false;
        testing::LogCapture log("velkor::configuration", common::debug);
        log.whenRecorded([&](const testing::LogRecord&) {
            if (++written < dropAt) return;
            store.reset();
            aliveAfterwards = !alive.expired();
        });
        GetParam().operation(*plain);
        EXPECT_EQ(written, GetParam().records);
        EXPECT_TRUE(aliveAfterwards);
        EXPECT_TRUE(alive.expired());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Operations, StoreDroppedByALogSink,
    ::testing::Values(
        LastOperation{"Get", [](auto& store) { store.get("a"); }, 1},
        LastOperation{"GetOption", [](auto& store) { store.getOption("a"); }, 1},
        LastOperation{"Set", [](auto& store) { store.set("a", 2); }, 4},
        LastOperation{"SetByName", [](auto& store) { store.set("a", 2, "default"); }, 4},
        LastOperation{"RefusedSet", [](auto& store) { store.set("a", 2, "nobody"); }, 1},
        LastOperation{"WatchOption", [](auto& store) { store.watchOption("a"); }, 2},
        LastOperation{"WatchOfNothing", [](auto& store) { store.watchOption("b"); }, 1},
        LastOperation{"AddSource",
                      [](auto& store) {
                          store.addInMemorySource("n", "", -1, false, {{"a", 3}});
                      },
                      3},
        LastOperation{"RefusedAddSource",
                      [](auto& store) { store.addInMemorySource("default", "", 1, false, {}); }, 1},
        LastOperation{"RemoveSource", [](auto& store) { store.removeSource("override"); }, 2},
        LastOperation{"RemoveNothing", [](auto& store) { store.removeSource("nobody"); }, 1}),
    [](const auto& row) { return row.param.name; });

TEST(StoreLifetimeDeathTest, FailureOfASourceDuringDestructionEndsTheProcess) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            ConfigurationImpl store;
            const auto source = std::make_shared<HookedSource>();
            source->whenDetached = [] { throw std::logic_error("can't detach"); };
            store.addSource("extra", "", 5, false, source);
        },
        ::testing::KilledBySignal(SIGABRT), "can't detach");
}

}  // namespace
}  // namespace velkor::configuration
