// A state file whose source is written, expires, is removed and ends on two threads at once.

#include <gtest/gtest.h>

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/stress/Race.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using namespace std::chrono_literals;

class StateRace : public ::testing::Test {
protected:
    static constexpr int writes = 20;

    void SetUp() override {
        prepare = [this] {
            source = openAgain(folder.file());
            store = std::make_shared<ConfigurationImpl>();
            store->addSource("state", "", -1, false, source);
            handle = reactive_streams::subscribe<ConfigurationValue>(*store->watchOption("a"),
                                                                     {[](auto&&) {}});
        };
        end = [this] {
            handle = {};
            store.reset();
            source.reset();
        };
    }

    /// Ends what is left of a round, and looks whether the newest change is in the file.
    void expectTheNewestValue() {
        end();
        const auto again = openAgain(folder.file());
        for (const auto& entry : again->history("a", 1)) {
            EXPECT_EQ(again->has("a"), entry.after.has_value());
            if (entry.after) {
                EXPECT_EQ(textOf(again->get("a")), textOf(*entry.after));
            }
        }
    }

    void write() const {
        for (int i = 0; i < writes; ++i) store->set("a", i);
    }

    const StateFolder folder;
    std::shared_ptr<SqliteSource> source;
    std::shared_ptr<ConfigurationImpl> store;
    reactive_streams::SubscriptionHandle handle;
    std::function<void()> prepare;
    std::function<void()> end;
    const std::function<void()> check = [this] { expectTheNewestValue(); };
};

TEST_F(StateRace, BetweenWritesAndRemoval) {
    race(
        prepare, [this] { write(); }, [this] { store->removeSource("state"); }, check);
}

TEST_F(StateRace, BetweenWritesAndTheirCommit) {
    race(
        prepare, [this] { write(); },
        [this] {
            for (int i = 0; i < writes; ++i) EXPECT_TRUE(source->committed().get());
        },
        check);
}

TEST_F(StateRace, BetweenExpiryAndRemoval) {
    race(
        prepare,
        [this] {
            for (int i = 0; i < writes; ++i) source->setFor("a", i, 1ms);
            source->committed().get();
        },
        [this] { store->removeSource("state"); }, end);
}

TEST_F(StateRace, BetweenExpiryAndTheEndOfTheStore) {
    race(
        [this] {
            prepare();
            source->setFor("a", 1, 1ms);
            source->committed().get();
        },
        [this] {
            handle = {};
            store.reset();
        },
        [source = std::ref(source)] {
            for (int i = 0; i < writes; ++i) source.get()->setFor("a", i, 1ms);
        },
        end);
}

TEST_F(StateRace, BetweenTwoLastReferences) {
    std::shared_ptr<SqliteSource> other;
    race(
        [&] {
            prepare();
            other = source;
            source->setFor("a", 1, 1ms);
        },
        [this] { end(); }, [&] { other.reset(); }, end);
}

}  // namespace
}  // namespace velkor::testing
