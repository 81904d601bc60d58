#include "http/detail/routes/Feeds.hpp"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "settings/Setting.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/HookedSource.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::patience;
using velkor::testing::problemIn;

std::string intEvent(int id, int value) {
    return "id: " + std::to_string(id) +
           "\ndata: {\"type\":\"int\",\"value\":" + std::to_string(value) + "}\n\n";
}

class FeedsTest : public velkor::testing::ServiceTest {
protected:
    FeedPtr started(const std::string& target) {
        FeedPtr feed = open(target);
        feed->start([this] { ++ready; });
        return feed;
    }

    /// What `velkor_http_watches` says.
    std::string watches(const std::string& of) {
        const std::string text = get("/metrics").body;
        const std::string begin = "velkor_http_watches{of=\"" + of + "\"} ";
        const auto at = text.find(begin) + begin.size();
        return text.substr(at, text.find('\n', at) - at);
    }

    std::atomic<int> ready{0};
};

TEST_F(FeedsTest, BeginWithTheCurrentValue) {
    store->set("k", 1).get();
    const auto feed = started("/watch?key=k");
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(feed->next(), intEvent(1, 1));
    EXPECT_EQ(feed->next(), std::nullopt);
    EXPECT_FALSE(feed->isOver());
}

TEST_F(FeedsTest, BeginWithTheFirstValueWhereThereIsNone) {
    const auto feed = started("/watch?key=k");
    EXPECT_EQ(ready, 0);
    EXPECT_EQ(feed->next(), std::nullopt);
    store->set("k", 1).get();
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(feed->next(), intEvent(1, 1));
}

TEST_F(FeedsTest, ShowEveryChangeToAReaderThatKeepsUp) {
    const auto feed = started("/watch?key=k");
    for (int i = 1; i <= 5; ++i) {
        EXPECT_EQ(feed->next(), std::nullopt);
        store->set("k", i).get();
        EXPECT_EQ(ready, i);
        EXPECT_EQ(feed->next(), intEvent(i, i));
    }
}

TEST_F(FeedsTest, ShowEqualValuesAsWell) {
    store->set("k", 1).get();
    const auto feed = started("/watch?key=k");
    feed->next();
    store->set("k", 1).get();
    EXPECT_EQ(feed->next(), intEvent(2, 1));
}

TEST_F(FeedsTest, ShowTheNewestToASlowReader) {
    const auto feed = started("/watch?key=k");
    for (int i = 1; i <= 100; ++i) store->set("k", i).get();
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(feed->next(), intEvent(1, 100));
    EXPECT_EQ(feed->next(), std::nullopt);
    EXPECT_NE(get("/metrics").body.find("velkor_http_values_conflated_total 99\n"),
              std::string::npos);
    EXPECT_NE(get("/metrics").body.find("velkor_http_values_delivered_total 1\n"),
              std::string::npos);
}

TEST_F(FeedsTest, ShowNoOtherKey) {
    const auto feed = started("/watch?key=k");
    store->set("k2", 1).get();
    EXPECT_EQ(feed->next(), std::nullopt);
}

TEST_F(FeedsTest, ShowWhatIsEffective) {
    store->set("k", 1).get();
    const auto feed = started("/watch?key=k");
    feed->next();
    store->set("k", 2, "default").get();
    EXPECT_EQ(feed->next(), intEvent(2, 1));
}

// A value that a source's thread has read before others wrote may be told after theirs.
TEST_F(FeedsTest, ShowTheTruthWhereAnOlderValueIsToldLast) {
    const auto source = std::make_shared<velkor::testing::HookedSource>(
        velkor::testing::HookedSource::Table{{"k", 1}});
    const auto feed = started("/watch?key=k");
    EXPECT_EQ(feed->next(), std::nullopt);
    store->addSource("s", "", -1, false, source).get();
    source->values["k"] = 2;  // untold
    EXPECT_EQ(feed->next(), intEvent(1, 2));
}

TEST_F(FeedsTest, ShowTheLastValueOfAKeyThatHasGone) {
    const auto feed = started("/watch?key=k");
    store->set("k", 1).get();
    store->unset("k").get();
    EXPECT_EQ(feed->next(), intEvent(1, 1));
}

TEST_F(FeedsTest, NeedAKey) {
    EXPECT_EQ(problemIn(get("/watch")),
              R"(400 /problems/bad-request The query parameter \"key\" is missing.)");
}

