#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;
using testing::textOf;
using Subscriber = testing::RecordingSubscriber<ConfigurationValue>;

// Sources that call the store while the store calls them.
class Reentrancy : public testing::StoreTest {
protected:
    void SetUp() override {
        early = addHooked("early", "", -5, {{"a", 1}});
        late = addHooked("late", "", 5, {{"a", 2}, {"b", 3}});
    }

    // Runs `action` at the first call only: what it does may call the source again.
    static std::function<void()> once(std::function<void()> action) {
        return [action = std::move(action), done = false]() mutable {
            if (!std::exchange(done, true)) action();
        };
    }

    // Whether another thread gets an answer from the store.
    bool isFree() const {
        return testing::completes([store = store] { store->has("free"); });
    }

    std::shared_ptr<HookedSource> early;
    std::shared_ptr<HookedSource> late;
};

TEST_F(Reentrancy, HasMayReadTheStore) {
    std::string seen;
    early->whenHas = once([&] { seen = valueOf("b"); });
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(seen, "int 3");
    EXPECT_TRUE(isFree());
}

TEST_F(Reentrancy, GetMayReadTheStore) {
    std::string seen;
    early->whenGet = once([&] { seen = valueOf("a") + " of " + sourceOf("a"); });
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(seen, "int 1 of early");
}

TEST_F(Reentrancy, GetOfAGroupMayReadAnotherKeyOfTheGroup) {
    const auto grouped = addHooked("grouped", "net", -9, {{"a", 4}, {"longer.key", 5}});
    std::string seen;
    grouped->whenHas = once([&] { seen = valueOf("net.longer.key"); });
    EXPECT_EQ(valueOf("net.a"), "int 4");
    EXPECT_EQ(seen, "int 5");
    EXPECT_THAT(grouped->calls, ElementsAre("has a", "has longer.key", "get longer.key", "get a"));
}

TEST_F(Reentrancy, DeeplyNestedReadsOfGroupsKeepTheirKeysApart) {
    const auto grouped = addHooked("grouped", "net", -9);
    constexpr int depth = 20;
    for (int level = 0; level <= depth; ++level) {
        grouped->values["k" + std::to_string(level)] = level;
    }
    int level = 0;
    grouped->whenHas = [&] {
        const int own = ++level;
        if (own <= depth) {
            EXPECT_EQ(valueOf("net.k" + std::to_string(own)), "int " + std::to_string(own));
        }
    };
    EXPECT_EQ(valueOf("net.k0"), "int 0");
}

TEST_F(Reentrancy, KeysMayReadTheStore) {
    early->whenKeys = once([&] { EXPECT_EQ(valueOf("b"), "int 3"); });
    EXPECT_THAT(store->keys().get(), ElementsAre("a", "b"));
}

TEST_F(Reentrancy, SetMayWriteTheStore) {
    early->whenSet = once([&] { store->set("b", 9, "late"); });
    EXPECT_EQ(textOf(store->set("a", 5).get()), "int 1");
    EXPECT_EQ(valueOf("b"), "int 9");
    EXPECT_TRUE(isFree());
}

TEST_F(Reentrancy, GetMayWriteTheStore) {
    early->whenGet = once([&] { store->set("b", 9, "late"); });
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(valueOf("b"), "int 9");
}

TEST_F(Reentrancy, HasMayWatchTheStore) {
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    early->whenHas = once([&] { store->watchOption("b")->subscribe(subscriber); });
    EXPECT_EQ(valueOf("a"), "int 1");
    store->set("b", 9, "late");
    ASSERT_EQ(subscriber->values.size(), 2U);
    EXPECT_EQ(textOf(subscriber->values.back()), "int 9");
}

TEST_F(Reentrancy, HasMayRemoveItsOwnSource) {
    early->whenHas = once([&] { store->removeSource("early"); });
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Reentrancy, GetMayRemoveItsOwnSource) {
    early->whenGet = once([&] { store->removeSource("early"); });
    EXPECT_EQ(sourceOf("a"), "early");
    EXPECT_EQ(sourceOf("a"), "late");
}

