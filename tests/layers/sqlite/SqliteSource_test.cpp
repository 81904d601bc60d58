#include "layers/sqlite/SqliteSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::testing {
namespace {

using ::testing::ElementsAre;

SqliteOptions by(const std::string& author) {
    SqliteOptions options;
    options.author = author;
    return options;
}

TEST(SqliteSource, ReadsAWriteAtOnce) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a.b", 1);
    EXPECT_EQ(textOf(source->get("a.b")), "int 1");
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

TEST(SqliteSource, JournalsEveryWrite) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->set("a", 2);
    source->unset("a");
    source->unset("a");
    source->committed().get();
    EXPECT_THAT(historyOf(*source),
                ElementsAre("3 alice unset a: int 2 -> none", "2 alice set a: int 1 -> int 2",
                            "1 alice set a: none -> int 1"));
}

TEST(SqliteSource, UndoesTheLastChangeAsAWriteOfItsOwn) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->set("a", 2);
    EXPECT_EQ(textOf(source->undo()), "3 alice undo a: int 2 -> int 1");
    EXPECT_EQ(textOf(source->get("a")), "int 1");
    source->committed().get();
    EXPECT_EQ(textOf(source->undo(1)), "4 alice undo a: int 1 -> none");
    EXPECT_FALSE(source->has("a"));
}

TEST(SqliteSource, IsALayerOfAStore) {
    const StateFolder folder;
    const auto store = std::make_shared<configuration::ConfigurationImpl>();
    const auto source = SqliteSource::open(folder.file());
    store->addSource("state", "", -1, false, source);
    store->set("a", 1);
    EXPECT_TRUE(source->committed().get());
    EXPECT_EQ(textOf(store->get("a").get()), "int 1");
}

}  // namespace
}  // namespace velkor::testing
