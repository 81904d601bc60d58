#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "configuration/sources/MonitoredSource.hpp"
#include "http/Refused.hpp"
#include "tests/http/routes/ServiceTesting.hpp"
#include "tests/support/HookedSource.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

using velkor::testing::Headers;
using velkor::testing::LogCapture;
using velkor::testing::problemIn;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

constexpr const char* change = R"({"changes":[{"key":"k","value":{"type":"int","value":1}}]})";

class UnwellSource final : public velkor::testing::HookedSource,
                           public configuration::MonitoredSource {
public:
    configuration::SourceState state() const override { return {false}; }
};

class AccessTest : public velkor::testing::ServiceTest {
protected:
    int statusWith(const Headers& headers) { return get("/sources", headers).status; }

    int patchWith(const Headers& headers) {
        return send("PATCH", "/config", change, headers).status;
    }
};

TEST_F(AccessTest, RefusesNamesThatAreNotItsOwn) {
    for (const char* const path : {"/", "/healthz", "/sources", "/nothing"}) {
        EXPECT_EQ(problemIn(get(path, {{"host", "rebound.example.org:80"}})),
                  "403 /problems/forbidden No name of this server: rebound.example.org:80");
    }
}

TEST_F(AccessTest, NeedsAName) {
    Request nameless = request("GET", "/sources");
    nameless.headers.clear();
    EXPECT_EQ(problemIn(sendRequest(std::move(nameless))),
              R"(400 /problems/bad-request The header \"host\" is missing.)");
}

TEST_F(AccessTest, RefusesWhatItCouldReadInTwoWays) {
    options.tokenFile.clear();
    for (const char* const name : {"host", "origin", "authorization", "sec-fetch-site"}) {
        Request doubled = request("GET", "/sources");
        doubled.headers = {{"host", "localhost"}, {name, "localhost"}, {name, "localhost"}};
        EXPECT_EQ(problemIn(sendRequest(std::move(doubled))),
                  R"(400 /problems/bad-request The header \")" + std::string(name) +
                      R"(\" was sent twice.)");
    }
}

TEST_F(AccessTest, TakesItsOwnOrigin) {
    EXPECT_EQ(statusWith({{"host", "localhost:80"}, {"origin", "http://localhost:80"}}), 200);
    EXPECT_EQ(statusWith({{"host", "localhost:80"}, {"origin", "HTTP://LOCALHOST:80"}}), 200);
}

TEST_F(AccessTest, RefusesOtherOrigins) {
    for (const char* const origin :
         {"http://example.org", "https://localhost:80", "http://localhost", "null", "",
          "http://localhost:81", "http://localhost:80/", "http://localhost:80.example.org",
          "localhost:80"}) {
        EXPECT_EQ(statusWith({{"host", "localhost:80"}, {"origin", origin}}), 403) << origin;
        EXPECT_EQ(patchWith({{"host", "localhost:80"}, {"origin", origin}}), 403) << origin;
    }
    EXPECT_FALSE(store->has("k").get());
}

TEST_F(AccessTest, TakesTheOriginOfTls) {
    Request secure = request("GET", "/sources", "", {{"origin", "https://localhost"}});
    secure.client.secure = true;
    EXPECT_EQ(sendRequest(std::move(secure)).status, 200);
    Request downgraded = request("GET", "/sources", "", {{"origin", "http://localhost"}});
    downgraded.client.secure = true;
    EXPECT_EQ(sendRequest(std::move(downgraded)).status, 403);
}

TEST_F(AccessTest, TakesBothOriginsBehindAProxy) {
    options.behindProxy = true;
    EXPECT_EQ(statusWith({{"origin", "https://localhost"}}), 200);
    EXPECT_EQ(statusWith({{"origin", "http://localhost"}}), 200);
    EXPECT_EQ(statusWith({{"origin", "https://example.org"}}), 403);
}

TEST_F(AccessTest, RefusesRequestsOfOtherSites) {
    EXPECT_EQ(statusWith({{"sec-fetch-site", "cross-site"}}), 403);
    EXPECT_EQ(statusWith({{"sec-fetch-site", "same-site"}}), 403);
    EXPECT_EQ(statusWith({{"sec-fetch-site", "same-origin"}}), 200);
    EXPECT_EQ(statusWith({{"sec-fetch-site", "none"}}), 200);
}

TEST_F(AccessTest, LetsOtherSitesLeadToThePage) {
    EXPECT_EQ(get("/?from=elsewhere", {{"sec-fetch-site", "cross-site"}}).status, 200);
}

TEST_F(AccessTest, LetsNobodyWriteUnlessToldTo) {
    options.allowWrites = false;
    const Response refused = send("PATCH", "/config", change);
    EXPECT_EQ(problemIn(refused), "403 /problems/forbidden Nobody may write here.");
    EXPECT_EQ(message("ConfigurationSet", R"({"key":"k"})").status, 403);
    EXPECT_EQ(message("AddPropertyFileSource", R"({"name":"n"})").status, 403);
    EXPECT_EQ(message("ConfigurationGet", R"({"key":"k"})").status, 200);
    EXPECT_FALSE(store->has("k").get());
}