TEST_F(Reentrancy, RemovedSourceLivesUntilTheReadThatCallsItIsOver) {
    bool destroyed = false;
    bool destroyedTooEarly = false;
    HookedSource* const source = early.get();
    source->whenDestroyed = [&] { destroyed = true; };
    source->whenGet = once([&] {
        store->removeSource("early");
        store->has("b");
        destroyedTooEarly = destroyed;
    });
    early.reset();
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_FALSE(destroyedTooEarly);
    EXPECT_TRUE(destroyed);
}

TEST_F(Reentrancy, HasMayRemoveAllSources) {
    early->whenHas = once([&] {
        for (const auto& name : names()) store->removeSource(name);
    });
    early->values.clear();
    store->get("b");
    EXPECT_TRUE(names().empty());
    EXPECT_TRUE(isFree());
}

TEST_F(Reentrancy, HasMayAddManySources) {
    early->whenHas = once([&] {
        for (int number = 0; number < 100; ++number) {
            add("new" + std::to_string(number), "", number - 50, {});
        }
    });
    early->values.clear();
    EXPECT_EQ(valueOf("b"), "int 3");
    EXPECT_EQ(names().size(), 104U);
}

TEST_F(Reentrancy, KeysMayChangeTheRegistry) {
    early->whenKeys = once([&] {
        store->removeSource("late");
        store->removeSource("early");
        add("new", "", 1, {{"c", 1}});
    });
    store->keys();
    EXPECT_THAT(store->keys().get(), ElementsAre("c"));
}

TEST_F(Reentrancy, KeysMayRemoveItsOwnSourceDuringItsRemoval) {
    early->whenKeys = once([&] { store->removeSource("early"); });
    store->removeSource("early");
    EXPECT_THAT(names(), ElementsAre("override", "late", "default"));
    EXPECT_TRUE(isFree());
}

TEST_F(Reentrancy, KeysMayReplaceItsOwnSourceDuringItsRemoval) {
    early->whenKeys = once([&] {
        store->removeSource("early");
        add("early", "", -7, {{"c", 1}});
    });
    EXPECT_TRUE(store->removeSource("early").get());
    EXPECT_EQ(valueOf("c"), "int 1");
}

TEST_F(Reentrancy, KeysMayRemoveItsOwnSourceDuringItsRegistration) {
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"c", 1}});
    source->whenKeys = once([&] { store->removeSource("new"); });
    EXPECT_TRUE(store->addSource("new", "", 5, false, source).get());
    EXPECT_THAT(names(), ElementsAre("early", "override", "late", "default"));
}

TEST_F(Reentrancy, KeysMayAddAnotherSourceDuringItsRegistration) {
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"c", 1}});
    source->whenKeys = once([&] { add("inner", "", 4, {{"d", 2}}); });
    EXPECT_TRUE(store->addSource("outer", "", 5, false, source).get());
    EXPECT_THAT(names(), ElementsAre("early", "override", "inner", "outer", "late", "default"));
}

TEST_F(Reentrancy, SetMayRemoveItsOwnSource) {
    bool destroyed = false;
    HookedSource* const source = early.get();
    source->whenDestroyed = [&] { destroyed = true; };
    source->whenSet = once([&] {
        store->removeSource("early");
        EXPECT_FALSE(destroyed);
    });
    early.reset();
    EXPECT_EQ(textOf(store->set("a", 5).get()), "int 1");
    EXPECT_TRUE(destroyed);
    EXPECT_EQ(valueOf("a"), "int 2");
}

TEST_F(Reentrancy, ExplanationSurvivesAChangeOfTheRegistry) {
    early->whenGet = once([&] {
        store->removeSource("late");
        store->removeSource("early");
    });
    EXPECT_EQ(store->explain("a").get().front().source, "early");
    EXPECT_TRUE(store->explain("a").get().empty());
}

