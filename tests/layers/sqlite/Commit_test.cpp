// How writes get onto the disk, and what happens when they don't.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <pthread.h>
#include <signal.h>

#include "configuration/ConfigurationImpl.hpp"
#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/layers/sqlite/TestDisk.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/HookedSource.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationImpl;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

class Commit : public ::testing::Test {
protected:
    std::shared_ptr<SqliteSource> open() {
        SqliteOptions options = by("alice");
        options.vfs = TestDisk::name();
        return SqliteSource::open(folder.file(), options);
    }

    /// Stops the thread that commits at its next sync, and waits until it is there.
    void stopAtSyncOf(SqliteSource& written) {
        disk.beforeSync([this] {
            stopped.countDown();
            EXPECT_TRUE(released.wait());
            return stoppedSync.load();
        });
        written.set("first", 1);
        ASSERT_TRUE(stopped.wait());
    }

    void letGo() { released.countDown(); }

    void letGoWith(int answer) {
        stoppedSync = answer;
        letGo();
    }

    static std::string refusalOf(Future<bool> committed) {
        return thrownText<std::runtime_error>([&] { committed.get(); });
    }

    std::string textOfRefusal(const std::string& cause) const {
        return "State file could not be written: " + folder.file().string() + ": " + cause;
    }

    const StateFolder folder;
    TestDisk disk;
    Latch stopped;
    Latch released;
    std::atomic<int> stoppedSync{SQLITE_OK};
};

TEST_F(Commit, KeepsNoWriterAndNoReaderWaiting) {
    const auto source = open();
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    stopAtSyncOf(*source);
    EXPECT_TRUE(completes([store] {
        store->set("second", 2);
        EXPECT_EQ(textOf(store->get("second").get()), "int 2");
    }));
    letGo();
    store->removeSource("state");  // which the other thread may hold for a moment longer
}

TEST_F(Commit, MakesOneTransactionOfAllThatWaits) {
    const auto source = open();
    stopAtSyncOf(*source);
    const int syncs = disk.logSyncs();
    for (int i = 0; i < 100; ++i) source->set(std::to_string(i), i);
    letGo();
    EXPECT_TRUE(source->committed().get());
    EXPECT_EQ(disk.logSyncs() - syncs, 1);
}

TEST_F(Commit, IsAnsweredWhenTheDiskHasIt) {
    const auto source = open();
    stopAtSyncOf(*source);
    bool answered = false;
    auto done = source->committed().then([&](Future<bool>&& committed) {
        answered = true;
        return committed.get();
    });
    EXPECT_FALSE(answered);
    letGo();
    EXPECT_TRUE(done.get());
}

TEST_F(Commit, AnswersOneByOneInOrder) {
    const auto source = open();
    std::vector<int> answered;
    const auto note = [&](int number) {
        return [&answered, number](Future<bool>&&) {
            answered.push_back(number);
            return true;
        };
    };
    stopAtSyncOf(*source);
    auto first = source->committed().then(note(1));
    source->set("second", 2);
    auto second = source->committed().then(note(2));
    letGo();
    EXPECT_TRUE(second.get());
    EXPECT_THAT(answered, ElementsAre(1, 2));
}

TEST_F(Commit, TakesWhatAStoreChangesTogetherTogether) {
    Latch synced;
    const auto source = open();
    const auto between = std::make_shared<HookedSource>();
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    store->addSource("between", "between", -2, false, between);
    disk.beforeSync([&] {
        synced.countDown();
        return SQLITE_OK;
    });
    between->whenSet = [&] { EXPECT_FALSE(synced.waitFor(std::chrono::milliseconds(50))); };
    store->apply({{"a", 1}, {"between.x", 1}, {"b", 2}});
    EXPECT_TRUE(source->committed().get());
}

TEST_F(Commit, IsMadeOnAThreadThatTakesNoSignals) {
    sigset_t blocked;
    sigemptyset(&blocked);
    disk.beforeSync([&] {
        pthread_sigmask(SIG_BLOCK, nullptr, &blocked);
        return SQLITE_OK;
    });
    const auto source = open();
    source->set("a", 1);
    source->committed().get();
    for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGWINCH}) {
        EXPECT_EQ(sigismember(&blocked, signal), 1) << signal;
    }
}

TEST_F(Commit, ThatIsRefusedSaysWhy) {
    const auto source = open();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    EXPECT_EQ(refusalOf(source->committed()), textOfRefusal("database or disk is full"));
}

TEST_F(Commit, ThatIsRefusedLeavesTheOldValuesInMemoryAndOnTheDisk) {
    const auto source = open();
    source->set("changed", 1);
    source->set("removed", 1);
    source->committed().get();
    disk.answerWrites(SQLITE_FULL);
    source->set("changed", 2);
    source->set("changed", 3);
    source->unset("removed");
    source->set("new", 2);
    EXPECT_NE(refusalOf(source->committed()), "");
    EXPECT_THAT(source->keys(), ElementsAre("changed", "removed"));
    EXPECT_EQ(textOf(source->get("changed")), "int 1");
    EXPECT_EQ(OtherProgram(folder.file()).run("SELECT key, value FROM entries"),
              "changed int:1 removed int:1 ");
    EXPECT_EQ(historyOf(*source).size(), 2U);
}

TEST_F(Commit, ThatIsRefusedIsToldToWatchers) {
    const auto source = open();
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    store->set("a", 1);
    source->committed().get();
    std::vector<std::string> told;
    Latch toldThree(2);
    source->setChangeListener([&](const std::string& key) {
        told.push_back(key + " " + textOf(source->get(key)));
        toldThree.countDown();
    });
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 2);
    ASSERT_TRUE(toldThree.wait());
    EXPECT_THAT(told, ElementsAre("a int 2", "a int 1"));
}