TEST_F(FeedsTest, TakeKeysOfAnyBytes) {
    store->set("a b+\xFF", 1).get();
    EXPECT_EQ(started("/watch?key=a%20b+%FF")->next(), intEvent(1, 1));
}

TEST_F(FeedsTest, MaskWhatIsSecretWhenItIsShown) {
    store->set("pin", 1234).get();
    const auto feed = started("/watch?key=pin");
    const auto changes = started("/changes");
    EXPECT_EQ(feed->next(), intEvent(1, 1234));
    const settings::Setting<int> pin(store, "pin", 1, settings::secret());
    store->set("pin", 4321).get();
    EXPECT_EQ(feed->next(), "id: 2\ndata: {\"type\":\"int\",\"value\":\"•••\"}\n\n");
    EXPECT_EQ(changes->next(),
              "id: 1\ndata: {\"key\":\"pin\",\"value\":{\"type\":\"int\",\"value\":\"•••\"},"
              "\"source\":\"override\"}\n\n");
}

TEST_F(FeedsTest, ShowNoValueOfAStoreThatIsGone) {
    store->set("k", 1).get();
    const auto feed = started("/watch?key=k");
    handler.reset();
    store.reset();
    EXPECT_EQ(feed->next(), "id: 1\ndata: {\"type\":\"int\",\"value\":\"•••\"}\n\n");
}

TEST_F(FeedsTest, AreOverWhenTheStoreGoes) {
    const auto feed = started("/watch?key=k");
    const auto changes = started("/changes");
    handler.reset();
    store.reset();
    EXPECT_EQ(ready, 2);
    for (const auto* each : {&feed, &changes}) {
        EXPECT_EQ((*each)->next(), std::nullopt);
        EXPECT_TRUE((*each)->isOver());
    }
}

TEST_F(FeedsTest, EndTheirWatchWithThemselves) {
    auto feed = started("/watch?key=k");
    auto changes = started("/changes");
    EXPECT_EQ(watches("key") + watches("prefix"), "11");
    feed.reset();
    changes.reset();
    EXPECT_EQ(watches("key") + watches("prefix"), "00");
    store->set("k", 1).get();
    EXPECT_EQ(ready, 0);
}

TEST_F(FeedsTest, EndTheirWatchThoughNobodyStartedIt) {
    const std::weak_ptr<configuration::ConfigurationImpl> watched = store;
    open("/watch?key=k").reset();
    open("/changes").reset();
    store->set("k", 1).get();
    EXPECT_EQ(watches("key") + watches("prefix"), "00");
}

TEST_F(FeedsTest, ShowChangesFromTheirOpeningOn) {
    store->set("a", 1).get();
    const auto feed = open("/changes");
    store->set("b", 2).get();
    feed->start([this] { ++ready; });
    EXPECT_EQ(ready, 1);
    EXPECT_EQ(feed->next(),
              "id: 1\ndata: {\"key\":\"b\",\"value\":{\"type\":\"int\",\"value\":2},"
              "\"source\":\"override\"}\n\n");
    EXPECT_EQ(feed->next(), std::nullopt);
}

TEST_F(FeedsTest, ShowKeysThatHaveGone) {
    store->set("a", 1).get();
    store->set("a\xFF", 1).get();
    const auto feed = started("/changes");
    store->unset("a").get();
    EXPECT_EQ(feed->next(), "id: 1\ndata: {\"key\":\"a\",\"gone\":true}\n\n");
    store->unset("a\xFF").get();
    EXPECT_EQ(feed->next(),
              "id: 2\ndata: {\"key\":\"a\xEF\xBF\xBD\",\"href\":\"/config/a%FF\","
              "\"gone\":true}\n\n");
}

TEST_F(FeedsTest, ShowTheNewestOfEachKeyToASlowReader) {
    const auto feed = started("/changes?prefix=n.");
    for (int i = 1; i <= 9; ++i) {
        store->set("n.a", i).get();
        store->set("n.b", i).get();
        store->set("other", i).get();
    }
    EXPECT_EQ(ready, 1);
    std::vector<std::string> events;
    while (const auto event = feed->next()) events.push_back(event->substr(event->find("data")));
    const auto change = [](const std::string& key, int value) {
        return "data: {\"key\":\"" + key +
               "\",\"value\":{\"type\":\"int\",\"value\":" + std::to_string(value) +
               "},\"source\":\"override\"}\n\n";
    };
    EXPECT_EQ(events, (std::vector<std::string>{change("n.a", 9), change("n.b", 9)}));
}

