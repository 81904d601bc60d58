#include <gtest/gtest.h>

#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <system_error>
#include <thread>
#include <vector>

#include "tests/http/transport/ListenerTesting.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::completes;
using velkor::testing::HttpClient;
using velkor::testing::Latch;

TEST(Stopping, EndsIdleConnections) {
    Serving serving;
    HttpClient silent(serving.port());
    HttpClient used(serving.port());
    EXPECT_EQ(used.ask("GET /").status, 200);
    HttpClient halfway(serving.port());
    halfway.send("GET / HT");
    serving.listener->stop();
    EXPECT_EQ(silent.readToEnd(), "");
    EXPECT_EQ(used.readToEnd(), "");
    EXPECT_EQ(halfway.readToEnd(), "");
    EXPECT_EQ(serving.counts->connectionsOpen, 0U);
}

TEST(Stopping, LetsNobodyIn) {
    Serving serving;
    const std::uint16_t port = serving.port();
    serving.listener->stop();
    EXPECT_THROW(HttpClient{port}, std::system_error);
}

TEST(Stopping, EndsStreams) {
    const auto control = std::make_shared<FeedControl>();
    Serving serving({}, streaming(control));
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("GET /stream").status, 200);
    serving.listener->stop();
    EXPECT_TRUE(control->ended.isOpen());
    EXPECT_EQ(client.readToEnd(), "");
    EXPECT_EQ(serving.counts->streamsOpen, 0U);
}

TEST(Stopping, WaitsForAnAnswerThatIsUnderWay) {
    Latch asked;
    ScriptedHandler::Reply reply;
    Serving serving({}, [&](Request&&, const ScriptedHandler::Reply& answer) {
        reply = answer;
        asked.countDown();
    });
    HttpClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n\r\n");
    ASSERT_TRUE(asked.wait());
    HttpClient idle(serving.port());
    std::thread stopping([&] { serving.listener->stop(); });
    EXPECT_EQ(idle.readToEnd(), "");  // so it has begun
    reply(ScriptedHandler::text("in time"));
    const auto answer = client.answer();
    EXPECT_EQ(answer.body, "in time");
    EXPECT_EQ(answer.header("Connection"), "close");
    stopping.join();
}

TEST(Stopping, GivesUpAnAnswerThatDoesNotCome) {
    Latch asked;
    ScriptedHandler::Reply reply;
    Serving serving({}, [&](Request&&, const ScriptedHandler::Reply& answer) {
        reply = answer;
        asked.countDown();
    });
    HttpClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n\r\n");
    ASSERT_TRUE(asked.wait());
    serving.listener->stop();
    EXPECT_EQ(client.readToEnd(), "");
    serving.listener.reset();
    reply(ScriptedHandler::text("too late"));
}

TEST(Stopping, GivesUpAnAnswerThatNobodyReads) {
    Serving serving({}, [](Request&&, const ScriptedHandler::Reply& answer) {
        answer(ScriptedHandler::text(std::string(std::size_t{64} << 20U, 'x')));
    });
    HttpClient client(serving.port(), 4096);
    client.send("GET / HTTP/1.1\r\n\r\n");
    client.readUntil("\r\n\r\n");
    EXPECT_TRUE(completes([&] { serving.listener->stop(); }));
}

TEST(Stopping, DoesNotMindAnEventThatComesLate) {
    const auto control = std::make_shared<FeedControl>();
    Serving serving({}, streaming(control));
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("GET /stream").status, 200);
    ASSERT_TRUE(control->started.wait());
    const auto ready = control->ready();
    serving.listener->stop();
    ready();
    serving.listener.reset();
    ready();
}

TEST(Stopping, RacesWithEvents) {
    for (int round = 0; round < 50; ++round) {
        const auto control = std::make_shared<FeedControl>();
        Serving serving({}, streaming(control));
        HttpClient client(serving.port());
        EXPECT_EQ(client.ask("GET /stream").status, 200);
        Latch together(2);
        std::thread pusher([&] {
            if (!together.arriveAndWait()) return;
            for (int i = 0; i < 100; ++i) control->push("event\n\n");
        });
        EXPECT_TRUE(together.arriveAndWait());
        serving.listener->stop();
        EXPECT_TRUE(control->ended.isOpen());
        pusher.join();
    }
}

TEST(Stopping, RacesWithClientsThatCome) {
    for (int round = 0; round < 20; ++round) {
        ServerOptions options;
        options.threads = 2;
        Serving serving(options);
        Latch together(2);
        std::thread comer([&, port = serving.port()] {
            if (!together.arriveAndWait()) return;
            try {
                for (;;) HttpClient(port).ask("GET /");
            } catch (const std::exception&) {
                return;  // nobody listens any more
            }
        });
        EXPECT_TRUE(together.arriveAndWait());
        serving.listener->stop();
        comer.join();
        EXPECT_EQ(serving.counts->connectionsOpen, 0U);
    }
}

TEST(Stopping, MayBeDoneByManyAtOnceAndAgain) {
    Serving serving;
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("GET /").status, 200);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) threads.emplace_back([&] { serving.listener->stop(); });
    for (std::thread& thread : threads) thread.join();
    EXPECT_TRUE(serving.listener->stop());
}

TEST(Stopping, FromItsOwnThreadDoesNotWaitForItself) {
    Listener* listener = nullptr;
    Latch stopped;
    Serving serving({}, [&](Request&& request, const ScriptedHandler::Reply& answer) {
        EXPECT_FALSE(listener->stop());
        stopped.countDown();
        answer(ScriptedHandler::echo(request));
    });
    listener = serving.listener.get();
    HttpClient client(serving.port());
    client.send("GET /stop HTTP/1.1\r\n\r\n");
    ASSERT_TRUE(stopped.wait());
    EXPECT_TRUE(listener->stop());
    EXPECT_EQ(client.answer().body, "GET /stop ");
}

}  // namespace
}  // namespace velkor::http::detail::transport
