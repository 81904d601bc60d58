#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "tests/http/transport/ListenerTesting.hpp"

namespace velkor::http::detail::transport {
namespace {

using std::chrono::milliseconds;
using velkor::testing::HttpAnswer;
using velkor::testing::HttpClient;

class Streams : public ::testing::Test {
protected:
    static HttpClient opened(const Serving& serving) {
        HttpClient client(serving.port());
        client.send("GET /stream HTTP/1.1\r\n\r\n");
        const HttpAnswer answer = client.answer();
        EXPECT_EQ(answer.status, 200);
        EXPECT_EQ(answer.header("Content-Type"), "text/event-stream");
        return client;
    }

    const std::shared_ptr<FeedControl> control = std::make_shared<FeedControl>();
};

TEST_F(Streams, BeginBeforeThereIsAnEvent) {
    const Serving serving({}, streaming(control));
    HttpClient client = opened(serving);
    EXPECT_EQ(serving.counts->streamsOpen, 1U);
}

TEST_F(Streams, ShowEachEvent) {
    const Serving serving({}, streaming(control));
    control->push("data: 0\n\n");
    HttpClient client = opened(serving);
    EXPECT_EQ(client.readUntil("\n\n"), "data: 0\n\n");
    for (int i = 1; i < 100; ++i) {
        const std::string event = "data: " + std::to_string(i) + "\n\n";
        control->push(event);
        EXPECT_EQ(client.readUntil("\n\n"), event);
    }
}

TEST_F(Streams, ShowEventsThatComeTogetherInOrder) {
    const Serving serving({}, streaming(control));
    HttpClient client = opened(serving);
    std::thread pusher([this] {
        for (int i = 0; i < 1000; ++i) control->push(std::to_string(i) + "\n\n");
    });
    for (int i = 0; i < 1000; ++i) EXPECT_EQ(client.readUntil("\n\n"), std::to_string(i) + "\n\n");
    pusher.join();
}

TEST_F(Streams, EndWhenTheyAreOver) {
    const Serving serving({}, streaming(control));
    HttpClient client = opened(serving);
    control->push("last\n\n");
    control->finish();
    EXPECT_EQ(client.readToEnd(), "last\n\n");
    EXPECT_TRUE(control->ended.wait());
}

TEST_F(Streams, EndWhenTheClientGoes) {
    struct Row {
        const char* name;
        void (*go)(HttpClient&);
    };
    const Row rows[] = {
        {"closes", [](HttpClient& client) { client.close(); }},
        {"resets", [](HttpClient& client) { client.reset(); }},
        {"sends no more", [](HttpClient& client) { client.endSending(); }},
        {"says more", [](HttpClient& client) { client.send("GET / HTTP/1.1\r\n"); }}};
    for (const Row& row : rows) {
        SCOPED_TRACE(row.name);
        const auto own = std::make_shared<FeedControl>();
        const Serving serving({}, streaming(own));
        HttpClient client = opened(serving);
        row.go(client);
        EXPECT_TRUE(own->ended.wait());
    }
}

TEST_F(Streams, TellNothingOfAnEventAfterTheirEnd) {
    const Serving serving({}, streaming(control));
    opened(serving).close();
    ASSERT_TRUE(control->ended.wait());
    control->ready()();
    EXPECT_EQ(control->taken(), 0U);
    EXPECT_EQ(HttpClient(serving.port()).ask("GET /").status, 200);
}

TEST_F(Streams, AreShownAsAHeadOnlyWithoutBeingStarted) {
    const Serving serving({}, streaming(control));
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("HEAD /stream").status, 200);
    EXPECT_EQ(client.readToEnd(), "");
    EXPECT_TRUE(control->ended.wait());
    EXPECT_FALSE(control->started.isOpen());
}

TEST_F(Streams, HaveALimit) {
    ServerOptions options;
    options.maxStreams = 1;
    const Serving serving(options, streaming(control));
    HttpClient client = opened(serving);
    HttpClient other(serving.port());
    EXPECT_EQ(other.ask("GET /stream").body, "refused with 503");
    EXPECT_EQ(other.ask("GET /").status, 200);
    EXPECT_EQ(serving.counts->streamsRefused, 1U);
    client.close();
    EXPECT_TRUE(eventually([&] { return serving.counts->streamsOpen == 0; }));
    opened(serving);
}

TEST_F(Streams, SayNowAndThenThatTheyLive) {
    ServerOptions options;
    options.commentInterval = milliseconds(20);
    const Serving serving(options, streaming(control));
    HttpClient client = opened(serving);
    EXPECT_EQ(client.readUntil("\n\n"), ": \n\n");
    control->push("event\n\n");
    while (client.readUntil("\n\n") != "event\n\n") continue;
    EXPECT_EQ(client.readUntil("\n\n"), ": \n\n");
}

TEST_F(Streams, ShowAnEventThatTheyWereNotToldOf) {
    ServerOptions options;
    options.commentInterval = milliseconds(20);
    const Serving serving(options, streaming(control));
    HttpClient client = opened(serving);
    EXPECT_EQ(client.readUntil("\n\n"), ": \n\n");
    control->pushUntold("event\n\n");
    while (client.readUntil("\n\n") != "event\n\n") continue;
    EXPECT_EQ(control->taken(), 1U);
}

TEST_F(Streams, OfAClientThatReadsNothingTakeNoMoreThanTheyCanWrite) {
    ServerOptions options;
    options.writeTimeout = milliseconds(100);
    const Serving serving(options, streaming(control));
    HttpClient client(serving.port(), 4096);
    client.send("GET /stream HTTP/1.1\r\n\r\n");
    const std::string event(std::size_t{1} << 20U, 'e');
    constexpr std::size_t more = 64;
    for (std::size_t i = 0; i < more; ++i) control->push(event);
    // The write makes no progress: the client is given up, and most events were never asked for.
    EXPECT_TRUE(control->ended.wait());
    EXPECT_LT(control->taken(), more);
    EXPECT_EQ(serving.counts->writesTimedOut, 1U);
}

TEST_F(Streams, WaitForRoomBeforeTheyTakeAnEvent) {
    const auto stalled = std::make_shared<FeedControl>();
    ServerOptions options;
    options.maxBufferedBytes = 1;
    const Serving serving(options, [&](Request&& request, const ScriptedHandler::Reply& answer) {
        answer(std::make_unique<ControlledFeed>(request.target == "/stalled" ? stalled : control));
    });
    HttpClient reader = opened(serving);
    HttpClient other(serving.port(), 4096);
    other.send("GET /stalled HTTP/1.1\r\n\r\n");
    EXPECT_EQ(other.answer().status, 200);
    stalled->push(std::string(std::size_t{64} << 20U, 'x') + "\n\n");
    other.read(1);
    control->push("event\n\n");
    EXPECT_EQ(HttpClient(serving.port()).ask("HEAD /stream").status, 200);
    EXPECT_EQ(control->taken(), 0U);
    other.close();
    EXPECT_EQ(reader.readUntil("\n\n"), "event\n\n");
}

TEST_F(Streams, OfManyClientsEachShowTheirEvents) {
    constexpr std::size_t many = 200;
    std::vector<std::shared_ptr<FeedControl>> controls;
    for (std::size_t i = 0; i < many; ++i) controls.push_back(std::make_shared<FeedControl>());
    std::size_t next = 0;
    const Serving serving({}, [&](Request&&, const ScriptedHandler::Reply& answer) {
        answer(std::make_unique<ControlledFeed>(controls[next++]));
    });
    std::vector<HttpClient> clients;
    for (std::size_t i = 0; i < many; ++i) clients.push_back(opened(serving));
    for (const auto& each : controls) each->push("event\n\n");
    for (HttpClient& client : clients) EXPECT_EQ(client.readUntil("\n\n"), "event\n\n");
}

}  // namespace
}  // namespace velkor::http::detail::transport
