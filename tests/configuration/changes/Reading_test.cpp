#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "configuration/sources/InMemorySource.hpp"
#include "tests/configuration/changes/ChangeTesting.hpp"

namespace velkor::configuration {
namespace {

using testing::textOf;

class ReadingTest : public ChangeTest {};

TEST_F(ReadingTest, AnswersEveryKeyInTheOrderAskedFor) {
    set("b", 2);
    add("net", "net", 5, {{"port", 1}});
    const Reading reading = store->read({"net.port", "missing", "b", "b"}).get();
    ASSERT_EQ(reading.options.size(), 4U);
    EXPECT_EQ(reading.options[0]->key, "net.port");
    EXPECT_EQ(reading.options[0]->source, "net");
    EXPECT_EQ(textOf(reading.options[0]->value), "int 1");
    EXPECT_FALSE(reading.options[1]);
    EXPECT_EQ(textOf(reading.options[2]->value), "int 2");
    EXPECT_EQ(textOf(reading.options[3]->value), "int 2");
}

TEST_F(ReadingTest, OfNoKeysGivesTheVersion) {
    EXPECT_TRUE(store->read({}).get().options.empty());
    EXPECT_EQ(store->read({}).get().version, version());
}

TEST_F(ReadingTest, WhatASourceThrowsLeavesTheCall) {
    const auto source = addHooked("hooked", "", -1, {{"a", 1}});
    source->whenGet = [] { throw std::logic_error("get"); };
    EXPECT_THROW(store->read({"a"}), std::logic_error);
    EXPECT_TRUE(open->isFreeForOthers());
}

/// Something that changes the store.
struct VersionedChange {
    const char* name;
    std::function<void(OpenStore&)> change;
};

class VersionAfter : public ChangeTest, public ::testing::WithParamInterface<VersionedChange> {};

TEST_P(VersionAfter, AChangeIsGreater) {
    add("net", "net", 5, {{"port", 1}});
    const auto before = version();
    GetParam().change(*open);
    EXPECT_GT(version(), before);
}

INSTANTIATE_TEST_SUITE_P(
    Every, VersionAfter,
    ::testing::Values(
        VersionedChange{"Set", [](auto& store) { store.set("a", 1); }},
        VersionedChange{"SetByName", [](auto& store) { store.set("net.port", 2, "net"); }},
        VersionedChange{"Unset", [](auto& store) { store.unset("net.port", "net"); }},
        VersionedChange{"Apply",
                        [](auto& store) {
                            store.apply({{"a", 1, {}}});
                        }},
        VersionedChange{"AddSource",
                        [](auto& store) { store.addInMemorySource("n", "", 1, false, {}); }},
        VersionedChange{"RemoveSource", [](auto& store) { store.removeSource("net"); }}),
    [](const auto& row) { return row.param.name; });

TEST_F(ReadingTest, VersionGrowsWithAChangeThatASourceReports) {
    const auto source = addHooked("hooked", "", -1, {{"a", 1}});
    const auto before = version();
    source->listener("a");
    EXPECT_GT(version(), before);
}

TEST_F(ReadingTest, VersionGrowsWhenATableIsWrittenThatNobodyWatches) {
    const auto before = version();
    set("a", 1);
    EXPECT_EQ(version(), before + 1);
}

TEST_F(ReadingTest, ReadsChangeNoVersion) {
    set("a", 1);
    const auto before = version();
    store->get("a");
    store->read({"a"});
    store->unset("missing");
    store->apply({{"a", 5, {}}}, true);
    store->set("a", 1, "nobody");
    EXPECT_EQ(version(), before);
}

}  // namespace
}  // namespace velkor::configuration
