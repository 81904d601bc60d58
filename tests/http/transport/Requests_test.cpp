#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "http/Refused.hpp"
#include "tests/http/transport/ListenerTesting.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::HttpAnswer;
using velkor::testing::HttpClient;
using velkor::testing::Latch;
using velkor::testing::TemporaryFile;

TEST(Requests, AreAnswered) {
    const Serving serving;
    HttpClient client(serving.port());
    const HttpAnswer answer = client.ask("GET /path?query");
    EXPECT_EQ(answer.status, 200);
    EXPECT_EQ(answer.body, "GET /path?query ");
    EXPECT_EQ(answer.header("Content-Type"), "text/plain");
    EXPECT_EQ(answer.header("Cache-Control"), "no-store");
    EXPECT_EQ(answer.header("X-Content-Type-Options"), "nosniff");
    EXPECT_EQ(answer.header("Date").size(), std::string("Sun, 06 Nov 1994 08:49:37 GMT").size());
}

TEST(Requests, SayWhoSendsThem) {
    const auto tellClient = [](Request&& request, const ScriptedHandler::Reply& answer) {
        answer(ScriptedHandler::text(request.client.address));
    };
    const TemporaryFile folder("");
    const std::string path = folder.path().string() + ".socket";
    ServerOptions options;
    options.endpoints = {"127.0.0.1:0", "unix:" + path};
    const Serving serving(options, tellClient);
    HttpClient tcp(serving.port());
    HttpClient local(path);

    sockaddr_in own{};
    socklen_t size = sizeof own;
    ::getsockname(tcp.socket(), static_cast<sockaddr*>(static_cast<void*>(&own)), &size);
    EXPECT_EQ(tcp.ask("GET /").body, "127.0.0.1:" + std::to_string(ntohs(own.sin_port)));
    EXPECT_EQ(local.ask("GET /").body, "unix");
}

TEST(Requests, FollowEachOtherOnOneConnection) {
    const Serving serving;
    HttpClient client(serving.port());
    for (int i = 0; i < 3; ++i) {
        const std::string path = "/" + std::to_string(i);
        EXPECT_EQ(client.ask("GET " + path).body, "GET " + path + " ");
    }
    EXPECT_EQ(serving.counts->connectionsAccepted, 1U);
}

TEST(Requests, ThatComeTogetherAreAnsweredInTurn) {
    const Serving serving;
    HttpClient client(serving.port());
    std::string requests;
    for (int i = 0; i < 20; ++i) requests += "GET /" + std::to_string(i) + " HTTP/1.1\r\n\r\n";
    client.send(requests);
    for (int i = 0; i < 20; ++i) {
        EXPECT_EQ(client.answer().body, "GET /" + std::to_string(i) + " ");
    }
}

TEST(Requests, AreUnderstoodByteByByte) {
    const Serving serving;
    HttpClient client(serving.port());
    const std::string request = "POST /slow HTTP/1.1\r\nContent-Length: 4\r\n\r\nbody";
    for (const char byte : request) client.send({&byte, 1});
    EXPECT_EQ(client.answer().body, "POST /slow body");
}

TEST(Requests, OfTheLargestSizeAreAnswered) {
    const Serving serving;
    HttpClient client(serving.port());
    const std::string body(ServerOptions().maxBodyBytes, 'b');
    const std::string length = "Content-Length: " + std::to_string(body.size()) + "\r\n";
    // The answer holds the body: it is written while the client reads.
    client.send("POST / HTTP/1.1\r\n" + length + "\r\n" + body);
    EXPECT_EQ(client.answer().body, "POST / " + body);
}

TEST(Requests, ForTheHeadGetNoBody) {
    const Serving serving;
    HttpClient client(serving.port());
    const HttpAnswer head = client.ask("HEAD /here");
    EXPECT_EQ(head.status, 200);
    EXPECT_EQ(head.header("Content-Length"), "11");
    EXPECT_EQ(client.ask("GET /").body, "GET / ");
}

TEST(Requests, ForTheHeadDoNotTakeTheBodyFromALaterRefusal) {
    const Serving serving;
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("HEAD /here").status, 200);
    client.send("nonsense\r\n\r\n");
    EXPECT_EQ(client.answer().body, "refused with 400");
}

TEST(Requests, WithoutAnythingToSayGetNoLength) {
    const Serving serving({}, [](Request&&, const ScriptedHandler::Reply& answer) {
        Response nothing;
        nothing.status = 204;
        answer(std::move(nothing));
    });
    HttpClient client(serving.port());
    const HttpAnswer answer = client.ask("GET /");
    EXPECT_EQ(answer.status, 204);
    EXPECT_EQ(answer.header("Content-Length"), "");
    EXPECT_EQ(client.ask("GET /").status, 204);
}

