// Sources and stores end in any order, on any thread.

#include <gtest/gtest.h>

#include <chrono>
#include <exception>
#include <memory>
#include <string>
#include <thread>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/ProcessEnd.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/layers/sqlite/TestDisk.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using namespace std::chrono_literals;

TEST(Lifetime, OfASourceMayBeLongerThanThatOfItsStore) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    store->set("a", 1);
    store.reset();
    source->set("a", 2);
    EXPECT_TRUE(source->committed().get());
    EXPECT_EQ(textOf(source->get("a")), "int 2");
}

TEST(Lifetime, InAStoreEndsWithItsRemoval) {
    const StateFolder folder;
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, SqliteSource::open(folder.file()));
    store->set("a", 1);
    store->removeSource("state");
    EXPECT_EQ(textOf(SqliteSource::open(folder.file())->get("a")), "int 1");
}

TEST(Lifetime, InAStoreEndsWithTheStore) {
    const StateFolder folder;
    auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, SqliteSource::open(folder.file()));
    store->set("a", 1);
    store.reset();
    EXPECT_EQ(textOf(openAgain(folder.file())->get("a")), "int 1");
}

TEST(Lifetime, OfARemovedSourceTellsTheStoreNothing) {
    const StateFolder folder;
    const auto source = SqliteSource::open(folder.file());
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("state", "", -1, false, source);
    int told = 0;
    const auto handle = reactive_streams::subscribe<ConfigurationValue>(
        *store->watchOption("a"), {[&](const ConfigurationValue&) { ++told; }});
    store->removeSource("state");
    source->set("a", 1);
    EXPECT_EQ(told, 0);
}

/// What a callback on the thread of a source gives up: the last references to it and to its store.
class LastReferences : public ::testing::Test {
protected:
    void open(const SqliteOptions& options) {
        source = SqliteSource::open(folder.file(), options);
        store = std::make_shared<ConfigurationImpl>();
        store->addSource("state", "", -1, false, source);
        weakSource = source;
        weakStore = store;
    }

    /// Gives them up when `key` changes on another thread than this one.
    reactive_streams::SubscriptionHandle giveUpWhenChanged() {
        store->set("a", 1, "default");
        return reactive_streams::subscribe<ConfigurationValue>(
            *store->watchOption("a"), {[this, main = std::this_thread::get_id()](auto&&) {
                if (std::this_thread::get_id() == main) return;
                source.reset();
                store.reset();
                givenUp.countDown();
            }});
    }

    void expectTheirEnd() {
        ASSERT_TRUE(givenUp.wait());
        openAgain(folder.file());
        EXPECT_TRUE(weakSource.expired());
        EXPECT_TRUE(weakStore.expired());
    }

    const StateFolder folder;
    TestDisk disk;
    HandClock clock;
    Latch givenUp;
    std::shared_ptr<SqliteSource> source;
    std::shared_ptr<ConfigurationImpl> store;
    std::weak_ptr<SqliteSource> weakSource;
    std::weak_ptr<ConfigurationImpl> weakStore;
};

TEST_F(LastReferences, MayBeGivenUpWhenAValueExpires) {
    SqliteOptions options;
    options.clock = clock.function();
    open(options);
    source->setFor("a", 2, 10min);
    const auto handle = giveUpWhenChanged();
    clock.advance(10min);
    expectTheirEnd();
}

TEST_F(LastReferences, MayBeGivenUpWhenAWriteIsRefused) {
    SqliteOptions options;
    options.vfs = TestDisk::name();
    open(options);
    const auto handle = giveUpWhenChanged();
    disk.answerWrites(SQLITE_FULL);
    store->set("a", 2);
    expectTheirEnd();
}

TEST_F(LastReferences, MayBeGivenUpWhenAWriteIsCommitted) {
    SqliteOptions options;
    options.vfs = TestDisk::name();
    open(options);
    Latch release;
    disk.beforeSync([&] {
        EXPECT_TRUE(release.wait());
        return SQLITE_OK;
    });
    store->set("a", 2);
    auto done = source->committed().then([this](Future<bool>&& committed) {
        source.reset();
        store.reset();
        givenUp.countDown();
        return committed.get();
    });
    release.countDown();
    EXPECT_TRUE(done.get());
    expectTheirEnd();
}

TEST_F(LastReferences, MayBeGivenUpByTheWriter) {
    SqliteOptions options;
    options.vfs = TestDisk::name();
    open(options);
    store->set("a", 1);
    const auto handle = reactive_streams::subscribe<ConfigurationValue>(
        *store->watchOption("a"), {[this](const ConfigurationValue& value) {
            if (textOf(value) != "int 2") return;
            source.reset();
            store.reset();
            givenUp.countDown();
        }});
    store.get()->set("a", 2);
    expectTheirEnd();
}

[[noreturn]] void endWhileToldOfAnExpiry() {
    static const StateFolder folder;
    endWhileTold(SqliteSource::open(folder.file()),
                 [](SqliteSource& source) { source.setFor("a", 1, 1ms); });
}

TEST(Lifetime, OfTheThreadIsWaitedForByTheEndOfTheProcess) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(endWhileToldOfAnExpiry(), ::testing::ExitedWithCode(0), "waited for");
}

}  // namespace
}  // namespace velkor::testing
