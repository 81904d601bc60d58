#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "http/Refused.hpp"
#include "http/detail/routes/Worker.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/HookedSource.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;
using velkor::testing::Latch;
using velkor::testing::problemIn;
using velkor::testing::thrownText;

class ServiceTest : public velkor::testing::ServiceTest {
protected:
    /// A store that keeps the worker busy until the latch opens.
    void block() {
        const auto source = std::make_shared<velkor::testing::HookedSource>();
        store->addSource("s", "", -1, false, source).get();
        source->whenKeys = [this] {
            working.countDown();
            if (!blocking.wait()) throw std::runtime_error("waited in vain");
        };
    }

    Latch working;
    Latch blocking;
};

TEST_F(ServiceTest, AnswersOnTheCallersThreadWhatIsQuick) {
    for (const char* const path : {"/healthz", "/readyz", "/", "/config/k"}) {
        std::thread::id answering;
        service().handle(request("GET", path),
                         [&](Answer&&) { answering = std::this_thread::get_id(); });
        EXPECT_EQ(answering, std::this_thread::get_id()) << path;
    }
}

TEST_F(ServiceTest, AnswersWhatIsQuickWhileTheWorkerIsBusy) {
    block();
    auto slow = sendLater(request("POST", "/velkor/configuration/ConfigurationKeys", "[]"));
    auto page = sendLater(request("GET", "/config"));
    ASSERT_TRUE(working.wait());
    EXPECT_EQ(get("/healthz").status, 200);
    blocking.countDown();
    EXPECT_EQ(std::get<Response>(awaited(std::move(page))).status, 200);
    EXPECT_EQ(std::get<Response>(awaited(std::move(slow))).status, 400);
}

TEST_F(ServiceTest, ReadsLargeBodiesOnTheWorker) {
    std::promise<std::thread::id> answering;
    auto thread = answering.get_future();
    service().handle(request("POST", "/velkor/configuration/ConfigurationGet",
                             R"({"key":")" + std::string(5000, 'k') + R"("})"),
                     [&](Answer&&) { answering.set_value(std::this_thread::get_id()); });
    ASSERT_EQ(thread.wait_for(velkor::testing::patience), std::future_status::ready);
    EXPECT_NE(thread.get(), std::this_thread::get_id());
}

TEST_F(ServiceTest, TurnsAwayWhatTheWorkerHasNoRoomFor) {
    block();
    std::vector<std::future<Answer>> answers;
    answers.push_back(sendLater(request("GET", "/config")));
    ASSERT_TRUE(working.wait());
    for (int i = 0; i < 64; ++i) answers.push_back(sendLater(request("GET", "/sources")));
    const Response refused = get("/sources");
    EXPECT_EQ(problemIn(refused), "503 /problems/unavailable The server is too busy.");
    EXPECT_EQ(headerOf(refused, "Retry-After"), "1");
    blocking.countDown();
    for (auto& answer : answers) {
        EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
    }
}

TEST_F(ServiceTest, HasRoomForAnotherMachineAndForWritersWhenOneFillsTheQueue) {
    block();
    std::vector<std::future<Answer>> answers;
    answers.push_back(sendLater(request("GET", "/config")));
    ASSERT_TRUE(working.wait());
    for (int i = 0; i < 64; ++i) {
        Request read = request("GET", "/sources");
        read.client.address = "127.0.0.1:" + std::to_string(i);
        answers.push_back(sendLater(std::move(read)));
    }
    Request other = request("GET", "/sources");
    other.client.address = "[::1]:7";
    auto served = sendLater(std::move(other));
    auto written =
        sendLater(request("POST", "/velkor/configuration/ConfigurationSet", R"({"key":"k"})"));
    EXPECT_EQ(std::get<Response>(awaited(std::move(answers.back()))).status, 503);
    answers.pop_back();
    blocking.countDown();
    answers.push_back(std::move(served));
    answers.push_back(std::move(written));
    for (auto& answer : answers) {
        EXPECT_EQ(std::get<Response>(awaited(std::move(answer))).status, 200);
    }
}

TEST_F(ServiceTest, AnswersWhatWaitsWhenItStops) {
    block();
    auto first = sendLater(request("GET", "/config"));
    ASSERT_TRUE(working.wait());
    auto second = sendLater(request("GET", "/sources"));
    std::thread stopping([&] { handler->stop(); });
    const bool isAnswered = second.wait_for(velkor::testing::patience) == std::future_status::ready;
    blocking.countDown();
    stopping.join();
    ASSERT_TRUE(isAnswered);
    EXPECT_EQ(problemIn(std::get<Response>(second.get())),
              "503 /problems/unavailable The server is too busy.");
    EXPECT_EQ(std::get<Response>(awaited(std::move(first))).status, 200);
    handler->stop();
    EXPECT_EQ(get("/sources").status, 503);
}

