#include <gmock/gmock.h>

#include <atomic>
#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/layers/TickingSource.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using velkor::testing::Latch;

constexpr int rounds = 2000;

std::shared_ptr<TickingSource> sourceOf(const std::string& text) {
    return std::make_shared<TickingSource>(ValueMap{{"a", text}, {"b", text}});
}

TEST(LiveSourceThreads, TheListenerIsCalledWithoutTheSourcesOwnMutex) {
    const auto source = sourceOf("1");
    bool answered = false;
    source->setChangeListener([&](const std::string& key) {
        answered = velkor::testing::completes([source, key] { source->get(key); });
    });

    source->tick({{"a", "2"}});

    EXPECT_TRUE(answered);
}

TEST(LiveSourceThreads, DetachingWaitsForTheCallOfAnotherThread) {
    const auto source = sourceOf("1");
    Latch inside;
    Latch released;
    std::atomic<bool> callEnded{false};
    source->setChangeListener([&](const std::string&) {
        inside.countDown();
        EXPECT_TRUE(released.wait());
        callEnded = true;
    });
    std::thread ticking([&] { source->tick({{"a", "2"}}); });
    EXPECT_TRUE(inside.wait());
    std::thread releasing([&] { released.countDown(); });

    source->setChangeListener({});

    EXPECT_TRUE(callEnded);
    ticking.join();
    releasing.join();
}

TEST(LiveSourceThreads, DetachingInsideTheListenerDoesNotWaitForItself) {
    const auto source = sourceOf("1");
    source->setChangeListener([&](const std::string&) { source->setChangeListener({}); });

    EXPECT_TRUE(velkor::testing::completes([source] { source->tick({{"a", "2"}}); }));
}

TEST(LiveSourceThreads, TwoThreadsThatDetachInsideTheListenerDoNotWaitForEachOther) {
    const auto source = sourceOf("1");
    const auto both = std::make_shared<Latch>(2);
    source->setChangeListener([weak = std::weak_ptr(source), both](const std::string&) {
        EXPECT_TRUE(both->arriveAndWait());
        weak.lock()->setChangeListener({});
    });

    EXPECT_TRUE(velkor::testing::completes([source] {
        std::thread other([&] { source->tick({{"a", "2"}}); });
        source->tick({{"b", "2"}});
        other.join();
    }));
}

TEST(LiveSourceThreads, AReadOfSeveralKeysIsNeverHalfOfAChange) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto source = sourceOf("0");
    ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
    std::thread ticking([&] {
        for (int i = 1; i <= rounds; ++i) {
            const auto text = std::to_string(i);
            source->tick({{"a", text}, {"b", text}});
        }
    });

    int mixed = 0;
    for (int i = 0; i < rounds; ++i) {
        const auto reading = store->read({"a", "b"}).get();
        if (textOf(reading.options[0]->value) != textOf(reading.options[1]->value)) ++mixed;
    }

    ticking.join();
    EXPECT_EQ(mixed, 0);
}

TEST(LiveSourceThreads, AKeyThatComesAndGoesIsReadOrReportedMissing) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto source = sourceOf("0");
    ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
    std::thread ticking([&] {
        for (int i = 0; i < rounds; ++i) {
            source->tick({{"a", std::nullopt}});
            source->tick({{"a", "0"}});
        }
    });

    int other = 0;
    for (int i = 0; i < rounds; ++i) {
        try {
            if (textOf(store->get("a").get()) != "0") ++other;
        } catch (const std::runtime_error&) {  // "No such option: a"
            continue;
        } catch (const std::logic_error&) {
            ++other;
        }
    }

    ticking.join();
    EXPECT_EQ(other, 0);
}

TEST(LiveSourceThreads, AWatcherSeesAllValuesInTheirOrder) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto source = sourceOf("0");
    ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
    std::vector<std::string> seen;
    const auto watching = reactive_streams::subscribe(
        *store->watchOption("a"),
        {[&](ConfigurationValue value) { seen.push_back(textOf(value)); }, {}, {}});

    std::thread ticking([&] {
        for (int i = 1; i <= rounds; ++i) source->tick({{"a", std::to_string(i)}});
    });
    ticking.join();

    ASSERT_EQ(seen.size(), static_cast<std::size_t>(rounds) + 1);
    for (std::size_t i = 0; i < seen.size(); ++i) EXPECT_EQ(seen[i], std::to_string(i));
}

TEST(LiveSourceThreads, ChangesBesideRegistrationEndOnTheTruthForWatchers) {
    const auto store = std::make_shared<ConfigurationImpl>();
    store->set("a", std::string("default"), "default").get();
    std::string newest;
    const auto watching = reactive_streams::subscribe(
        *store->watchOption("a"),
        {[&](ConfigurationValue value) { newest = textOf(value); }, {}, {}});
    int stale = 0;
    for (int i = 0; i < rounds / 4; ++i) {
        const auto source = sourceOf("0");
        Latch start(2);
        std::thread ticking([&] {
            EXPECT_TRUE(start.arriveAndWait());
            source->tick({{"a", "1"}});
            source->tick({{"a", "2"}});
        });
        EXPECT_TRUE(start.arriveAndWait());
        ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
        ticking.join();
        if (newest != "2") ++stale;
        store->removeSource("live").get();
    }
    EXPECT_EQ(stale, 0);
}

TEST(LiveSourceThreads, MayMoveBetweenStoresWhileItChanges) {
    const auto first = std::make_shared<ConfigurationImpl>();
    const auto second = std::make_shared<ConfigurationImpl>();
    const auto source = sourceOf("0");
    std::atomic<bool> stop{false};
    std::thread ticking([&] {
        while (!stop) source->tick({{"a", "1"}, {"b", "1"}});
    });

    for (int i = 0; i < rounds / 4; ++i) {
        const auto& store = i % 2 == 0 ? first : second;
        ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
        EXPECT_TRUE(store->has("a").get());
        EXPECT_TRUE(store->removeSource("live").get());
    }

    stop = true;
    ticking.join();
}

TEST(LiveSourceThreads, ChangesBesideTheEndOfTheStore) {
    for (int i = 0; i < rounds / 4; ++i) {
        auto store = std::make_shared<ConfigurationImpl>();
        const auto source = sourceOf("0");
        ASSERT_TRUE(store->addSource("live", "", 5, true, source).get());
        Latch start(2);
        std::thread ticking([&] {
            EXPECT_TRUE(start.arriveAndWait());
            source->tick({{"a", "1"}});
            source->tick({{"a", "2"}});
        });
        EXPECT_TRUE(start.arriveAndWait());
        store.reset();
        ticking.join();
        EXPECT_EQ(textOf(source->get("a")), "2");
    }
}

}  // namespace
}  // namespace velkor::layers
