#include "layers/LiveSource.hpp"

#include <gmock/gmock.h>

#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/layers/TickingSource.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

class LiveSourceTest : public ::testing::Test {
protected:
    std::string valueOf(const std::string& key) const { return textOf(store->get(key).get()); }

    void add(const std::string& name = "live", const std::string& group = "") {
        ASSERT_TRUE(store->addSource(name, group, 5, true, source).get());
    }

    // Runs `onValue` for each value of `key`.
    template <class F>
    auto watch(const std::string& key, F onValue) {
        return reactive_streams::subscribe(
            *store->watchOption(key),
            {[onValue](ConfigurationValue value) { onValue(textOf(value)); }, {}, {}});
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::shared_ptr<TickingSource> source =
        std::make_shared<TickingSource>(ValueMap{{"a", std::string("1")}});
};

TEST_F(LiveSourceTest, IsReadByTheStore) {
    add("live", "group");

    EXPECT_EQ(valueOf("group.a"), "1");
}

TEST_F(LiveSourceTest, AnswersDirectlyToo) {
    EXPECT_EQ(textOf(source->get("a")), "1");
    EXPECT_TRUE(source->has("a"));
    EXPECT_FALSE(source->has("b"));
    EXPECT_THAT(source->keys(), ElementsAre("a"));
}

TEST_F(LiveSourceTest, HasNoValueForAKeyThatIsNotThere) {
    EXPECT_THAT([&] { source->get("b"); },
                ::testing::ThrowsMessage<std::out_of_range>("_Map_base::at"));
}

TEST_F(LiveSourceTest, AChangeReachesWatchers) {
    add("live", "group");
    std::vector<std::string> seen;
    const auto watching =
        watch("group.a", [&](const std::string& value) { seen.push_back(value); });

    source->tick({{"a", "2"}});
    source->tick({{"a", "3"}});

    EXPECT_THAT(seen, ElementsAre("1", "2", "3"));
}

TEST_F(LiveSourceTest, AKeyThatGoesLetsTheLayerBelowReachWatchers) {
    add();
    store->set("a", std::string("default"), "default").get();
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) { seen.push_back(value); });

    source->tick({{"a", std::nullopt}});

    EXPECT_THAT(seen, ElementsAre("1", "default"));
}

TEST_F(LiveSourceTest, WatchersAreToldOfABatchWhenAllOfItCanBeRead) {
    add();
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string&) {
        if (source->has("b")) seen.push_back(valueOf("a") + valueOf("b"));
    });

    source->tick({{"a", "2"}, {"b", "2"}});

    EXPECT_THAT(seen, ElementsAre("22"));
}

TEST_F(LiveSourceTest, ABatchGrowsTheVersionBeforeAnybodyCanReadIt) {
    add();
    const auto before = store->read({"a"}).get();

    source->tick({{"a", "2"}});

    EXPECT_GT(store->read({"a"}).get().version, before.version);
}

TEST_F(LiveSourceTest, WhatChangesBeforeTheStoreListensIsToldAfterwards) {
    store->set("a", std::string("default"), "default").get();
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) {
        seen.push_back(value);
        // The store tells of the new source's keys before it gives its listener.
        if (value == "1") source->tick({{"a", "2"}});
    });

    add();

    EXPECT_THAT(seen, ElementsAre("default", "1", "2"));
}

TEST_F(LiveSourceTest, CallsAListenerOnceForEachKeyWhenItCanBeRead) {
    std::vector<std::string> calls;
    source->setChangeListener(
        [&](const std::string& key) { calls.push_back(key + "=" + textOf(source->get(key))); });

    source->tick({{"a", "2"}, {"b", "3"}});

    EXPECT_THAT(calls, ElementsAre("a=2", "b=3"));
}

TEST_F(LiveSourceTest, AListenerThatIsTakenBackInsideItHearsNoMoreOfTheBatch) {
    std::vector<std::string> calls;
    source->setChangeListener([&](const std::string& key) {
        calls.push_back(key);
        source->setChangeListener({});
    });

    source->tick({{"a", "2"}, {"b", "3"}});

    EXPECT_THAT(calls, ElementsAre("a"));
}

TEST_F(LiveSourceTest, AChangeThatFailsTellsNobody) {
    std::vector<std::string> calls;
    source->setChangeListener([&](const std::string& key) { calls.push_back(key); });

    EXPECT_THROW(source->failToTick(std::runtime_error("no")), std::runtime_error);

    EXPECT_THAT(calls, IsEmpty());
    EXPECT_EQ(textOf(source->get("a")), "1");
}

TEST_F(LiveSourceTest, WhatAListenerThrowsPassesOnWhenTheValueIsChanged) {
    source->setChangeListener([](const std::string&) { throw std::runtime_error("no"); });

    EXPECT_THROW(source->tick({{"a", "2"}}), std::runtime_error);

    EXPECT_EQ(textOf(source->get("a")), "2");
}