TEST_F(ServiceTest, ListsTheKeysAgainOnlyWhenTheStoreHasChanged) {
    const auto source = std::make_shared<velkor::testing::HookedSource>();
    int listings = 0;
    store->addSource("s", "", -1, false, source).get();
    source->whenKeys = [&] { ++listings; };
    for (int i = 0; i < 3; ++i) EXPECT_EQ(get("/config").body, R"({"items":[]})");
    get("/metrics");
    EXPECT_EQ(listings, 1);
    store->set("k", 1).get();
    EXPECT_THAT(get("/config").body, HasSubstr(R"("key":"k")"));
    EXPECT_EQ(listings, 2);
    store->removeSource("s").get();
    EXPECT_EQ(get("/config").body, R"({"items":[]})");
}

TEST_F(ServiceTest, RefusesToStartWithoutTheRootThatIsNamed) {
    options.propertyRoot = "/no/such/folder";
    EXPECT_THAT(thrownText<Refused>([&] { service(); }), HasSubstr("/no/such/folder"));
}

TEST_F(ServiceTest, CountsWhatItAnswers) {
    store->set("k", 1).get();
    get("/config/k");
    get("/config/k");
    get("/config/x");
    get("/nothing");
    message("ConfigurationGet", R"({"key":"k"})");
    const std::string text = get("/metrics").body;
    EXPECT_THAT(text, HasSubstr("\nvelkor_keys 1\n"));
    EXPECT_THAT(text, HasSubstr("\nvelkor_layers 2\n"));
    EXPECT_THAT(text, HasSubstr("\nvelkor_layer_well{layer=\"override\"} 1\n"));
    EXPECT_THAT(text,
                HasSubstr("velkor_http_requests_total{route=\"GET /config/\",status=\"200\"} 2\n"));
    EXPECT_THAT(text,
                HasSubstr("velkor_http_requests_total{route=\"GET /config/\",status=\"404\"} 1\n"));
    EXPECT_THAT(text, HasSubstr("velkor_http_requests_total{route=\"none\",status=\"404\"} 1\n"));
    EXPECT_THAT(text, HasSubstr("velkor_http_requests_total{route=\"POST "
                                "/velkor/configuration/ConfigurationGet\",status=\"200\"} 1\n"));
    EXPECT_THAT(text, HasSubstr("velkor_http_request_seconds_count{route=\"GET /config/\"} 3\n"));
    EXPECT_THAT(text, HasSubstr("velkor_http_request_seconds_bucket{route=\"GET "
                                "/config/\",le=\"+Inf\"} 3\n"));
    EXPECT_THAT(text, Not(HasSubstr("GET /history")));
}

TEST_F(ServiceTest, ShowsWhatTheTransportCounts) {
    counts->connectionsOpen = 1;
    counts->connectionsAccepted = 2;
    counts->connectionsRefused = 3;
    counts->streamsOpen = 4;
    counts->streamsRefused = 5;
    counts->eventsWritten = 6;
    counts->requestsRead = 7;
    counts->requestsRefused = 8;
    counts->answersRefused = 9;
    counts->requestsTimedOut = 10;
    counts->writesTimedOut = 11;
    counts->bytesRead = 12;
    counts->bytesWritten = 13;
    const std::string text = get("/metrics").body;
    for (const char* const line :
         {" gauge\nvelkor_http_connections 1\n",
          " counter\nvelkor_http_connections_accepted_total 2\n",
          " counter\nvelkor_http_connections_refused_total 3\n", " gauge\nvelkor_http_streams 4\n",
          " counter\nvelkor_http_streams_refused_total 5\n",
          " counter\nvelkor_http_events_written_total 6\n",
          " counter\nvelkor_http_requests_read_total 7\n",
          " counter\nvelkor_http_requests_refused_total 8\n",
          " counter\nvelkor_http_answers_refused_total 9\n",
          " counter\nvelkor_http_requests_timed_out_total 10\n",
          " counter\nvelkor_http_writes_timed_out_total 11\n",
          " counter\nvelkor_http_read_bytes_total 12\n",
          " counter\nvelkor_http_written_bytes_total 13\n"}) {
        EXPECT_THAT(text, HasSubstr(line));
    }
}

TEST_F(ServiceTest, EscapesTheNamesOfLayersInMetrics) {
    store->addInMemorySource("a\"b\\c\nd", "", 1, false, {}).get();
    EXPECT_THAT(get("/metrics").body,
                HasSubstr("velkor_layer_well{layer=\"a\\\"b\\\\c\\nd\"} 1\n"));
}

