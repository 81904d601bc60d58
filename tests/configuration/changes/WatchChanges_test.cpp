#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/configuration/changes/ChangeTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/StandardErrorCapture.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::HookedSource;
using ::testing::IsEmpty;
using ::testing::UnorderedElementsAre;

class WatchChanges : public ChangeTest {};

TEST_F(WatchChanges, BeginsWithTheNextChange) {
    set("a", 1);
    const ChangeWatch followed = follow("");
    EXPECT_THAT(followed.texts(), IsEmpty());
    set("a", 2);
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 2@override"));
}

TEST_F(WatchChanges, TellsTheKeysThatThePrefixBegins) {
    const ChangeWatch followed = follow("net.");
    set("net.port", 1);
    set("network", 2);
    set("net", 3);
    EXPECT_THAT(followed.texts(), ElementsAre("net.port=int 1@override"));
}

TEST_F(WatchChanges, TellsEachStreamItsOwnKeys) {
    const ChangeWatch first = follow("net.");
    const ChangeWatch second = follow("disk.");
    set("net.a", 1);
    set("disk.b", 2);
    EXPECT_THAT(first.texts(), ElementsAre("net.a=int 1@override"));
    EXPECT_THAT(second.texts(), ElementsAre("disk.b=int 2@override"));
}

TEST_F(WatchChanges, TellsWhatIsEffectiveNotWhatWasWritten) {
    set("a", 1);
    const ChangeWatch followed = follow("");
    store->set("a", 2, "default").get();
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@override"));
}

TEST_F(WatchChanges, TellsThatAKeyHasGone) {
    set("a", 1);
    const ChangeWatch followed = follow("");
    store->unset("a");
    EXPECT_THAT(followed.texts(), ElementsAre("a gone"));
}

TEST_F(WatchChanges, TellsWhatIsBelowAKeyThatWasUnset) {
    store->set("a", 2, "default").get();
    set("a", 1);
    const ChangeWatch followed = follow("");
    store->unset("a");
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 2@default"));
}

TEST_F(WatchChanges, TellsTheKeysOfAnAddedSourceWithItsGroup) {
    const ChangeWatch followed = follow("");
    add("net", "net", 5, {{"port", 1}, {"host", 2}});
    EXPECT_THAT(followed.texts(), ElementsAre("net.host=int 2@net", "net.port=int 1@net"));
}

TEST_F(WatchChanges, TellsTheKeysOfARemovedSourceWithItsGroup) {
    add("net", "net", 5, {{"port", 1}, {"host", 2}});
    store->set("net.host", 3, "default").get();
    const ChangeWatch followed = follow("");
    store->removeSource("net");
    EXPECT_THAT(followed.texts(), ElementsAre("net.host=int 3@default", "net.port gone"));
}

TEST_F(WatchChanges, TellsAChangeThatASourceReports) {
    const auto source = addHooked("hooked", "net", 5, {{"port", 1}});
    const ChangeWatch followed = follow("net.");
    source->listener("port");
    source->values.clear();
    source->listener("port");
    EXPECT_THAT(followed.texts(), ElementsAre("net.port=int 1@hooked", "net.port gone"));
}

TEST_F(WatchChanges, HoldsTheNewestChangeOfEachKey) {
    const ChangeWatch followed = follow("", 0);
    set("a", 1);
    set("b", 2);
    set("a", 3);
    store->unset("b");
    EXPECT_THAT(followed.texts(), IsEmpty());
    followed.subscriber->request(1);
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 3@override"));
    followed.subscriber->request(5);
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 3@override", "b gone"));
}

TEST_F(WatchChanges, KeyChangedAgainAfterItsDeliveryIsDeliveredAgain) {
    const ChangeWatch followed = follow("", 1);
    set("a", 1);
    set("a", 2);
    followed.subscriber->request(1);
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@override", "a=int 2@override"));
}

TEST_F(WatchChanges, VersionsOfAKeyGrow) {
    const ChangeWatch followed = follow("");
    for (int i = 0; i < 10; ++i) set("a", i);
    for (std::size_t i = 1; i < followed.subscriber->values.size(); ++i) {
        EXPECT_GT(followed.subscriber->values[i].version,
                  followed.subscriber->values[i - 1].version);
    }
    EXPECT_EQ(followed.subscriber->values.back().version, version());
}

TEST_F(WatchChanges, WriteFromInsideADeliveryIsDeliveredAfterIt) {
    const ChangeWatch followed = follow("");
    int depth = 0;
    int deepest = 0;
    followed.subscriber->whenNext = [&](const OptionChange& change) {
        deepest = std::max(deepest, ++depth);
        if (change.key == "a") set("b", 2);
        --depth;
    };
    set("a", 1);
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@override", "b=int 2@override"));
    EXPECT_EQ(deepest, 1);
}

TEST_F(WatchChanges, CancelledStreamIsForgotten) {
    const ChangeWatch followed = follow("");
    const std::weak_ptr<void> stream = followed.publisher;
    followed.subscriber->cancel();
    set("a", 1);
    EXPECT_THAT(followed.texts(), IsEmpty());
    EXPECT_FALSE(followed.publisher->getCompletionFuture().get());
    EXPECT_EQ(stream.use_count(), 1);
}

