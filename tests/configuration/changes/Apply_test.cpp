#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/StoreErrors.hpp"
#include "configuration/sources/GroupingSource.hpp"
#include "tests/configuration/changes/ChangeTesting.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::failureOf;
using testing::HookedSource;
using testing::textOf;

class Apply : public ChangeTest {
protected:
    static Change setting(std::string key, int value) { return {std::move(key), value, {}}; }
    static Change unsetting(std::string key) { return {std::move(key), std::nullopt, {}}; }
};

TEST_F(Apply, WritesAllKeys) {
    set("c", 3);
    store->apply({setting("a", 1), setting("b", 2), unsetting("c")}).get();
    EXPECT_THAT(store->keys().get(), ElementsAre("a", "b"));
}

TEST_F(Apply, GivesWhatWasChangedAndWhere) {
    set("a", 1);
    const auto applied =
        store->apply({setting("a", 2), {"b", 3, "default"}, unsetting("missing")}).get();
    ASSERT_EQ(applied.size(), 3U);
    EXPECT_EQ(applied[0].key, "a");
    EXPECT_EQ(applied[0].source, "override");
    EXPECT_EQ(textOf(applied[0].before.value()), "int 1");
    EXPECT_EQ(applied[1].source, "default");
    EXPECT_FALSE(applied[1].before);
    EXPECT_FALSE(applied[2].before);
}

TEST_F(Apply, OfNothingChangesNothing) {
    const auto before = version();
    EXPECT_TRUE(store->apply({}).get().empty());
    EXPECT_EQ(version(), before);
}

TEST_F(Apply, LaterChangesOfAKeyCome) {
    const Watch watched = watch("a");
    store->apply({setting("a", 1), setting("a", 2)}).get();
    EXPECT_EQ(valueOf("a"), "int 2");
    EXPECT_THAT(watched.values(), ElementsAre("int 2"));
}

TEST_F(Apply, WatchersFindEveryKeyChanged) {
    std::vector<std::string> seen;
    const Watch first = watch("a");
    const Watch second = watch("b");
    first.subscriber->whenNext = [&](const auto&) { seen.push_back(valueOf("b")); };
    second.subscriber->whenNext = [&](const auto&) { seen.push_back(valueOf("a")); };
    store->apply({setting("a", 1), setting("b", 2)}).get();
    EXPECT_THAT(seen, ElementsAre("int 2", "int 1"));
}

TEST_F(Apply, StreamsOfChangesGetAllKeysWithOneVersion) {
    const ChangeWatch followed = follow("");
    store->apply({setting("a", 1), setting("b", 2)}).get();
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@override", "b=int 2@override"));
    EXPECT_EQ(followed.subscriber->values[0].version, followed.subscriber->values[1].version);
}

TEST_F(Apply, DryRunChangesNothingAndTellsNobody) {
    set("a", 1);
    const Watch watched = watch("a");
    const auto outcome = store->apply({setting("a", 2), unsetting("a")}, true).get();
    ASSERT_EQ(outcome.size(), 2U);
    EXPECT_EQ(outcome[0].source, "override");
    EXPECT_EQ(textOf(outcome[0].before.value()), "int 1");
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
}

TEST_F(Apply, RefusalNamesEveryRefusedKeyAndChangesNothing) {
    const testing::TemporaryFile file("net.x=1\n");
    store->addPropertyFileSource("file", "", -1, false, file.path()).get();
    const std::string expected =
        "Changes refused: Configuration source can't forget keys: net.x, file; "
        "Source not found or not writable: b, nobody";
    for (const bool dryRun : {true, false}) {
        EXPECT_EQ(failureOf(store->apply(
                      {unsetting("net.x"), {"a", 1, "override"}, {"b", 2, "nobody"}}, dryRun)),
                  expected);
        EXPECT_FALSE(store->has("a").get());
    }
    EXPECT_EQ(refusalOf(std::runtime_error(expected)), Refusal::notWritable);
}

TEST_F(Apply, WithoutAWritableSourceIsRefused) {
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_EQ(failureOf(store->apply({setting("a", 1)})),
              "Changes refused: No writable configuration source for key: a");
}

TEST_F(Apply, WhatASourceThrowsTakesTheOthersBack) {
    set("a", 1);
    const auto source = addHooked("hooked", "net", -1, {{"x", 5}});
    source->whenSet = [] { throw std::logic_error("disk full"); };
    const Watch watched = watch("a");
    EXPECT_THROW(store->apply({setting("a", 2), setting("b", 3), setting("net.x", 4)}),
                 std::logic_error);
    EXPECT_EQ(valueOf("a"), "int 1");
    EXPECT_FALSE(store->has("b").get());
    EXPECT_EQ(valueOf("net.x"), "int 5");
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
}

