#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <string>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using ::testing::ElementsAre;

TEST(Journal, HasEveryWriteNewestFirst) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->set("a", 1);
    source->set("a", 2);
    source->unset("a");
    source->committed().get();
    EXPECT_THAT(historyOf(*source),
                ElementsAre("4 alice unset a: int 2 -> none", "3 alice set a: int 1 -> int 2",
                            "2 alice set a: int 1 -> int 1", "1 alice set a: none -> int 1"));
}

TEST(Journal, SaysWhen) {
    const StateFolder folder;
    const HandClock clock;
    SqliteOptions options;
    options.clock = clock.function();
    const auto source = SqliteSource::open(folder.file(), options);
    source->set("a", 1);
    source->committed().get();
    EXPECT_EQ(source->history("a", 1).at(0).when, clock.now());
}

TEST(Journal, CanBeReadAsThatOfAnySource) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->unset("a");
    source->committed().get();

    const auto changes = source->changes("a", 1);

    ASSERT_EQ(changes.size(), 1U);
    const auto& last = changes.front();
    EXPECT_EQ(last.number, 2);
    EXPECT_EQ(last.author, "alice");
    EXPECT_EQ(last.action, "unset");
    EXPECT_EQ(last.key, "a");
    EXPECT_EQ(textOf(last.before.value()), "int 1");
    EXPECT_FALSE(last.after);
}

TEST(Journal, GoesOnWhereItEnded) {
    const StateFolder folder;
    SqliteSource::open(folder.file(), by("alice"))->set("a", 1);
    const auto source = SqliteSource::open(folder.file(), by("bob"));
    source->set("a", 2);
    source->committed().get();
    EXPECT_THAT(historyOf(*source),
                ElementsAre("2 bob set a: int 1 -> int 2", "1 alice set a: none -> int 1"));
}

class JournalOf : public ::testing::Test {
protected:
    JournalOf() {
        for (const char* key : {"a", "a.b", "a.b.c", "a.bc", "a/", "ab", "b"}) source->set(key, 1);
        source->committed().get();
    }

    std::vector<std::string> keysIn(const std::string& keyOrPrefix, std::size_t limit = 100) {
        std::vector<std::string> keys;
        for (const auto& entry : source->history(keyOrPrefix, limit)) keys.push_back(entry.key);
        return keys;
    }

    const StateFolder folder;
    const std::shared_ptr<SqliteSource> source = SqliteSource::open(folder.file());
};

TEST_F(JournalOf, AKeyHasThatKeyOnly) {
    EXPECT_THAT(keysIn("a.b"), ElementsAre("a.b"));
}

TEST_F(JournalOf, APrefixHasWhatItBegins) {
    EXPECT_THAT(keysIn("a."), ElementsAre("a.bc", "a.b.c", "a.b"));
}

TEST_F(JournalOf, NothingHasAll) {
    EXPECT_THAT(keysIn(""), ElementsAre("b", "ab", "a/", "a.bc", "a.b.c", "a.b", "a"));
}

TEST_F(JournalOf, AnUnknownKeyIsEmpty) {
    EXPECT_THAT(keysIn("c"), ElementsAre());
}

TEST_F(JournalOf, AnythingIsNoLongerThanItsLimit) {
    EXPECT_THAT(keysIn("", 2), ElementsAre("b", "ab"));
    EXPECT_THAT(keysIn("", 0), ElementsAre());
}

TEST(Undo, GivesTheLastChangedKeyItsFormerValue) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->set("a", 2);
    source->undo();
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST(Undo, UnsetsAKeyThatHadNoValue) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    source->undo();
    EXPECT_FALSE(source->has("a"));
}

TEST(Undo, BringsBackWhatWasUnset) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    source->unset("a");
    source->undo();
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST(Undo, IsAWriteOfItsOwn) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file(), by("alice"));
    source->set("a", 1);
    source->set("a", 2);
    const auto entry = source->undo();
    source->committed().get();
    EXPECT_EQ(textOf(entry), "3 alice undo a: int 2 -> int 1");
    EXPECT_EQ(historyOf(*source).front(), textOf(entry));
}

TEST(Undo, IsUndoneByTheNextOne) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    source->set("a", 2);
    source->undo();
    source->undo();
    EXPECT_EQ(textOf(source->get("a")), "int 2");
}

TEST(Undo, OfAChangeOfLongAgoReadsTheFile) {
    const StateFolder folder;
    SqliteSource::open(folder.file())->set("a", 1);
    const auto source = SqliteSource::open(folder.file());
    source->set("b", 1);
    source->set("a", 2);
    source->undo(1);
    EXPECT_FALSE(source->has("a"));
    EXPECT_TRUE(source->has("b"));
}

TEST(Undo, TellsTheListener) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    std::vector<std::string> told;
    source->setChangeListener([&](const std::string& key) { told.push_back(key); });
    source->undo();
    EXPECT_THAT(told, ElementsAre("a"));
}

TEST(Undo, OfAnUnknownChangeIsRefused) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    source->set("a", 1);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source->undo(17); }),
              "No such change in the journal: 17");
}

TEST(Undo, WithoutAnyChangeIsRefused) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source->undo(); }),
              "There is no change in the journal.");
}

class Retention : public ::testing::Test {
protected:
    std::shared_ptr<SqliteSource> open() { return SqliteSource::open(folder.file(), options); }

    static void write(SqliteSource& source, int count) {
        for (int i = 0; i < count; ++i) source.set("a", i);
        source.committed().get();
    }

    static std::vector<std::int64_t> changesIn(SqliteSource& source) {
        std::vector<std::int64_t> changes;
        for (const auto& entry : source.history("", 1000)) changes.push_back(entry.change);
        return changes;
    }

    const StateFolder folder;
    HandClock clock;
    SqliteOptions options = [this] {
        SqliteOptions given;
        given.clock = clock.function();
        return given;
    }();
};

TEST_F(Retention, KeepsTheNewestEntries) {
    options.keepCount = 3;
    const auto source = open();
    write(*source, 10);
    EXPECT_THAT(changesIn(*source), ElementsAre(10, 9, 8));
}

TEST_F(Retention, AlwaysKeepsTheNewestEntry) {
    options.keepCount = 0;
    options.keepFor = std::chrono::hours(0);
    const auto source = open();
    write(*source, 10);
    EXPECT_THAT(changesIn(*source), ElementsAre(10));
}

TEST_F(Retention, DropsWhatIsTooOldWithTheNextWrite) {
    options.keepFor = std::chrono::hours(2);
    const auto source = open();
    write(*source, 2);
    clock.advance(std::chrono::minutes(90));
    write(*source, 1);
    clock.advance(std::chrono::minutes(90));
    write(*source, 1);
    EXPECT_THAT(changesIn(*source), ElementsAre(4, 3));
}

TEST_F(Retention, KeepsAllWhenToldTo) {
    options.keepCount = std::numeric_limits<std::size_t>::max();
    options.keepFor = std::chrono::hours::max();
    const auto source = open();
    write(*source, 10);
    EXPECT_EQ(changesIn(*source).size(), 10U);
}

TEST_F(Retention, UsesNoNumberTwice) {
    options.keepCount = 0;
    write(*open(), 3);
    const auto source = open();
    write(*source, 1);
    EXPECT_THAT(changesIn(*source), ElementsAre(4));
}

TEST_F(Retention, LeavesTheValuesAlone) {
    options.keepCount = 0;
    {
        const auto source = open();
        source->set("b", 1);
        write(*source, 3);
    }
    EXPECT_THAT(open()->keys(), ElementsAre("a", "b"));
}

}  // namespace
}  // namespace velkor::testing
