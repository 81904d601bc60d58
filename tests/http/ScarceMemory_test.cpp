// Servers whose threads are short of memory, and those who stop them.

#include <gtest/gtest.h>
#include <poll.h>

#include <chrono>
#include <cstddef>
#include <memory>
#include <new>
#include <string>
#include <thread>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "http/Server.hpp"
#include "tests/http/transport/ListenerTesting.hpp"
#include "tests/support/ScarceMemory.hpp"

namespace velkor::http {
namespace {

using configuration::ConfigurationImpl;
using velkor::testing::AllocationFailure;
using velkor::testing::AllocationFailureElsewhere;
using velkor::testing::HttpClient;
using velkor::testing::Shortage;

class ServersShortOfMemory : public ::testing::TestWithParam<Shortage> {
protected:
    ServersShortOfMemory() {
        options.allowWrites = true;
        options.commentInterval = std::chrono::milliseconds(50);
        store->set("key", 1);
    }

    /// Whether the server has said something, or closed the connection.
    static bool hasHeard(const HttpClient& client) {
        pollfd waiting{client.socket(), POLLIN, 0};
        return ::poll(&waiting, 1, 0) > 0;
    }

    /// Has a client say `request` to a new server, the n-th allocation of whose threads fails,
    /// n = 1, 2, ... until it gets past all of them. The shortage is over when it has been met. The
    /// client, unless it was answered, is told or let go, and the next one is served.
    void expectServedAfter(const std::string& request) {
        bool ranOut = true;
        for (std::size_t successes = 0; ranOut && !HasFailure(); ++successes) {
            SCOPED_TRACE(successes);
            const Server server(store, options);
            HttpClient client(server.port());
            {
                const AllocationFailureElsewhere failure(successes, GetParam());
                client.send(request);
                while (!failure.hasHappened() && !hasHeard(client)) std::this_thread::yield();
                ranOut = failure.hasHappened();
            }
            EXPECT_NO_THROW(client.answer());
            EXPECT_EQ(HttpClient(server.port()).ask("GET /config/key").status, 200);
        }
    }

    const std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    ServerOptions options;
};

TEST_P(ServersShortOfMemory, AnswerOrLetGoWhoReads) {
    expectServedAfter("GET /config/key HTTP/1.1\r\nHost: localhost\r\n\r\n");
}

TEST_P(ServersShortOfMemory, AnswerOrLetGoWhoWrites) {
    const std::string body =
        R"({"changes":[{"key":"key","value":{"type":"string","value":"next"}}]})";
    expectServedAfter("PATCH /config HTTP/1.1\r\nHost: localhost\r\nContent-Length: " +
                      std::to_string(body.size()) + "\r\n\r\n" + body);
}

TEST_P(ServersShortOfMemory, AnswerOrLetGoWhoWatches) {
    expectServedAfter("GET /watch?key=key HTTP/1.1\r\nHost: localhost\r\n\r\n");
    expectServedAfter("GET /changes HTTP/1.1\r\nHost: localhost\r\n\r\n");
}

// Who changes the key has no memory to say so to the thread of the server.
TEST_P(ServersShortOfMemory, ShowTheChangeBehindOneThatTheyWereNotToldOf) {
    constexpr int mostPieces = 100;  // comments among them
    bool ranOut = true;
    for (std::size_t successes = 0; ranOut && !HasFailure(); ++successes) {
        SCOPED_TRACE(successes);
        const Server server(store, options);
        HttpClient client(server.port());
        EXPECT_EQ(client.ask("GET /watch?key=key").status, 200);
        client.readUntil("\n\n");
        {
            const AllocationFailure failure(successes, GetParam());
            try {
                store->set("key", static_cast<int>(successes));
            } catch (const std::bad_alloc&) {
            }
            ranOut = failure.hasHappened();
        }
        const std::string last = "last of " + std::to_string(successes);
        store->set("key", last);
        std::string told = client.readUntil("\n\n");
        for (int pieces = 0; told.find(last) == std::string::npos && pieces < mostPieces;
             ++pieces) {
            told = client.readUntil("\n\n");
        }
        EXPECT_NE(told.find(last), std::string::npos) << told;
    }
}

TEST_P(ServersShortOfMemory, Stop) {
    bool ranOut = true;
    for (std::size_t successes = 0; ranOut; ++successes) {
        SCOPED_TRACE(successes);
        Server server(store, options);
        HttpClient client(server.port());
        EXPECT_EQ(client.ask("GET /changes").status, 200);
        {
            const AllocationFailure failure(successes, GetParam());
            server.stop();
            ranOut = failure.hasHappened();
        }
        client.readToEnd();
    }
}

// An answer that is still to come, and a stream whose clients are told that it lives: neither who
// stops the server nor its threads have any memory.
TEST_P(ServersShortOfMemory, StopWhateverIsUnderWay) {
    using detail::transport::ScriptedHandler;
    const auto control = std::make_shared<detail::transport::FeedControl>();
    ScriptedHandler::Reply kept;
    const detail::transport::Serving serving(
        options, [&](detail::Request&& request, ScriptedHandler::Reply answer) {
            if (request.target == "/stream") {
                return answer(std::make_unique<detail::transport::ControlledFeed>(control));
            }
            kept = std::move(answer);
            control->push("kept\n\n");
        });
    HttpClient clock(serving.port());
    EXPECT_EQ(clock.ask("GET /stream").status, 200);
    HttpClient waiting(serving.port());
    waiting.send("GET /slow HTTP/1.1\r\n\r\n");
    while (clock.readUntil("\n\n") != "kept\n\n") continue;
    EXPECT_EQ(control->taken(), 1U);
    {
        const AllocationFailureElsewhere failure(0, GetParam());
        for (int comments = 0; comments < 3; ++comments) clock.readUntil("\n\n");
        const AllocationFailure ownFailure(0, GetParam());
        serving.listener->stop();
    }
    EXPECT_EQ(waiting.readToEnd(), "");
    kept = nullptr;
}

INSTANTIATE_TEST_SUITE_P(Shortages, ServersShortOfMemory,
                         ::testing::Values(Shortage::once, Shortage::lasting),
                         velkor::testing::nameOfShortage);

}  // namespace
}  // namespace velkor::http
