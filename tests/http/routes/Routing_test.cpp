#include <gtest/gtest.h>

#include <set>
#include <string>
#include <utility>

#include "http/detail/routes/Page.hpp"
#include "http/detail/routes/Route.hpp"
#include "tests/http/routes/ServiceTesting.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::problemIn;

class RoutingTest : public velkor::testing::ServiceTest {};

TEST_F(RoutingTest, FindsNothingWhereThereIsNothing) {
    for (const char* const path :
         {"/nothing", "//", "/config2", "/Config", "/watch/", "/%63onfig", "/velkor/configuration",
          "/./config", "/config#a", "/healthz/"}) {
        EXPECT_EQ(problemIn(get(path)),
                  "404 /problems/not-found There is nothing at " + std::string(path));
    }
}

TEST_F(RoutingTest, RefusesTargetsThatAreNoPaths) {
    for (const char* const target : {"", "*", "http://localhost/config", "config", "?a=b"}) {
        EXPECT_EQ(problemIn(get(target)),
                  "400 /problems/bad-request The target of the request is no path.");
    }
}

TEST_F(RoutingTest, SaysWhichMethodsThereAre) {
    const std::vector<std::pair<std::string, std::string>> cases{
        {"/config", "GET, HEAD, PATCH"},
        {"/config/k", "GET, HEAD"},
        {"/", "GET, HEAD"},
        {"/velkor/configuration/ConfigurationGet", "POST"},
        {"/velkor/configuration/Nobody", "POST"}};
    for (const auto& [path, allowed] : cases) {
        for (const char* const method : {"DELETE", "PUT", "get", "", "BREW"}) {
            const Response refused = send(method, path);
            EXPECT_EQ(problemIn(refused),
                      "405 /problems/method-not-allowed Allowed here: " + allowed);
            EXPECT_EQ(headerOf(refused, "Allow"), allowed);
        }
        const Response answered = send("OPTIONS", path);
        EXPECT_EQ(answered.status, 204);
        EXPECT_EQ(headerOf(answered, "Allow"), allowed);
    }
}

TEST_F(RoutingTest, AnswersHeadAsGet) {
    EXPECT_EQ(send("HEAD", "/healthz").body, get("/healthz").body);
    EXPECT_EQ(send("HEAD", "/config").status, 200);
}

TEST_F(RoutingTest, RefusesTheHeadOfAStreamAsTheStream) {
    EXPECT_EQ(problemIn(send("HEAD", "/watch")), problemIn(get("/watch")));
}

TEST_F(RoutingTest, OpensNoStreamForHead) {
    const Response head = send("HEAD", "/watch?key=k");
    EXPECT_EQ(head.status, 200);
    EXPECT_EQ(head.contentType, "text/event-stream");
}

TEST_F(RoutingTest, RefusesParametersThatItDoesNotKnow) {
    for (const char* const target : {"/config?prefx=a", "/healthz?a", "/config/k?limit=1",
                                     "/watch?key=k&prefix=p", "/metrics?=", "/sources?%20=1"}) {
        EXPECT_EQ(problemIn(get(target)).substr(0, 51),
                  "400 /problems/bad-request Unknown query parameter: ")
            << target;
    }
    EXPECT_EQ(send("PATCH", "/config?dryrun", R"({"changes":[{"key":"k","unset":true}]})").status,
              400);
}

TEST_F(RoutingTest, RefusesParametersThatAreGivenTwice) {
    EXPECT_EQ(problemIn(get("/config?limit=1&limit=1")),
              "400 /problems/bad-request Query parameter given twice: limit");
}

TEST_F(RoutingTest, RefusesWhatIsNotEncodedRight) {
    EXPECT_EQ(problemIn(get("/config?prefix=%")),
              "400 /problems/bad-request The query is not percent-encoded right.");
    EXPECT_EQ(problemIn(get("/config/%4")),
              "400 /problems/bad-request The path is not percent-encoded right.");
}

TEST_F(RoutingTest, CutsWhatProblemsRepeat) {
    // The 300th byte is the first of a character of two.
    const std::string path = "/" + std::string(278, 'a');
    EXPECT_EQ(problemIn(get(path + "\xC3\xA4" + "b")),
              "404 /problems/not-found There is nothing at " + path + "...");
    EXPECT_LT(
        message("ConfigurationSet", R"({"key":")" + std::string(9999, 'k') + R"(","source":"x"})")
            .body.size(),
        500U);
}

TEST_F(RoutingTest, ObjectsToHeadsAsToWholeRequests) {
    options.allowWrites = false;
    const auto objection = [&](Request&& head) {
        const auto found = service().objection(head);
        return found ? problemIn(*found) : "none";
    };
    EXPECT_EQ(objection(request("PATCH", "/config")),
              "403 /problems/forbidden Nobody may write here.");
    EXPECT_EQ(objection(request("POST", "/nothing")),
              "404 /problems/not-found There is nothing at /nothing");
    EXPECT_EQ(objection(request("POST", "/config")),
              "405 /problems/method-not-allowed Allowed here: GET, HEAD, PATCH");
    EXPECT_EQ(objection(request("GET", "/config", "", {{"host", "example.org"}})),
              "403 /problems/forbidden No name of this server: example.org");
    EXPECT_EQ(objection(request("POST", "/velkor/configuration/ConfigurationGet")), "none");
}

TEST_F(RoutingTest, CountsAnObjectionAsAnAnswer) {
    service().objection(request("POST", "/healthz"));
    service().objection(request("POST", "/velkor/configuration/ConfigurationGet"));
    const std::string text = get("/metrics").body;
    EXPECT_NE(text.find("route=\"none\",status=\"405\"} 1\n"), std::string::npos);
    EXPECT_EQ(text.find("ConfigurationGet"), std::string::npos);
}

TEST_F(RoutingTest, SendsThePageWithItsHeaders) {
    const Response page = get("/");
    EXPECT_EQ(page.status, 200);
    EXPECT_EQ(page.contentType, "text/html; charset=utf-8");
    EXPECT_EQ(page.body, pageHtml());
    EXPECT_EQ(headerOf(page, "Content-Security-Policy"), pagePolicy());
}

TEST_F(RoutingTest, HasATextForWhatTheTransportRefuses) {
    const std::vector<std::pair<int, std::string>> cases{
        {400, "400 /problems/bad-request The request is no HTTP that is understood here."},
        {408, "408 /problems/timeout The request was not complete in time."},
        {413, "413 /problems/too-large The body is too large."},
        {431, "431 /problems/headers-too-large The headers are too large."},
        {503,
         "503 /problems/unavailable There are too many connections or streams, or too much is "
         "kept for clients."}};
    for (const auto& [status, text] : cases) {
        EXPECT_EQ(problemIn(service().refusal(status)), text);
    }
    EXPECT_EQ(headerOf(service().refusal(503), "Retry-After"), "1");
}

TEST(Routes, AreTheOnlyOnesOfTheirMethodAndPath) {
    std::set<std::pair<std::string_view, std::string_view>> seen;
    for (const Route& route : routes()) {
        EXPECT_TRUE(seen.insert({route.method, route.path}).second) << route.path;
    }
}

// Whatever changes the store needs the right to, and is kept off the thread of the connection.
TEST(Routes, WriteOnTheWorkerOnly) {
    for (const Route& route : routes()) {
        if (route.right == Right::write) {
            EXPECT_EQ(route.place, Place::worker) << route.path;
            EXPECT_NE(route.method, "GET") << route.path;
        }
    }
}

}  // namespace
}  // namespace velkor::http::detail