TEST_F(FeedsTest, GiveUpAReaderThatLeavesTooManyKeysWaiting) {
    const auto slow = started("/changes");
    const auto other = started("/changes?prefix=other");
    for (int i = 0; i < 1000; ++i) store->set("k" + std::to_string(i), 1).get();
    EXPECT_FALSE(slow->isOver());
    store->set("k0", 2).get();
    EXPECT_NE(slow->next(), std::nullopt);
    store->set("k1000", 1).get();
    store->set("k1001", 1).get();
    EXPECT_EQ(slow->next(), std::nullopt);
    EXPECT_TRUE(slow->isOver());
    store->set("other", 1).get();
    EXPECT_NE(other->next(), std::nullopt);
}

TEST_F(FeedsTest, GiveUpAReaderThatWaitsForNothingElse) {
    const auto slow = started("/changes");
    EXPECT_EQ(slow->next(), std::nullopt);
    for (int i = 0; i < 1001; ++i) store->set("k" + std::to_string(i), 1).get();
    EXPECT_EQ(ready, 1);
    EXPECT_TRUE(slow->isOver());
}

TEST_F(FeedsTest, WatchTheStoreOnceForAllThatShowChanges) {
    const auto first = started("/changes?prefix=a");
    {
        const auto second = started("/changes?prefix=b");
        store->set("b", 1).get();
        EXPECT_NE(second->next(), std::nullopt);
    }
    store->set("a", 1).get();
    EXPECT_NE(first->next(), std::nullopt);
    const auto third = started("/changes");
    store->set("b", 2).get();
    EXPECT_EQ(first->next(), std::nullopt);
    EXPECT_NE(third->next(), std::nullopt);
}

TEST_F(FeedsTest, ShowTheChangesOfAPatchTogether) {
    const auto feed = started("/changes");
    send("PATCH", "/config",
         R"({"changes":[{"key":"a","value":{"type":"int","value":1}},)"
         R"({"key":"b","value":{"type":"int","value":2}}]})");
    EXPECT_NE(feed->next(), std::nullopt);
    EXPECT_NE(feed->next(), std::nullopt);
    EXPECT_EQ(feed->next(), std::nullopt);
}

TEST_F(FeedsTest, EndOnTheLastValueHoweverManyWrite) {
    constexpr int writers = 3;
    constexpr int writes = 500;
    const auto watch = started("/watch?key=k");
    const auto changes = started("/changes");
    std::vector<std::thread> threads;
    std::atomic<int> running{writers};
    for (int i = 0; i < writers; ++i) {
        threads.emplace_back([&, i] {
            for (int n = 0; n < writes; ++n) {
                if (n % 2 == 0) {
                    store->set("k", i * writes + n).get();
                } else {
                    store->apply({{"k", configuration::ConfigurationValue(n)}}).get();
                }
            }
            --running;
        });
    }
    std::string lastWatched;
    std::string lastChanged;
    const auto drain = [](EventFeed& feed, std::string& last) {
        while (auto event = feed.next()) last = *std::move(event);
    };
    while (running > 0) {
        drain(*watch, lastWatched);
        drain(*changes, lastChanged);
    }
    for (auto& thread : threads) thread.join();
    drain(*watch, lastWatched);
    drain(*changes, lastChanged);
    const std::string value = "\"value\":" + std::to_string(boost::get<int>(store->get("k").get()));
    EXPECT_NE(lastWatched.find(value + "}"), std::string::npos) << lastWatched;
    EXPECT_NE(lastChanged.find(value + "}"), std::string::npos) << lastChanged;
}

TEST_F(FeedsTest, ComeAndGoWhileOthersWrite) {
    std::atomic<bool> isDone{false};
    std::thread writer([&] {
        for (int i = 0; !isDone; ++i) store->set("k", i).get();
    });
    for (int i = 0; i < 200; ++i) {
        const auto watch = started("/watch?key=k");
        const auto changes = started("/changes?prefix=k");
        if (i % 2 == 0) watch->next();
        if (i % 3 == 0) changes->next();
    }
    isDone = true;
    writer.join();
    EXPECT_EQ(watches("key") + watches("prefix"), "00");
}

TEST_F(FeedsTest, EndWhileTheStoreGoes) {
    for (int i = 0; i < 50; ++i) {
        auto feed = started("/watch?key=k");
        handler.reset();
        std::thread ending([&] { feed.reset(); });
        store.reset();
        ending.join();
        store = std::make_shared<configuration::ConfigurationImpl>();
    }
}

}  // namespace
}  // namespace velkor::http::detail
