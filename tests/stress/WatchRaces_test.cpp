#include <gtest/gtest.h>

#include <limits>
#include <memory>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/stress/CountingSubscriber.hpp"
#include "tests/stress/Race.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::race;

constexpr auto allValues = std::numeric_limits<std::uint64_t>::max();

/// Two threads on one store.
class WatchRaces : public ::testing::Test {
protected:
    using Counter = velkor::testing::CountingSubscriber<ConfigurationValue>;

    void watch() {
        publisher = store->watchOption("key");
        subscriber = std::make_shared<Counter>(allValues);
        publisher->subscribe(subscriber);
    }

    void set(int value) { store->set("key", value).get(); }

    int lastReceived() { return boost::get<int>(subscriber->last()); }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> publisher;
    std::shared_ptr<Counter> subscriber;
};

TEST_F(WatchRaces, WatchAgainstWrite) {
    int written = 0;
    set(written);
    race([&] { ++written; }, [this] { watch(); }, [&] { set(written); },
         [&] {
             // Two threads deliver the value before and the one written, in either order.
             ASSERT_GE(subscriber->received, 1);
             ASSERT_LE(subscriber->received, 2);
             ASSERT_TRUE(lastReceived() == written || lastReceived() == written - 1);
             subscriber->subscription->cancel();
         });
}

TEST_F(WatchRaces, AWatchBegunBesideAWriteKeepsTheNewerValue) {
    const std::string largeAndSlowToCopy(100'000, 'x');
    race([&] { store->set("key", largeAndSlowToCopy); },
         [&] { publisher = store->watchOption("key"); }, [this] { set(1); },
         [&] {
             subscriber = std::make_shared<Counter>(allValues);
             publisher->subscribe(subscriber);
             ASSERT_EQ(lastReceived(), 1);
             subscriber->subscription->cancel();
         });
}

TEST_F(WatchRaces, CancelAgainstWrite) {
    race([this] { watch(); }, [this] { subscriber->subscription->cancel(); }, [this] { set(1); },
         [this] {
             const int received = subscriber->received;
             set(2);
             ASSERT_EQ(subscriber->received, received);
             ASSERT_EQ(subscriber.use_count(), 1);
         });
}

TEST_F(WatchRaces, WriteAgainstWriteReachesEveryWatcherInTheStoresOrder) {
    watch();
    int expected = 0;
    race([] {}, [this] { set(1); }, [this] { set(2); },
         [&] {
             expected += 2;
             ASSERT_EQ(subscriber->received, expected);
             ASSERT_TRUE(subscriber->last() == store->get("key").get());
         });
}

TEST_F(WatchRaces, StoreDestructionAgainstCancel) {
    race(
        [this] {
            store = std::make_shared<ConfigurationImpl>();
            watch();
            publisher.reset();
        },
        [this] { store.reset(); }, [this] { subscriber->subscription->cancel(); },
        [this] {
            ASSERT_LE(subscriber->completions, 1);
            subscriber.reset();
        });
}

TEST_F(WatchRaces, StoreDestructionAgainstRequest) {
    race(
        [this] {
            store = std::make_shared<ConfigurationImpl>();
            set(1);
            publisher = store->watchOption("key");
            subscriber = std::make_shared<Counter>(0);
            publisher->subscribe(subscriber);
            publisher.reset();
        },
        [this] { store.reset(); }, [this] { subscriber->subscription->request(1); },
        [this] {
            ASSERT_LE(subscriber->received, 1);
            ASSERT_EQ(subscriber->completions, 1);
        });
}

TEST_F(WatchRaces, StoreDestructionAgainstTheLastPublisherReference) {
    race(
        [this] {
            store = std::make_shared<ConfigurationImpl>();
            watch();
        },
        [this] { store.reset(); }, [this] { publisher.reset(); },
        [this] { ASSERT_EQ(subscriber->completions, 1); });
}

TEST_F(WatchRaces, AddedAndRemovedSourceAgainstWrite) {
    watch();
    race([] {},
         [this] {
             store->addInMemorySource("high", "", -1, true, {{"key", 7}}).get();
             store->removeSource("high").get();
         },
         [this] { set(1); },
         [this] { ASSERT_TRUE(store->get("key").get() == ConfigurationValue(1)); });
}

TEST_F(WatchRaces, WatchAgainstWatch) {
    std::shared_ptr<Counter> second;
    race([] {}, [this] { watch(); },
         [&] {
             const auto other = store->watchOption("key");
             second = std::make_shared<Counter>(allValues);
             other->subscribe(second);
         },
         [&] {
             set(1);
             ASSERT_GE(subscriber->received, 1);
             ASSERT_GE(second->received, 1);
             subscriber->subscription->cancel();
             second->subscription->cancel();
         });
}

}  // namespace
}  // namespace velkor::configuration
