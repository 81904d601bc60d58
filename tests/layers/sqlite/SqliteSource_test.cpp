#include "layers/sqlite/SqliteSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationImpl;
using ::testing::ElementsAre;

TEST(SqliteSource, ReadsAWriteAtOnce) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a.b", 1);
    EXPECT_TRUE(source->has("a.b"));
    EXPECT_EQ(textOf(source->get("a.b")), "int 1");
}

TEST(SqliteSource, AnswersANewValueWithItself) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    EXPECT_EQ(textOf(source->set("a", 1)), "int 1");
}

TEST(SqliteSource, AnswersAReplacementWithTheFormerValue) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    EXPECT_EQ(textOf(source->set("a", 2)), "int 1");
}

TEST(SqliteSource, ForgetsAKey) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    EXPECT_EQ(textOf(source->unset("a").value()), "int 1");
    EXPECT_FALSE(source->has("a"));
}

TEST(SqliteSource, ForgettingAnUnknownKeyDoesNothing) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    EXPECT_FALSE(source->unset("a").has_value());
    source->committed().get();
    EXPECT_THAT(historyOf(*source), ElementsAre());
}

TEST(SqliteSource, TellsItsListenerOfEachWriteWhenItCanBeRead) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    std::vector<std::string> told;
    source->setChangeListener([&](const std::string& key) {
        told.push_back(key + " " + (source->has(key) ? textOf(source->get(key)) : "gone"));
    });
    source->set("a", 1);
    source->set("a", 2);
    source->unset("a");
    source->unset("a");
    EXPECT_THAT(told, ElementsAre("a int 1", "a int 2", "a gone"));
}

TEST(SqliteSource, KeepsWhatWasCommitted) {
    const StateFolder folder;
    {
        const auto source = SqliteSource::open(folder.file());
        source->set("a", 1);
        source->set("b", std::string("text"));
        source->set("a", 2);
        source->set("c", 3);
        source->unset("c");
        EXPECT_TRUE(source->committed().get());
    }
    const auto source = SqliteSource::open(folder.file());
    EXPECT_THAT(source->keys(), ElementsAre("a", "b"));
    EXPECT_EQ(textOf(source->get("a")), "int 2");
    EXPECT_EQ(textOf(source->get("b")), "string text");
}

TEST(SqliteSource, CommitsWhatWaitsBeforeItEnds) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    EXPECT_EQ(textOf(SqliteSource::open(folder.file())->get("a")), "int 1");
}

TEST(SqliteSource, IsOnTheDiskWhenItSaysSo) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    EXPECT_TRUE(source->committed().get());
    EXPECT_EQ(OtherProgram(folder.file()).run("SELECT key, value FROM entries"), "a int:1 ");
}

TEST(SqliteSource, WithoutWritesEverythingIsOnTheDisk) {
    const StateFolder folder;
    EXPECT_TRUE(SqliteSource::open(folder.file())->committed().get());
}

TEST(SqliteSource, TakesTheWritesOfAStore) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    store->set("a", 1);
    EXPECT_EQ(textOf(store->get("a").get()), "int 1");
    EXPECT_EQ(textOf(source->get("a")), "int 1");
    EXPECT_TRUE(store->unset("a").get());
    EXPECT_FALSE(store->has("a").get());
}

TEST(SqliteSource, HoldsKeysWithoutItsGroup) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "site", -1, false, source);
    store->set("site.a", 1);
    EXPECT_THAT(source->keys(), ElementsAre("a"));
}

}  // namespace
}  // namespace velkor::testing
