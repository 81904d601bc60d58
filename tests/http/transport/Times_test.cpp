#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "tests/http/transport/ListenerTesting.hpp"

namespace velkor::http::detail::transport {
namespace {

using std::chrono::milliseconds;
using velkor::testing::HttpAnswer;
using velkor::testing::HttpClient;

constexpr milliseconds brief{50};

TEST(Times, ARequestThatIsNotCompleteInTimeIsToldSo) {
    ServerOptions options;
    options.requestTimeout = brief;
    const Serving serving(options);
    for (const char* const beginning :
         {"G", "GET / HTTP/1.1\r\nX: ", "POST / HTTP/1.1\r\nContent-Length: 9\r\n\r\nabc",
          "POST / HTTP/1.1\r\nTransfer-Encoding: chunked\r\n\r\n3\r\na"}) {
        SCOPED_TRACE(beginning);
        HttpClient client(serving.port());
        client.send(beginning);
        const HttpAnswer answer = client.answer();
        EXPECT_EQ(answer.body, "refused with 408");
        EXPECT_EQ(answer.header("Connection"), "close");
    }
    EXPECT_EQ(serving.counts->requestsTimedOut, 4U);
}

TEST(Times, EachByteThatComesGivesARequestNoMoreTime) {
    ServerOptions options;
    options.requestTimeout = brief;
    options.maxHeaderBytes = std::size_t{1} << 30U;
    const Serving serving(options);
    HttpClient client(serving.port());
    client.send("GET / HTTP/1.1\r\n");
    EXPECT_TRUE(eventually([&] {
        client.send("X: y\r\n");
        return serving.counts->requestsTimedOut > 0;
    }));
    EXPECT_EQ(client.answer().status, 408);
}

TEST(Times, AnIdleConnectionIsClosed) {
    ServerOptions options;
    options.idleTimeout = brief;
    const Serving serving(options);
    HttpClient silent(serving.port());
    HttpClient used(serving.port());
    EXPECT_EQ(used.ask("GET /").status, 200);
    EXPECT_EQ(silent.readToEnd(), "");
    EXPECT_EQ(used.readToEnd(), "");
}

TEST(Times, AnAnswerThatNobodyReadsIsGivenUp) {
    ServerOptions options;
    options.writeTimeout = brief;
    const Serving serving(options, [](Request&& request, const ScriptedHandler::Reply& answer) {
        constexpr std::size_t tooMuch = std::size_t{64} << 20U;
        answer(request.target == "/" ? ScriptedHandler::echo(request)
                                     : ScriptedHandler::text(std::string(tooMuch, 'x')));
    });
    HttpClient client(serving.port(), 4096);
    client.send("GET /much HTTP/1.1\r\n\r\n");
    EXPECT_TRUE(eventually([&] { return serving.counts->writesTimedOut > 0; }));
    EXPECT_EQ(HttpClient(serving.port()).ask("GET /").status, 200);
}

TEST(Times, AnAnswerMayTakeLongerThanARequest) {
    ServerOptions options;
    options.requestTimeout = milliseconds(1);
    options.idleTimeout = milliseconds(1);
    options.writeTimeout = milliseconds(1);
    velkor::testing::Latch expired;
    std::thread answering;
    {
        const Serving serving(options,
                              [&](Request&& request, const ScriptedHandler::Reply& answer) {
                                  if (request.target == "/other") return expired.countDown();
                                  answering = std::thread([&expired, answer] {
                                      if (expired.wait()) answer(ScriptedHandler::text("late"));
                                  });
                              });
        HttpClient client(serving.port());
        client.send("GET /slow HTTP/1.1\r\n\r\n");
        // By now the times are up many times over.
        EXPECT_EQ(HttpClient(serving.port()).readToEnd(), "");
        HttpClient other(serving.port());
        other.send("GET /other HTTP/1.1\r\n\r\n");
        EXPECT_EQ(client.answer().body, "late");
    }
    answering.join();
}

}  // namespace
}  // namespace velkor::http::detail::transport