TEST(Requests, ThatHoldBackTheirBodyAreInvited) {
    const Serving serving;
    HttpClient client(serving.port());
    client.send("POST / HTTP/1.1\r\nContent-Length: 2\r\nExpect: 100-continue\r\n\r\n");
    EXPECT_EQ(client.readUntil("\r\n\r\n"), "HTTP/1.1 100 Continue\r\n\r\n");
    client.send("ab");
    EXPECT_EQ(client.answer().body, "POST / ab");
}

TEST(Requests, ThatHoldBackTooLargeABodyAreRefusedAtOnce) {
    const Serving serving;
    HttpClient client(serving.port());
    client.send("POST / HTTP/1.1\r\nContent-Length: 2000000\r\nExpect: 100-continue\r\n\r\n");
    EXPECT_EQ(client.answer().status, 413);
}

TEST(Requests, CloseTheConnectionAsTheyWish) {
    struct Row {
        const char* request;
        bool closes;
        const char* connection;
    };
    const Row rows[] = {{"GET / HTTP/1.0\r\n\r\n", true, "close"},
                        {"GET / HTTP/1.0\r\nConnection: keep-alive\r\n\r\n", false, "keep-alive"},
                        {"GET / HTTP/1.1\r\nConnection: close\r\n\r\n", true, "close"},
                        {"GET / HTTP/1.1\r\n\r\n", false, ""}};
    const Serving serving;
    for (const Row& row : rows) {
        SCOPED_TRACE(row.request);
        HttpClient client(serving.port());
        client.send(row.request);
        EXPECT_EQ(client.answer().header("Connection"), row.connection);
        if (row.closes) {
            EXPECT_EQ(client.readToEnd(), "");
        } else {
            EXPECT_EQ(client.ask("GET /again").status, 200);
        }
    }
}

TEST(Requests, OfAClientThatSendsNoMoreAreAnswered) {
    const Serving serving;
    HttpClient client(serving.port());
    client.send("GET /a HTTP/1.1\r\n\r\nGET /b HTTP/1.1\r\n\r\n");
    client.endSending();
    EXPECT_EQ(client.answer().body, "GET /a ");
    EXPECT_EQ(client.answer().body, "GET /b ");
    EXPECT_EQ(client.readToEnd(), "");
}

TEST(Requests, AreAnsweredFromAnyThreadLater) {
    std::vector<std::thread> threads;
    {
        const Serving serving(
            {}, [&threads](Request&& request, const ScriptedHandler::Reply& answer) {
                threads.emplace_back([answer, response = ScriptedHandler::echo(request)]() mutable {
                    answer(std::move(response));
                });
            });
        HttpClient client(serving.port());
        for (int i = 0; i < 10; ++i) EXPECT_EQ(client.ask("GET /later").body, "GET /later ");
    }
    for (std::thread& thread : threads) thread.join();
}

TEST(Requests, OfManyClientsAreAnsweredByAllThreads) {
    ServerOptions options;
    options.threads = 4;
    const Serving serving(options);
    std::vector<HttpClient> clients;
    for (int i = 0; i < 16; ++i) clients.emplace_back(serving.port());
    for (int round = 0; round < 5; ++round) {
        for (HttpClient& client : clients) client.send("GET /x HTTP/1.1\r\n\r\n");
        for (HttpClient& client : clients) EXPECT_EQ(client.answer().body, "GET /x ");
    }
}

TEST(Requests, WithoutMemoryForTheirAnswerEndTheirConnectionOnly) {
    const Serving serving({}, [](Request&& request, const ScriptedHandler::Reply& answer) {
        if (request.target == "/scarce") throw std::bad_alloc();
        answer(ScriptedHandler::echo(request));
    });
    HttpClient other(serving.port());
    EXPECT_EQ(other.ask("GET /").status, 200);
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("GET /scarce").status, 0);
    EXPECT_EQ(other.ask("GET /").status, 200);
}

TEST(Requests, WhoseAnswerIsLostAreRefused) {
    ServerOptions options;
    options.commentInterval = std::chrono::milliseconds(10);
    const Serving serving(options, [](Request&&, const ScriptedHandler::Reply&) {});
    HttpClient client(serving.port());
    const HttpAnswer answer = client.ask("GET /");
    EXPECT_EQ(answer.body, "refused with 503");
    EXPECT_EQ(answer.header("Connection"), "close");
}