TEST_F(ServiceTest, AnswersSeveralThreads) {
    store->set("k", 1).get();
    service();
    std::vector<std::thread> threads;
    std::atomic<int> answers{0};
    for (int i = 0; i < 3; ++i) {
        threads.emplace_back([&, i] {
            for (int n = 0; n < 100; ++n) {
                if (message("ConfigurationGet", R"({"key":"k"})").status == 200) ++answers;
                if (get(i == 0 ? "/metrics" : "/config").status != 200) --answers;
                send("PATCH", "/config",
                     R"({"changes":[{"key":"k","value":{"type":"int","value":1}}]})");
            }
        });
    }
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(answers, 300);
}

/// A worker that is busy until the latch opens, and notes what it does then.
class WorkerTest : public ::testing::Test {
protected:
    using Kind = Worker::Kind;

    void SetUp() override {
        worker.post(Kind::read, "a", [this] {
            begun.countDown();
            EXPECT_TRUE(end.wait());
        });
        ASSERT_TRUE(begun.wait());
    }

    void note(Kind kind, const std::string& owner, const std::string& name) {
        worker.post(kind, owner, [this, name] {
            done += name;
            if (done.size() == 3) last.countDown();
        });
    }

    /// The names of the three jobs that wait, in the order in which they are done.
    std::string allDone() {
        end.countDown();
        EXPECT_TRUE(last.wait());
        return done;
    }

    Latch begun;
    Latch end;
    Latch last;
    std::string done;
    Worker worker{4};
};

TEST_F(WorkerTest, DoesJobsInTheirOrder) {
    for (const char* const name : {"1", "2", "3"}) note(Kind::read, "a", name);
    EXPECT_EQ(allDone(), "123");
}

TEST_F(WorkerTest, WritesFirst) {
    note(Kind::read, "a", "r");
    note(Kind::write, "a", "w");
    note(Kind::write, "b", "v");
    EXPECT_EQ(allDone(), "wvr");
}

TEST_F(WorkerTest, DestroysWhatWaitsWhenItStops) {
    const auto dropped = std::make_shared<int>(0);
    worker.post(Kind::read, "a", [dropped] { ++*dropped; });
    worker.post(Kind::write, "a", [dropped] { ++*dropped; });
    std::thread stopping([&] { worker.stop(); });
    while (dropped.use_count() > 1) std::this_thread::yield();
    end.countDown();
    stopping.join();
    EXPECT_EQ(*dropped, 0);
    worker.post(Kind::read, "a", [dropped] { ++*dropped; });
    EXPECT_EQ(dropped.use_count(), 1);
}

// ---- Whose turn it is

class FairQueueTest : public ::testing::Test {
protected:
    /// Adds a job; gives the name of the one that had to go.
    std::string push(const std::string& owner, const std::string& name) {
        const auto loser = queue.push(owner, [this, name] { done = name; });
        if (!loser) return "";
        (*loser)();
        return done;
    }

    std::string popAll() {
        std::string all;
        while (!queue.empty()) {
            queue.pop()();
            all += done;
        }
        return all;
    }

    FairQueue queue{4};
    std::string done;
};

TEST_F(FairQueueTest, KeepsTheOrderOfOneOwner) {
    for (const char* const name : {"1", "2", "3"}) push("a", name);
    EXPECT_EQ(popAll(), "123");
}

TEST_F(FairQueueTest, TakesTurns) {
    for (const char* const name : {"1", "2", "3"}) push("a", name);
    push("b", "x");
    EXPECT_EQ(popAll(), "1x23");
}

TEST_F(FairQueueTest, TurnsTheOnlyOwnerAway) {
    for (const char* const name : {"1", "2", "3", "4"}) EXPECT_EQ(push("a", name), "");
    EXPECT_EQ(push("a", "5"), "5");
    EXPECT_EQ(popAll(), "1234");
}

TEST_F(FairQueueTest, MakesRoomAtTheCostOfWhoHasTheMost) {
    for (const char* const name : {"1", "2", "3", "4"}) push("a", name);
    EXPECT_EQ(push("b", "x"), "4");
    EXPECT_EQ(push("b", "y"), "3");
    EXPECT_EQ(push("b", "z"), "z");
    EXPECT_EQ(push("c", "c"), "2");
    EXPECT_EQ(push("a", "5"), "5");
    EXPECT_EQ(popAll(), "1xcy");
}

TEST_F(FairQueueTest, TurnsAwayTheLastOfManyOwners) {
    for (const char* const owner : {"a", "b", "c", "d"}) push(owner, owner);
    EXPECT_EQ(push("e", "e"), "e");
    EXPECT_EQ(popAll(), "abcd");
}

}  // namespace
}  // namespace velkor::http::detail
