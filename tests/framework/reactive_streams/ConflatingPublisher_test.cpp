#include "framework/reactive_streams/ConflatingPublisher.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "tests/support/BoundedWait.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::reactive_streams {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

struct Entry {
    std::string key;
    int value;
};

struct KeyOfEntry {
    const std::string& operator()(const Entry& entry) const noexcept { return entry.key; }
};

// What every queued stream does is tested with the other streams: here is what it keeps.
class ConflatingPublisherTest : public ::testing::Test {
protected:
    using Stream = ConflatingPublisher<Entry, KeyOfEntry, std::function<void()>>;

    void keep(const std::string& key, int value) const { publisher->keep({{key, value}}); }

    std::vector<std::string> delivered() const {
        std::vector<std::string> texts;
        for (const auto& entry : subscriber->values) {
            texts.push_back(entry.key + std::to_string(entry.value));
        }
        return texts;
    }

    std::shared_ptr<Stream> publisher = std::make_shared<Stream>([this] { ++ends; });
    std::shared_ptr<testing::RecordingSubscriber<Entry>> subscriber =
        std::make_shared<testing::RecordingSubscriber<Entry>>();
    int ends = 0;
};

TEST_F(ConflatingPublisherTest, DeliversTheNewestValueOfEachKey) {
    keep("a", 1);
    keep("b", 2);
    keep("a", 3);
    publisher->subscribe(subscriber);
    subscriber->request(testing::allValues);
    EXPECT_THAT(delivered(), ElementsAre("a3", "b2"));
}

TEST_F(ConflatingPublisherTest, KeyWaitsInThePlaceOfItsFirstValue) {
    for (const std::string key : {"long key that is no short string", "b", "c"}) keep(key, 1);
    keep("b", 2);
    keep("long key that is no short string", 2);
    publisher->subscribe(subscriber);
    subscriber->request(2);
    EXPECT_THAT(delivered(), ElementsAre("long key that is no short string2", "b2"));
}

TEST_F(ConflatingPublisherTest, KeysBehindADeliveredOneAreStillReplaced) {
    for (const std::string key : {"a", "b", "c"}) keep(key, 1);
    publisher->subscribe(subscriber);
    subscriber->request(1);
    for (const std::string key : {"c", "b", "a"}) keep(key, 2);
    subscriber->request(testing::allValues);
    EXPECT_THAT(delivered(), ElementsAre("a1", "b2", "c2", "a2"));
}

TEST_F(ConflatingPublisherTest, DeliveredKeyIsKeptAfresh) {
    publisher->subscribe(subscriber);
    subscriber->request(1);
    keep("a", 1);
    publisher->deliver();
    keep("a", 2);
    publisher->deliver();
    subscriber->request(1);
    EXPECT_THAT(delivered(), ElementsAre("a1", "a2"));
}

TEST_F(ConflatingPublisherTest, KeepDeliversNothing) {
    publisher->subscribe(subscriber);
    subscriber->request(testing::allValues);
    keep("a", 1);
    EXPECT_THAT(delivered(), IsEmpty());
    publisher->deliver();
    EXPECT_THAT(delivered(), ElementsAre("a1"));
}

TEST_F(ConflatingPublisherTest, SubscriberThatCancelsDuringADeliveryLivesUntilItsEnd) {
    publisher->subscribe(subscriber);
    subscriber->request(testing::allValues);
    const std::weak_ptr<testing::RecordingSubscriber<Entry>> alive = subscriber;
    bool livesAfterwards = false;
    subscriber->whenNext = [&](const Entry&) {
        alive.lock()->cancel();
        livesAfterwards = !alive.expired();
    };
    subscriber.reset();
    keep("a", 1);
    publisher->deliver();
    EXPECT_TRUE(livesAfterwards);
    EXPECT_TRUE(alive.expired());
}

TEST_F(ConflatingPublisherTest, DeliverDoesNotNest) {
    publisher->subscribe(subscriber);
    std::vector<std::string> events;
    subscriber->whenNext = [&](const Entry& entry) {
        events.push_back("begin " + entry.key);
        if (entry.key == "a") {
            keep("b", 2);
            publisher->deliver();
        }
        events.push_back("end " + entry.key);
    };
    keep("a", 1);
    subscriber->request(testing::allValues);
    EXPECT_THAT(events, ElementsAre("begin a", "end a", "begin b", "end b"));
}

TEST_F(ConflatingPublisherTest, DeliverOfAnotherThreadLeavesTheValueToTheRunningOne) {
    publisher->subscribe(subscriber);
    subscriber->whenNext = [&](const Entry& entry) {
        if (entry.key != "a") return;
        EXPECT_TRUE(testing::completes([&stream = *publisher] {
            stream.keep({{"b", 2}});
            stream.deliver();
        }));
        EXPECT_THAT(delivered(), ElementsAre("a1"));
    };
    keep("a", 1);
    subscriber->request(testing::allValues);
    EXPECT_THAT(delivered(), ElementsAre("a1", "b2"));
}

TEST_F(ConflatingPublisherTest, KeepsNothingAfterTheEnd) {
    publisher->subscribe(subscriber);
    publisher->complete();
    keep("a", 1);
    subscriber->request(testing::allValues);
    publisher->deliver();
    EXPECT_THAT(delivered(), IsEmpty());
    EXPECT_EQ(ends, 1);
}

TEST_F(ConflatingPublisherTest, FailureDropsWhatIsKept) {
    publisher->subscribe(subscriber);
    keep("a", 1);
    publisher->fail(std::make_exception_ptr(std::runtime_error("lost")));
    subscriber->request(testing::allValues);
    EXPECT_THAT(delivered(), IsEmpty());
    EXPECT_EQ(subscriber->errors.size(), 1U);
}

TEST_F(ConflatingPublisherTest, CompletionWaitsForWhatIsKept) {
    publisher->subscribe(subscriber);
    keep("a", 1);
    keep("b", 2);
    publisher->complete();
    subscriber->request(1);
    EXPECT_EQ(subscriber->completions, 0);
    subscriber->request(1);
    EXPECT_EQ(subscriber->completions, 1);
    EXPECT_THAT(delivered(), ElementsAre("a1", "b2"));
}

}  // namespace
}  // namespace velkor::reactive_streams