TEST(Requests, WaitForAnAnswerThatIsStillToCome) {
    ServerOptions options;
    options.commentInterval = std::chrono::milliseconds(10);
    const auto control = std::make_shared<FeedControl>();
    ScriptedHandler::Reply kept;
    const Serving serving(options, [&](Request&& request, ScriptedHandler::Reply answer) {
        if (request.target == "/stream") return answer(std::make_unique<ControlledFeed>(control));
        kept = std::move(answer);
        control->push("kept\n\n");
    });
    HttpClient clock(serving.port());
    EXPECT_EQ(clock.ask("GET /stream").status, 200);
    HttpClient client(serving.port());
    client.send("GET /slow HTTP/1.1\r\n\r\n");
    while (clock.readUntil("\n\n") != "kept\n\n") continue;
    for (int comments = 0; comments < 3; ++comments) clock.readUntil("\n\n");
    EXPECT_EQ(control->taken(), 1U);
    std::exchange(kept, nullptr)(ScriptedHandler::text("late"));
    EXPECT_EQ(client.answer().body, "late");
}

TEST(Requests, ThatAreObjectedToAreNotReadToTheirEnd) {
    const Serving serving;
    HttpClient client(serving.port());
    client.send("POST /forbidden HTTP/1.1\r\nContent-Length: 1000000\r\n\r\nbeginning");
    const HttpAnswer answer = client.answer();
    EXPECT_EQ(answer.body, "not even its body");
    EXPECT_EQ(answer.header("Connection"), "close");
    EXPECT_EQ(serving.counts->requestsRead, 0U);
}

TEST(Requests, ThatAreObjectedToAreNotInvited) {
    const Serving serving;
    HttpClient client(serving.port());
    client.send("POST /forbidden HTTP/1.1\r\nContent-Length: 2\r\nExpect: 100-continue\r\n\r\n");
    EXPECT_EQ(client.answer().status, 403);
}