TEST_F(WatchChanges, EndsWithTheStore) {
    const ChangeWatch followed{open->watchChanges("")};
    followed.publisher->subscribe(followed.subscriber);
    std::weak_ptr<void> stream = followed.publisher;
    const_cast<ChangeWatch&>(followed).publisher.reset();
    store.reset();
    open.reset();
    EXPECT_TRUE(stream.expired());
    EXPECT_EQ(followed.subscriber->completions, 1);
}

TEST_F(WatchChanges, ThrowingSubscriberIsReportedAndTheOthersAreServed) {
    const ChangeWatch throwing = follow("net.");
    const ChangeWatch other = follow("");
    const Watch watched = watch("net.a");
    throwing.subscriber->whenNext = [](const auto&) { throw std::logic_error("subscriber"); };
    const testing::StandardErrorCapture errors;
    set("net.a", 1);
    EXPECT_EQ(errors.text(), "Error in configuration change subscriber: net.\n");
    EXPECT_THAT(other.texts(), ElementsAre("net.a=int 1@override"));
    EXPECT_THAT(watched.values(), ElementsAre("int 1"));
}

TEST_F(WatchChanges, StreamFailsWhenAChangeCannotBeRead) {
    const auto source = addHooked("hooked", "", -1, {{"a", 1}});
    const ChangeWatch followed = follow("");
    source->whenGet = [] { throw std::logic_error("get"); };
    EXPECT_THROW(source->listener("a"), std::logic_error);
    ASSERT_EQ(followed.subscriber->errors.size(), 1U);
    EXPECT_THROW(std::rethrow_exception(followed.subscriber->errors[0]), std::logic_error);
}

TEST_F(WatchChanges, StreamFailsOnceWithTheFirstOfSeveralErrors) {
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"a", 1}, {"b", 2}});
    source->whenGet = [count = 0]() mutable {
        throw std::logic_error("get " + std::to_string(++count));
    };
    const ChangeWatch followed = follow("");
    EXPECT_THROW(store->addSource("new", "", -1, false, source), std::logic_error);
    ASSERT_EQ(followed.subscriber->errors.size(), 1U);
    EXPECT_EQ(testing::thrownText<std::logic_error>(
                  [&] { std::rethrow_exception(followed.subscriber->errors[0]); }),
              "get 1");
}

TEST_F(WatchChanges, StreamOpenedFromInsideASourceIsSafe) {
    const auto source = addHooked("hooked", "", -1, {{"a", 1}});
    const ChangeWatch followed = follow("");
    std::vector<ChangeWatch> opened;
    source->whenHas = [&] {
        if (opened.size() < 50) opened.push_back(follow(""));
    };
    source->listener("a");
    EXPECT_THAT(followed.texts(), ElementsAre("a=int 1@hooked"));
}

TEST_F(WatchChanges, StoreOnTheStackThrows) {
    ConfigurationImpl local;
    EXPECT_THROW(local.watchChanges(""), std::bad_weak_ptr);
}

TEST_F(WatchChanges, SlowReaderEndsOnTheTruthForEveryKey) {
    constexpr int writers = 2;
    constexpr int rounds = 3000;
    const std::vector<std::string> keys{"a", "b", "net.c"};
    std::map<std::string, OptionChange> last;
    std::map<std::string, std::uint64_t> versions;
    bool wentBack = false;
    const ChangeWatch followed{open->watchChanges("")};
    followed.subscriber->whenNext = [&](const OptionChange& change) {
        wentBack = wentBack || change.version < versions[change.key];
        versions[change.key] = change.version;
        last.insert_or_assign(change.key, change);
    };
    followed.publisher->subscribe(followed.subscriber);
    std::atomic<int> running{writers};
    std::vector<std::thread> threads;
    for (int writer = 0; writer < writers; ++writer) {
        threads.emplace_back([&, writer] {
            for (int i = 0; i < rounds; ++i) {
                const std::string& key = keys[static_cast<std::size_t>(i + writer) % 3];
                if (i % 7 == 0) {
                    open->unset(key);
                } else if (i % 101 == 0) {
                    open->addInMemorySource("s" + std::to_string(writer), "net", -1, false,
                                            {{"c", i}});
                } else if (i % 103 == 0) {
                    open->removeSource("s" + std::to_string(writer));
                } else {
                    open->set(key, i);
                }
            }
            --running;
        });
    }
    while (running > 0) followed.subscriber->request(1);
    for (auto& thread : threads) thread.join();
    followed.subscriber->request(testing::allValues);
    EXPECT_FALSE(wentBack);
    for (const auto& key : keys) {
        const auto truth = open->read({key}).get().options.front();
        ASSERT_EQ(last.count(key), 1U);
        const auto& told = last.at(key).option;
        ASSERT_EQ(told.has_value(), truth.has_value()) << key;
        if (truth) {
            EXPECT_EQ(testing::textOf(told->value), testing::textOf(truth->value));
            EXPECT_EQ(told->source, truth->source);
        }
    }
}

}  // namespace
}  // namespace velkor::configuration
