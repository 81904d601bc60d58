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
    EXPECT_EQ(problemIn(refused), "503 /problems/unavailable Too many requests wait.");
    EXPECT_EQ(headerOf(refused, "Retry-After"), "1");
    blocking.countDown();
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
    EXPECT_EQ(problemIn(std::get<Response>(awaited(std::move(second)))),
              "503 /problems/unavailable The request was given up.");
    blocking.countDown();
    stopping.join();
    EXPECT_EQ(std::get<Response>(awaited(std::move(first))).status, 200);
    handler->stop();
    EXPECT_EQ(get("/sources").status, 503);
}

TEST_F(ServiceTest, RefusesToStartWithoutTheRootThatIsNamed) {
    options.propertyRoot = "/no/such/folder";
    EXPECT_THAT(thrownText<Refused>([&] { service(); }), HasSubstr("/no/such/folder"));
}

TEST_F(ServiceTest, CountsWhatItAnswers) {
    counts->connectionsOpen = 7;
    counts->requestsTimedOut = 3;
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
    EXPECT_THAT(text, HasSubstr("\nvelkor_http_connections 7\n"));
    EXPECT_THAT(text, HasSubstr("\nvelkor_http_requests_timed_out_total 3\n"));
    EXPECT_THAT(text, Not(HasSubstr("GET /history")));
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

TEST(Worker, DoesJobsInTheirOrder) {
    std::string done;
    Latch last;
    Worker worker(10);
    for (const char* const name : {"a", "b", "c"}) {
        EXPECT_TRUE(worker.post([&, name] { done += name; }));
    }
    EXPECT_TRUE(worker.post([&] { last.countDown(); }));
    ASSERT_TRUE(last.wait());
    EXPECT_EQ(done, "abc");
}

TEST(Worker, DropsWhatWaitsWhenItStops) {
    const auto dropped = std::make_shared<int>(0);
    Latch begun;
    Latch end;
    Worker worker(10);
    worker.post([&] {
        begun.countDown();
        EXPECT_TRUE(end.wait());
    });
    ASSERT_TRUE(begun.wait());
    worker.post([dropped] { ++*dropped; });
    std::thread stopping([&] { worker.stop(); });
    while (worker.post([] {})) std::this_thread::yield();
    end.countDown();
    stopping.join();
    EXPECT_EQ(dropped.use_count(), 1);
    EXPECT_EQ(*dropped, 0);
}

}  // namespace
}  // namespace velkor::http::detail