TEST_F(LiveSourceTest, AListenerThatThrowsIsToldOfTheOtherKeys) {
    std::vector<std::string> calls;
    source->setChangeListener([&](const std::string& key) {
        calls.push_back(key);
        throw std::runtime_error(key);
    });

    EXPECT_THAT(
        [&] {
            source->tick({{"a", "2"}, {"b", "3"}});
        },
        ::testing::ThrowsMessage<std::runtime_error>("a"));

    EXPECT_THAT(calls, ElementsAre("a", "b"));
}

TEST_F(LiveSourceTest, IsStartedByRegistrationAndStoppedByRemoval) {
    add();
    EXPECT_EQ(source->startedCount, 1);
    EXPECT_EQ(source->stoppedCount, 0);

    store->removeSource("live").get();

    EXPECT_EQ(source->stoppedCount, 1);
}

TEST_F(LiveSourceTest, IsStoppedByTheEndOfItsStore) {
    add();

    store.reset();

    EXPECT_EQ(source->stoppedCount, 1);
}

TEST_F(LiveSourceTest, TellsNobodyAfterItsRemoval) {
    add();
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) { seen.push_back(value); });
    store->set("a", std::string("override")).get();
    store->removeSource("live").get();
    seen.clear();

    source->tick({{"a", "2"}});

    EXPECT_THAT(seen, IsEmpty());
    EXPECT_EQ(textOf(source->get("a")), "2");
}

TEST_F(LiveSourceTest, OutlivesItsStore) {
    add();
    store.reset();

    source->tick({{"a", "2"}});

    EXPECT_EQ(textOf(source->get("a")), "2");
}

TEST_F(LiveSourceTest, MayBeRegisteredAgainAfterItsRemoval) {
    add();
    store->removeSource("live").get();
    add("again");
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) { seen.push_back(value); });

    source->tick({{"a", "2"}});

    EXPECT_THAT(seen, ElementsAre("1", "2"));
}

TEST_F(LiveSourceTest, MayBeRegisteredInAnotherStoreWhenItsOwnHasGone) {
    add();
    store = std::make_shared<ConfigurationImpl>();
    add();

    EXPECT_EQ(valueOf("a"), "1");
}

TEST_F(LiveSourceTest, IsNotRegisteredTwice) {
    add();

    EXPECT_THAT([&] { store->addSource("second", "", 1, true, source); },
                ::testing::ThrowsMessage<std::invalid_argument>(
                    "A source that changes by itself is registered once."));

    EXPECT_EQ(store->describeSources().get().size(), 3U);
    EXPECT_EQ(source->stoppedCount, 0);
}

TEST_F(LiveSourceTest, IsNotAttachedByAnAdditionThatFails) {
    EXPECT_THROW(store->addSource("default", "", 1, true, source).get(), std::invalid_argument);

    add();
    EXPECT_EQ(source->startedCount, 1);
}

TEST_F(LiveSourceTest, IsNotRegisteredWhenItCannotStart) {
    source->whenStarted = [] { throw std::runtime_error("no"); };
    EXPECT_THROW(store->addSource("live", "", 1, true, source), std::runtime_error);
    EXPECT_FALSE(store->has("a").get());

    source->whenStarted = nullptr;
    add();
    EXPECT_EQ(valueOf("a"), "1");
}

TEST_F(LiveSourceTest, SeveralChangesOfOneTransactionAreToldTogether) {
    ASSERT_TRUE(store->addSource("live", "", -1, false, source).get());
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string&) {
        if (source->has("b")) seen.push_back(valueOf("a") + valueOf("b"));
    });

    store->apply({{"a", std::string("2")}, {"b", std::string("2")}}).get();

    EXPECT_THAT(seen, ElementsAre("22"));
}

TEST_F(LiveSourceTest, IsWrittenThroughTheStore) {
    ASSERT_TRUE(store->addSource("live", "", -1, false, source).get());
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) { seen.push_back(value); });

    EXPECT_EQ(textOf(store->set("a", std::string("2")).get()), "1");

    EXPECT_THAT(seen, ElementsAre("1", "2"));
}

TEST_F(LiveSourceTest, MayDropTheLastReferenceToItsStoreWhileItTells) {
    add();
    const std::weak_ptr<ConfigurationImpl> observed = store;
    const auto watching = watch("a", [&](const std::string& value) {
        if (value == "2") store.reset();
    });

    source->tick({{"a", "2"}});

    EXPECT_TRUE(observed.expired());
    EXPECT_EQ(source->stoppedCount, 1);
}

TEST_F(LiveSourceTest, MayRemoveItselfWhileItTells) {
    add();
    std::vector<std::string> seen;
    const auto watching = watch("a", [&](const std::string& value) {
        seen.push_back(value);
        if (value == "2") store->removeSource("live").get();
    });

    source->tick({{"a", "2"}});
    source->tick({{"a", "3"}});

    EXPECT_THAT(seen, ElementsAre("1", "2"));
}

}  // namespace
}  // namespace velkor::layers