class TokenAccessTest : public AccessTest {
protected:
    TokenAccessTest() { options.tokenFile = file.path(); }

    static Headers bearer(const std::string& token) {
        return {{"authorization", "Bearer " + token}};
    }

    const TemporaryFile file{"read rrr\nwrite www\n"};
};

TEST_F(TokenAccessTest, NeedsATokenThatIsKnown) {
    for (const Headers& headers : std::vector<Headers>{{},
                                                       bearer("x"),
                                                       bearer(""),
                                                       bearer("rr"),
                                                       {{"authorization", "rrr"}},
                                                       {{"authorization", "Basic rrr"}},
                                                       {{"authorization", "Bearer"}},
                                                       {{"authorization", "Bearer  rrr"}}}) {
        const Response refused = get("/sources", headers);
        EXPECT_EQ(problemIn(refused),
                  "401 /problems/unauthorised A token that is known is needed.");
        EXPECT_EQ(headerOf(refused, "WWW-Authenticate"), "Bearer");
        EXPECT_EQ(patchWith(headers), 401);
    }
}

TEST_F(TokenAccessTest, LetsAReaderRead) {
    EXPECT_EQ(statusWith(bearer("rrr")), 200);
    EXPECT_EQ(statusWith({{"authorization", "bearer rrr"}}), 200);
}

TEST_F(TokenAccessTest, LetsNoReaderWrite) {
    EXPECT_EQ(problemIn(send("PATCH", "/config", change, bearer("rrr"))),
              "403 /problems/forbidden The token may only read.");
    EXPECT_FALSE(store->has("k").get());
}

TEST_F(TokenAccessTest, LetsAWriterDoBoth) {
    EXPECT_EQ(statusWith(bearer("www")), 200);
    EXPECT_EQ(patchWith(bearer("www")), 200);
}

TEST_F(TokenAccessTest, LetsAWriterOnlyReadWhereNobodyMayWrite) {
    options.allowWrites = false;
    EXPECT_EQ(statusWith(bearer("www")), 200);
    EXPECT_EQ(patchWith(bearer("www")), 403);
}

TEST_F(TokenAccessTest, NeedsNoneForThePageAndTheProbes) {
    for (const char* const path : {"/", "/healthz", "/readyz"}) {
        EXPECT_EQ(get(path).status, 200) << path;
    }
}

TEST_F(TokenAccessTest, SaysWhetherTheClientMayWrite) {
    const auto mayWrite = [&](const char* token) {
        return get("/sources", bearer(token)).body.substr(0, 17);
    };
    EXPECT_EQ(mayWrite("www"), R"({"mayWrite":true,)");
    EXPECT_EQ(mayWrite("rrr"), R"({"mayWrite":false)");
}

TEST_F(TokenAccessTest, NamesTheLayersThatAreNotWellToReadersOnly) {
    const auto source = std::make_shared<UnwellSource>();
    store->addSource("sick", "", 1, true, source).get();
    EXPECT_EQ(get("/readyz").body, "not ready\n");
    EXPECT_EQ(get("/readyz", bearer("x")).body, "not ready\n");
    EXPECT_EQ(get("/readyz", bearer("rrr")).body, "not ready: sick\n");
}

TEST_F(TokenAccessTest, LeavesARecordOfThoseWhoMayNotWrite) {
    const LogCapture log("velkor::http");
    patchWith(bearer("rrr"));
    patchWith(bearer("rrr"));
    EXPECT_EQ(log.messages(), (std::vector<std::string>{
                                  "write: PATCH /config by token 1 from 127.0.0.1:50312 -> 403",
                                  "write: PATCH /config by token 1 from 127.0.0.1:50312 -> 403"}));
}

TEST_F(TokenAccessTest, LeavesFewRecordsOfThoseWhoMayDoNothing) {
    const LogCapture log("velkor::http");
    const auto begin = std::chrono::steady_clock::now();
    for (int i = 0; i < 50; ++i) patchWith({});
    for (int i = 0; i < 50; ++i) patchWith({{"origin", "http://example.org"}});
    get("/config");
    const auto elapsed =
        std::chrono::duration_cast<std::chrono::seconds>(std::chrono::steady_clock::now() - begin);
    EXPECT_LE(log.messages().size(), static_cast<std::size_t>(elapsed.count()) + 2);
    ASSERT_FALSE(log.messages().empty());
    EXPECT_EQ(log.messages().front(),
              "write: PATCH /config by nobody known from 127.0.0.1:50312 -> 401");
}

TEST_F(AccessTest, RefusesToStartWithoutTheTokensThatAreNamed) {
    options.tokenFile = "/no/such/file";
    EXPECT_EQ(thrownText<Refused>([&] { service(); }),
              "can't read the token file /no/such/file: No such file or directory");
}

}  // namespace
}  // namespace velkor::http::detail
