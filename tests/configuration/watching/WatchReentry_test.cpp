#include <gmock/gmock.h>

#include <optional>
#include <string>
#include <vector>

#include "tests/configuration/watching/WatchTesting.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

/// Subscribers that call the store from inside `onNext`.
using WatchReentry = WatchTest;

TEST_F(WatchReentry, SubscriberReadsTheValueThatItIsToldOf) {
    const Watch started = watch("key");
    std::string read;
    started.subscriber->whenNext = [&](const auto&) { read = valueOf("key"); };
    set("key", 1);
    EXPECT_EQ(read, "int 1");
}

TEST_F(WatchReentry, SubscriberMayCallEveryReadingOperation) {
    const Watch started = watch("key");
    std::vector<std::string> answers;
    started.subscriber->whenNext = [&](const auto&) {
        answers = {store->has("key").get() ? "has" : "lacks", sourceOf("key"),
                   *store->keys().get().begin(),
                   std::to_string(store->describeSources().get().size()),
                   std::to_string(store->explain("key").get().size())};
    };
    set("key", 1);
    EXPECT_THAT(answers, ElementsAre("has", "override", "key", "2", "1"));
}

TEST_F(WatchReentry, SubscriberMayWriteAnotherKey) {
    const Watch started = watch("key");
    const Watch other = watch("other");
    started.subscriber->whenNext = [&](const auto&) { set("other", 2); };
    set("key", 1);
    EXPECT_THAT(other.values(), ElementsAre("int 2"));
}

TEST_F(WatchReentry, WriteOfTheSameKeyIsDeliveredNested) {
    const Watch started = watch("key");
    std::vector<std::string> steps;
    started.subscriber->whenNext = [&](const auto& value) {
        steps.push_back("begin " + velkor::testing::textOf(value));
        if (value == ConfigurationValue(1)) set("key", 2);
        steps.push_back("end " + velkor::testing::textOf(value));
    };
    set("key", 1);
    EXPECT_THAT(steps, ElementsAre("begin int 1", "begin int 2", "end int 2", "end int 1"));
}

TEST_F(WatchReentry, WatcherAfterOneThatWroteMeetsTheOlderValueLast) {
    const Watch first = watch("key");
    const Watch second = watch("key");
    first.subscriber->whenNext = [&](const auto& value) {
        if (value == ConfigurationValue(1)) set("key", 2);
    };
    set("key", 1);
    EXPECT_THAT(second.values(), ElementsAre("int 2", "int 1"));
    EXPECT_EQ(valueOf("key"), "int 2");
}

TEST_F(WatchReentry, SubscriberMayAddASource) {
    const Watch started = watch("key");
    started.subscriber->whenNext = [&](const auto& value) {
        if (value == ConfigurationValue(1)) add("high", "", -1, {{"key", 2}});
    };
    set("key", 1);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2"));
}

TEST_F(WatchReentry, SubscriberMayRemoveTheSourceThatToldIt) {
    add("high", "", -1, {});
    set("key", 1);
    store->set("key", 5, "default").get();
    const Watch started = watch("key");
    started.subscriber->whenNext = [&](const auto& value) {
        if (value == ConfigurationValue(2)) store->removeSource("high").get();
    };
    set("key", 2);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2", "int 5"));
}

TEST_F(WatchReentry, SubscriberOfAnAddedSourceMayRemoveIt) {
    const Watch started = watch("a");
    const Watch later = watch("b");
    started.subscriber->whenNext = [&](const auto&) {
        EXPECT_TRUE(store->removeSource("source").get());
    };
    add("source", "", 5, {{"a", 1}, {"b", 2}});
    EXPECT_THAT(started.values(), ElementsAre("int 1"));
    EXPECT_THAT(later.values(), IsEmpty());
}

TEST_F(WatchReentry, WatchBegunDuringADeliveryGetsTheValueOnce) {
    const Watch started = watch("key");
    std::optional<Watch> nested;
    started.subscriber->whenNext = [&](const auto&) {
        if (!nested) nested = watch("key");
    };
    set("key", 1);
    ASSERT_TRUE(nested.has_value());
    EXPECT_THAT(nested->values(), ElementsAre("int 1"));
}

TEST_F(WatchReentry, SubscriberMayAskForMoreInsideOnNext) {
    const Watch started = watch("key", 1);
    started.subscriber->whenNext = [&](const auto&) { started.subscriber->request(1); };
    for (int value = 1; value <= 3; ++value) set("key", value);
    EXPECT_THAT(started.values(), ElementsAre("int 1", "int 2", "int 3"));
}

TEST_F(WatchReentry, ContinuationOfTheCompletionMayCallTheStore) {
    const Watch started = watch("key");
    std::string read;
    auto observed = started.publisher->getCompletionFuture().then([&](Future<bool>&& completed) {
        set("other", 1);
        read = valueOf("other");
        return completed.get();
    });
    started.subscriber->cancel();
    EXPECT_EQ(read, "int 1");
}

}  // namespace
}  // namespace velkor::configuration