TEST_F(Apply, AfterAnExceptionChangesAreToldAgain) {
    const auto source = addHooked("hooked", "net", -1);
    source->whenSet = [] { throw std::logic_error("disk full"); };
    EXPECT_THROW(store->apply({setting("net.x", 4)}), std::logic_error);
    const Watch watched = watch("a");
    set("a", 1);
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
}

TEST_F(Apply, InASourceThatWritesElsewhereItselfTellsEverythingTogether) {
    const auto source = addHooked("hooked", "net", -1);
    source->whenSet = [this] { store->apply({setting("mirror", 9)}); };
    std::vector<std::string> seen;
    const Watch watched = watch("mirror");
    watched.subscriber->whenNext = [&](const auto&) { seen.push_back(valueOf("net.x")); };
    store->apply({setting("net.x", 4)}).get();
    EXPECT_THAT(seen, ElementsAre("int 4"));
}

TEST_F(Apply, TellsWhatASourceWithoutAListenerTakes) {
    const auto source = std::make_shared<HookedSource>();
    source->whenKeys = [] { throw std::logic_error("no keys"); };
    EXPECT_THROW(store->addSource("new", "", -1, false, source), std::logic_error);
    const Watch watched = watch("a");
    const auto before = version();
    store->apply({setting("a", 1)}).get();
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
    EXPECT_GT(version(), before);
}

TEST_F(Apply, ReleasesTheStoreWhileWatchersAreTold) {
    const Watch watched = watch("a");
    bool free = false;
    watched.subscriber->whenNext = [&](const auto&) { free = open->isFreeForOthers(); };
    store->apply({setting("a", 1)}).get();
    EXPECT_TRUE(free);
}

TEST_F(Apply, OfManyKeysTellsEachOnce) {
    std::vector<Change> changes;
    for (int i = 0; i < 20000; ++i) changes.push_back(setting("k" + std::to_string(i), i));
    const ChangeWatch followed = follow("");
    store->apply(changes).get();
    EXPECT_EQ(followed.subscriber->values.size(), 20000U);
}

/// A source that notes its groups among the calls that it gets.
class GroupedSource final : public HookedSource, public GroupingSource {
public:
    void beginGroup() override {
        if (refuses) throw std::runtime_error("no group");
        ++depth;
        calls.emplace_back("begin");
    }

    void endGroup() noexcept override {
        --depth;
        calls.emplace_back("end");
    }

    /// The calls that write and those around them.
    std::vector<std::string> groups() const {
        std::vector<std::string> noted;
        for (const auto& call : calls) {
            if (call == "begin" || call == "end" || call.rfind("set", 0) == 0) {
                noted.push_back(call);
            }
        }
        return noted;
    }

    bool refuses = false;
    int depth = 0;
};

TEST_F(Apply, WritesWithinAGroupOfTheSource) {
    const auto source = std::make_shared<GroupedSource>();
    store->addSource("grouped", "", -1, false, source);
    store->apply({setting("a", 1), setting("b", 2)}).get();
    EXPECT_THAT(source->groups(), ElementsAre("begin", "begin", "set a", "set b", "end", "end"));
}

TEST_F(Apply, EndsTheGroupWhenASourceThrows) {
    const auto source = std::make_shared<GroupedSource>();
    store->addSource("grouped", "", -1, false, source);
    source->whenSet = [] { throw std::runtime_error("full"); };
    EXPECT_THROW(store->apply({setting("a", 1)}).get(), std::runtime_error);
    EXPECT_EQ(source->depth, 0);
}

TEST_F(Apply, WritesNothingWhenAGroupCannotBegin) {
    const auto first = std::make_shared<GroupedSource>();
    const auto second = std::make_shared<GroupedSource>();
    store->addSource("first", "", -1, false, first);
    store->addSource("second", "", -2, false, second);
    second->refuses = true;
    EXPECT_THROW(store->apply({{"a", 1, "first"}, {"b", 1, "second"}}).get(), std::runtime_error);
    EXPECT_THAT(first->groups(), ElementsAre("begin", "end"));
}

TEST_F(Apply, OfOneKeyBySetMakesNoGroup) {
    const auto source = std::make_shared<GroupedSource>();
    store->addSource("grouped", "", -1, false, source);
    store->set("a", 1);
    EXPECT_THAT(source->groups(), ElementsAre("set a"));
}

}  // namespace
}  // namespace velkor::configuration