TEST(Requests, OfManyClientsTakeABoundedAmountOfMemory) {
    ServerOptions options;
    options.maxBufferedBytes = 100'000;
    const Serving serving(options);
    const std::string beginning =
        "POST / HTTP/1.1\r\nContent-Length: 70001\r\n\r\n" + std::string(70'000, 'b');
    HttpClient first(serving.port());
    first.send(beginning);
    EXPECT_TRUE(eventually([&] { return serving.counts->bytesRead == beginning.size(); }));
    HttpClient second(serving.port());
    second.send(beginning + "b");
    EXPECT_EQ(second.answer().status, 503);
    EXPECT_EQ(HttpClient(serving.port()).ask("GET /").status, 200);
    first.send("b");
    EXPECT_EQ(first.answer().status, 200);
}

TEST(Requests, MayTakeMoreThanTheirShareWhenTheyAreAlone) {
    ServerOptions options;
    options.maxBufferedBytes = 1;
    const Serving serving(options);
    HttpClient client(serving.port());
    for (int i = 0; i < 2; ++i) {
        client.send("POST / HTTP/1.1\r\nContent-Length: 100000\r\n\r\n" +
                    std::string(100'000, 'b'));
        EXPECT_EQ(client.answer().body.size(), 100'007U);
    }
}

TEST(Requests, WhoseAnswersAreNotReadLeaveRoomForOthers) {
    ServerOptions options;
    options.maxBufferedBytes = std::size_t{65} << 20U;
    const Serving serving(options, [](Request&& request, const ScriptedHandler::Reply& answer) {
        constexpr std::size_t much = std::size_t{64} << 20U;
        answer(request.target == "/" ? ScriptedHandler::echo(request)
                                     : ScriptedHandler::text(std::string(much, 'x')));
    });
    HttpClient first(serving.port(), 4096);
    first.send("GET /much HTTP/1.1\r\n\r\n");
    first.read(1);
    HttpClient second(serving.port());
    EXPECT_EQ(second.ask("GET /much").body, "refused with 503");
    EXPECT_EQ(second.ask("GET /").status, 200);
    EXPECT_EQ(serving.counts->answersRefused, 1U);
    first.close();
    EXPECT_TRUE(eventually([&] { return second.ask("GET /much").status == 200; }));
}

struct Hostile {
    const char* name;
    int status;
    std::string bytes;
};

std::vector<Hostile> hostile() {
    return {{"NotHttp", 400, "\x16\x03\x01 whatever\r\n\r\n"},
            {"LengthAndCoding", 400,
             "POST / HTTP/1.1\r\nContent-Length: 4\r\nTransfer-Encoding: chunked\r\n\r\n"
             "0\r\n\r\nGET /smuggled HTTP/1.1\r\n\r\n"},
            {"TwoLengths", 400,
             "POST / HTTP/1.1\r\nContent-Length: 0\r\nContent-Length: 26\r\n\r\n"
             "GET /smuggled HTTP/1.1\r\n\r\n"},
            {"HugeTarget", 431, "GET /" + std::string(1'000'000, 'a') + " HTTP/1.1\r\n\r\n"},
            {"HugeHeader", 431, "GET / HTTP/1.1\r\nX: " + std::string(1'000'000, 'a') + "\r\n\r\n"},
            {"HugeExtension", 431,
             "POST / HTTP/1.1\r\nTransfer-Encoding: chunked\r\n\r\n1;" +
                 std::string(1'000'000, 'a') + "\r\na\r\n0\r\n\r\n"},
            {"HugeBody", 413,
             "POST / HTTP/1.1\r\nContent-Length: 3000000\r\n\r\n" + std::string(3'000'000, 'a')}};
}

TEST(Requests, ThatAreRefusedGetTheirAnswerAndNoOther) {
    const Serving serving;
    for (const Hostile& sample : hostile()) {
        SCOPED_TRACE(sample.name);
        HttpClient client(serving.port());
        client.send(sample.bytes);
        const HttpAnswer answer = client.answer();
        EXPECT_EQ(answer.status, sample.status);
        EXPECT_EQ(answer.body, "refused with " + std::to_string(sample.status));
        EXPECT_EQ(answer.header("Connection"), "close");
        EXPECT_EQ(client.readToEnd(), "");
    }
    EXPECT_EQ(serving.counts->requestsRead, 0U);
    EXPECT_EQ(serving.counts->requestsRefused, hostile().size());
}

TEST(Requests, OfClientsThatBreakOffHarmNobody) {
    const Serving serving;
    const std::string request = "POST /x HTTP/1.1\r\nContent-Length: 5\r\n\r\nabcde";
    for (std::size_t length = 0; length <= request.size(); ++length) {
        HttpClient closed(serving.port());
        closed.send(request.substr(0, length));
        closed.close();
        HttpClient reset(serving.port());
        reset.send(request.substr(0, length));
        reset.reset();
    }
    HttpClient client(serving.port());
    EXPECT_EQ(client.ask("GET /").status, 200);
}

TEST(Connections, BeyondTheLimitAreToldSo) {
    ServerOptions options;
    options.maxConnections = 2;
    const Serving serving(options);
    HttpClient first(serving.port());
    HttpClient second(serving.port());
    EXPECT_EQ(first.ask("GET /").status, 200);
    EXPECT_EQ(second.ask("GET /").status, 200);
    {
        HttpClient third(serving.port());
        EXPECT_EQ(third.answer().body, "refused with 503");
        EXPECT_EQ(third.readToEnd(), "");
    }
    EXPECT_EQ(serving.counts->connectionsRefused, 1U);
    EXPECT_EQ(first.ask("GET /").status, 200);
}

TEST(Connections, OfOneAddressHaveALimitOfTheirOwn) {
    const TemporaryFile folder("");
    ServerOptions options;
    options.endpoints = {"127.0.0.1:0", "unix:" + folder.path().string() + ".socket"};
    options.maxConnectionsPerAddress = 1;
    const Serving serving(options);
    HttpClient first(serving.port());
    EXPECT_EQ(first.ask("GET /").status, 200);
    EXPECT_EQ(HttpClient(serving.port()).answer().status, 503);
    HttpClient local(folder.path().string() + ".socket");
    HttpClient otherLocal(folder.path().string() + ".socket");
    EXPECT_EQ(local.ask("GET /").status, 200);
    EXPECT_EQ(otherLocal.ask("GET /").status, 200);
}

TEST(Connections, ThatEndMakeRoom) {
    ServerOptions options;
    options.maxConnections = 1;
    const Serving serving(options);
    for (int i = 0; i < 5; ++i) {
        HttpClient client(serving.port());
        EXPECT_EQ(client.ask("GET /", "Connection: close\r\n").status, 200);
        client.close();
        // The end is noticed when the server gets to it.
        EXPECT_TRUE(eventually([&] { return serving.counts->connectionsOpen == 0; }));
    }
}

}  // namespace
}  // namespace velkor::http::detail::transport
