#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/layers/sqlite/TestDisk.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using namespace std::chrono_literals;
using ::testing::ElementsAre;

class Expiry : public ::testing::Test {
protected:
    std::shared_ptr<SqliteSource> open() {
        SqliteOptions options = by("alice");
        options.clock = clock.function();
        options.vfs = TestDisk::name();
        return SqliteSource::open(folder.file(), options);
    }

    /// Lets time pass, and returns when the source has looked at the clock.
    void pass(std::chrono::milliseconds time, SqliteSource& source) {
        source.committed().get();
        clock.advance(time);
        source.set("tick", 1);
        EXPECT_TRUE(source.committed().get());
    }

    const StateFolder folder;
    TestDisk disk;
    HandClock clock;
};

TEST_F(Expiry, LeavesAValueUntilItsTime) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    pass(10min - 1ms, *source);
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST_F(Expiry, UnsetsAValueAtItsTime) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    pass(10min, *source);
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, NeedsNoOtherWrite) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    Latch told;
    source->setChangeListener([&](const std::string&) { told.countDown(); });
    clock.advance(10min);
    EXPECT_TRUE(told.wait());
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, ByTheClockOfTheSystemComesInTime) {
    const auto source = SqliteSource::open(folder.file());
    Latch told(2);
    source->setChangeListener([&](const std::string&) { told.countDown(); });
    source->setFor("a", 1, 1ms);
    EXPECT_TRUE(told.wait());
}

TEST_F(Expiry, TellsWatchersTheValueBelow) {
    const auto source = open();
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    store->set("a", 1, "default");
    source->setFor("a", 2, 10min);
    std::vector<std::string> values;
    Latch told(2);
    const auto handle = reactive_streams::subscribe<ConfigurationValue>(
        *store->watchOption("a"), {[&](const ConfigurationValue& value) {
            values.push_back(textOf(value));
            told.countDown();
        }});
    clock.advance(10min);
    EXPECT_TRUE(told.wait());
    EXPECT_THAT(values, ElementsAre("int 2", "int 1"));
}

TEST_F(Expiry, StandsInTheJournal) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    pass(10min, *source);
    EXPECT_THAT(historyOf(*source, "a"),
                ElementsAre("3 alice expired a: int 1 -> none", "1 alice set a: none -> int 1"));
}

TEST_F(Expiry, ComesAfterARestartAsWell) {
    open()->setFor("a", 1, 10min);
    const auto source = open();
    EXPECT_TRUE(source->has("a"));
    pass(10min, *source);
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, ThatWasDueMeanwhileComesWithTheRestart) {
    open()->setFor("a", 1, 10min);
    clock.advance(11min);
    const auto source = open();
    EXPECT_FALSE(source->has("a"));
    EXPECT_TRUE(source->committed().get());
    EXPECT_EQ(historyOf(*source).front(), "2 alice expired a: int 1 -> none");
}

TEST_F(Expiry, IsCancelledByAPlainWrite) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->set("a", 2);
    pass(1h, *source);
    EXPECT_EQ(textOf(source->get("a")), "int 2");
}

TEST_F(Expiry, IsCancelledForGood) {
    {
        const auto source = open();
        source->setFor("a", 1, 10min);
        source->set("a", 2);
    }
    clock.advance(1h);
    EXPECT_TRUE(open()->has("a"));
}

TEST_F(Expiry, IsCancelledByAnUndo) {
    const auto source = open();
    source->set("a", 1);
    source->setFor("a", 2, 10min);
    source->undo();
    pass(1h, *source);
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST_F(Expiry, IsCancelledWithTheValue) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->unset("a");
    pass(1h, *source);
    EXPECT_EQ(historyOf(*source, "a").size(), 2U);
}

TEST_F(Expiry, IsPostponedByALongerTime) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->setFor("a", 2, 1h);
    pass(30min, *source);
    EXPECT_TRUE(source->has("a"));
    pass(30min, *source);
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, OfSeveralKeysComesForEachAtItsTime) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->setFor("b", 1, 20min);
    source->setFor("c", 1, 10min);
    pass(10min, *source);
    EXPECT_THAT(source->keys(), ElementsAre("b", "tick"));
    pass(10min, *source);
    EXPECT_THAT(source->keys(), ElementsAre("tick"));
}

TEST_F(Expiry, FollowsAClockThatIsPutBack) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    clock.advance(-1h);
    pass(1h, *source);
    EXPECT_TRUE(source->has("a"));
    pass(10min, *source);
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, MayBeAsLateAsThereIsTime) {
    const auto source = open();
    source->setFor("a", 1, std::chrono::milliseconds::max());
    pass(24h * 365 * 100, *source);
    EXPECT_TRUE(source->has("a"));
}

TEST_F(Expiry, InNoTimeIsRefused) {
    const auto source = open();
    for (const auto lifetime : {0ms, -1ms}) {
        EXPECT_EQ(thrownText<std::invalid_argument>([&] { source->setFor("a", 1, lifetime); }),
                  "A lifetime must be positive.");
    }
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, OfARefusedWriteIsForgotten) {
    const auto source = open();
    source->set("a", 1);
    source->committed().get();
    disk.answerWrites(SQLITE_FULL);
    source->setFor("a", 2, 10min);
    EXPECT_THROW(source->committed().get(), std::runtime_error);
    disk.answerWrites(SQLITE_OK);
    pass(1h, *source);
    EXPECT_EQ(textOf(source->get("a")), "int 1");
}

TEST_F(Expiry, IsKeptWhenAWriteThatCancelsItIsRefused) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->committed().get();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 2);
    EXPECT_THROW(source->committed().get(), std::runtime_error);
    disk.answerWrites(SQLITE_OK);
    pass(0min, *source);
    pass(10min, *source);
    EXPECT_FALSE(source->has("a"));
}

TEST_F(Expiry, ThatIsRefusedIsTriedAgainWhenTheDiskWritesAgain) {
    const auto source = open();
    source->setFor("a", 1, 10min);
    source->committed().get();
    Latch undone(2);
    source->setChangeListener([&](const std::string&) { undone.countDown(); });
    disk.answerWrites(SQLITE_FULL);
    clock.advance(10min);
    ASSERT_TRUE(undone.wait());
    EXPECT_EQ(textOf(source->get("a")), "int 1");
    disk.answerWrites(SQLITE_OK);
    pass(0ms, *source);
    pass(0ms, *source);
    EXPECT_FALSE(source->has("a"));
}

}  // namespace
}  // namespace velkor::testing