TEST_F(Reentrancy, ThrowAfterAChangeOfTheRegistryLeavesTheStoreUsable) {
    early->whenHas = once([&] {
        store->removeSource("early");
        throw std::logic_error("after the removal");
    });
    EXPECT_THROW(store->get("a"), std::logic_error);
    EXPECT_EQ(valueOf("a"), "int 2");
    EXPECT_TRUE(isFree());
}

TEST_F(Reentrancy, ListenerReportsFromInsideGet) {
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("a")->subscribe(subscriber);
    early->whenGet = once([&] { early->listener("a"); });
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_EQ(subscriber->values.size(), 2U);
    EXPECT_TRUE(isFree());
}

// Destructors that need the store to be free: they wait for a thread that waits for the store.
class SourceDestruction : public Reentrancy {
protected:
    // Lets the destructor of `source` ask whether the store is free, and gives the reference up.
    void askOnDestruction(std::shared_ptr<HookedSource>& source) {
        source->whenDestroyed = [this] {
            ++destructions;
            wasFree = isFree();
            destroyer = std::this_thread::get_id();
        };
        source.reset();
    }

    int destructions = 0;
    bool wasFree = false;
    std::thread::id destroyer;
};

TEST_F(SourceDestruction, RunsWithTheStoreFreeAfterARemoval) {
    askOnDestruction(early);
    store->removeSource("early");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

TEST_F(SourceDestruction, RunsWithTheStoreFreeAfterANestedRemoval) {
    askOnDestruction(late);
    early->whenGet = once([&] { store->removeSource("late"); });
    store->get("a");
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

TEST_F(SourceDestruction, RunsWithTheStoreFreeAfterARemovalFromASet) {
    HookedSource* const source = early.get();
    askOnDestruction(early);
    source->whenSet = once([&] { store->removeSource("early"); });
    store->set("a", 5);
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

TEST_F(SourceDestruction, RunsWithTheStoreFreeAfterARefusedRegistration) {
    auto source = std::make_shared<HookedSource>();
    source->whenDestroyed = [this] {
        ++destructions;
        wasFree = isFree();
    };
    store->addSource("early", "", 5, false, std::move(source));
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

TEST_F(SourceDestruction, RunsWithTheStoreFreeAfterARemovalFromASubscriber) {
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("c")->subscribe(subscriber);
    subscriber->whenNext = [&](const ConfigurationValue&) { store->removeSource("late"); };
    askOnDestruction(late);
    add("new", "", 1, {{"c", 1}});
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

TEST_F(SourceDestruction, RunsOnTheThreadThatRemovesTheSource) {
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("a")->subscribe(subscriber);
    subscriber->whenNext = [&](const ConfigurationValue&) { EXPECT_TRUE(isFree()); };
    askOnDestruction(early);
    store->removeSource("early");
    EXPECT_EQ(subscriber->values.size(), 2U);
    EXPECT_EQ(destructions, 1);
    EXPECT_EQ(destroyer, std::this_thread::get_id());
}

TEST_F(SourceDestruction, IsNotLeftToAThreadThatReadsMeanwhile) {
    // A list of sources that another thread keeps for its own walk must not keep the source alive
    // beyond its removal.
    const auto subscriber = std::make_shared<Subscriber>(testing::allValues);
    store->watchOption("c")->subscribe(subscriber);
    subscriber->whenNext = [&](const ConfigurationValue&) {
        EXPECT_TRUE(testing::completes([this] { store->removeSource("early"); }));
        EXPECT_EQ(destructions, 1);
    };
    askOnDestruction(early);
    add("new", "", 1, {{"c", 1}});
    EXPECT_EQ(destructions, 1);
    EXPECT_TRUE(wasFree);
}

}  // namespace
}  // namespace velkor::configuration