TEST_F(Commit, ThatIsRefusedStandsInTheLog) {
    const LogCapture log("velkor::layers::sqlite");
    const auto source = open();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    EXPECT_NE(refusalOf(source->committed()), "");
    EXPECT_THAT(log.messages(), ElementsAre(textOfRefusal("database or disk is full")));
}

TEST_F(Commit, ThatIsRefusedMakesTheSourceUnwell) {
    const auto source = open();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 2);
    EXPECT_NE(refusalOf(source->committed()), "");

    const auto state = source->state();

    EXPECT_FALSE(state.isWell);
    EXPECT_TRUE(state.since);
    EXPECT_EQ(state.lastError, textOfRefusal("database or disk is full"));
}

TEST_F(Commit, ThatIsTakenMakesTheSourceWellAgain) {
    const auto source = open();
    EXPECT_TRUE(source->state().isWell);
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 2);
    EXPECT_NE(refusalOf(source->committed()), "");
    disk.answerWrites(SQLITE_OK);
    source->set("a", 3);
    source->committed().get();

    const auto state = source->state();

    EXPECT_TRUE(state.isWell);
    EXPECT_EQ(state.lastError, textOfRefusal("database or disk is full"));
}

TEST_F(Commit, IsTriedAgainForLaterWrites) {
    const auto source = open();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    EXPECT_NE(refusalOf(source->committed()), "");
    disk.answerWrites(SQLITE_OK);
    source->set("a", 2);
    EXPECT_TRUE(source->committed().get());
    EXPECT_THAT(historyOf(*source), ElementsAre("2 alice set a: none -> int 2"));
}

TEST_F(Commit, ThatIsRefusedTakesWhatCameBehindItAlong) {
    const auto source = open();
    stopAtSyncOf(*source);
    source->set("first", 2);
    source->set("second", 2);
    letGoWith(SQLITE_IOERR_FSYNC);
    EXPECT_EQ(refusalOf(source->committed()), textOfRefusal("disk I/O error"));
    EXPECT_THAT(source->keys(), ElementsAre());
}

TEST_F(Commit, ThatIsRefusedIsToldOnceToAThreadThatAsksLater) {
    const auto source = open();
    Latch undone(2);
    source->setChangeListener([&](const std::string&) { undone.countDown(); });
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    ASSERT_TRUE(undone.wait());
    disk.answerWrites(SQLITE_OK);
    EXPECT_EQ(refusalOf(source->committed()), textOfRefusal("database or disk is full"));
    EXPECT_TRUE(source->committed().get());
}

TEST_F(Commit, ThatIsRefusedIsNotToldToAThreadThatWroteNothing) {
    const auto source = open();
    Latch undone(2);
    source->setChangeListener([&](const std::string&) { undone.countDown(); });
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    ASSERT_TRUE(undone.wait());
    std::thread([&] { EXPECT_TRUE(source->committed().get()); }).join();
}

TEST_F(Commit, ThatIsRefusedIsToldAThreadForWhatItWroteAfterItAsked) {
    const auto source = open();
    stopAtSyncOf(*source);
    auto first = source->committed();
    source->set("second", 2);
    letGoWith(SQLITE_IOERR_FSYNC);
    EXPECT_NE(refusalOf(std::move(first)), "");
    EXPECT_EQ(refusalOf(source->committed()), textOfRefusal("disk I/O error"));
    EXPECT_TRUE(source->committed().get());
}

TEST_F(Commit, RefusesMoreThanAHundredThousandWaitingWrites) {
    const auto source = open();
    stopAtSyncOf(*source);
    for (int i = 1; i < 100'000; ++i) source->set("a", i);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source->set("b", 1); }),
              textOfRefusal("too many writes wait for the disk"));
    EXPECT_FALSE(source->has("b"));
    letGo();
    EXPECT_TRUE(source->committed().get());
    source->set("b", 1);
    EXPECT_TRUE(source->committed().get());
}

// A text that takes as much memory, and is short on the disk.
std::string roomy(std::size_t mebibytes) {
    std::string text = "x";
    text.reserve(mebibytes << 20U);
    return text;
}

TEST_F(Commit, RefusesMoreThan256MebibytesOfWaitingWrites) {
    const auto source = open();
    stopAtSyncOf(*source);
    source->set("a", roomy(100));
    source->set("b", roomy(100));
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source->set("c", roomy(100)); }),
              textOfRefusal("too many writes wait for the disk"));
    letGo();
    EXPECT_TRUE(source->committed().get());
    source->set("c", roomy(100));
    EXPECT_TRUE(source->committed().get());
}

TEST_F(Commit, TakesAValueOfAnySizeWhenNothingWaits) {
    const auto source = open();
    source->set("a", roomy(300));
    EXPECT_TRUE(source->committed().get());
}

TEST_F(Commit, IsWaitedForWhenTheLastReferenceIsGivenUp) {
    auto source = open();
    stopAtSyncOf(*source);
    source->set("second", 2);
    auto committed = source->committed();
    std::thread other([this] { letGo(); });
    source.reset();
    EXPECT_EQ(open()->keys().size(), 2U);
    EXPECT_TRUE(committed.get());
    other.join();
}

TEST_F(Commit, ThatIsRefusedWhenTheSourceHasGoneIsTold) {
    auto source = open();
    disk.answerWrites(SQLITE_FULL);
    source->set("a", 1);
    auto committed = source->committed();
    source.reset();
    EXPECT_EQ(refusalOf(std::move(committed)), textOfRefusal("database or disk is full"));
}

}  // namespace
}  // namespace velkor::testing
