// A source and a server that answers what no engine does.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/ScriptedServer.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {
namespace {

using layers::EtcdOptions;
using layers::EtcdSource;
using layers::StartWithoutServer;
using layers::UnknownOutcome;
using ::testing::ElementsAre;

constexpr const char* rangePath = "/v3/kv/range";
constexpr const char* watchPath = "/v3/watch";

/// Revision 5, with "a", a text of "1".
const std::string& goodRange() {
    static const std::string text = R"({"header":{"cluster_id":"7","revision":"5"},)"
                                    R"("kvs":[{"key":"cC9h","mod_revision":"5","value":"MQ=="}]})";
    return text;
}

EtcdOptions atOnce() {
    EtcdOptions options;
    options.startWithin = std::chrono::milliseconds(0);
    options.withoutServer = StartWithoutServer::empty;
    options.shortestPause = std::chrono::milliseconds(1);
    options.longestPause = std::chrono::milliseconds(10);
    options.longestAnswer = 1U << 20U;
    return options;
}

std::shared_ptr<EtcdSource> follow(const ScriptedServer& server,
                                   const EtcdOptions& options = atOnce()) {
    return EtcdSource::open({server.url()}, "p/", options);
}

bool isLost(const EtcdSource& source, const ScriptedServer& server, const std::string& reason) {
    return comesAbout([&] { return source.state().lastError == server.url() + ": " + reason; });
}

TEST(EtcdHostileServer, IsLeftForWhatItAnswers) {
    const std::vector<std::pair<std::string, std::string>> answers{
        {ScriptedServer::ok("{}"), "JSON answer is of no cluster"},
        {ScriptedServer::ok("<html>"), "JSON lacks a {"},
        {ScriptedServer::ok(goodRange().substr(0, 60)), "JSON text ends in a string"},
        {ScriptedServer::ok(R"({"kvs":[{"key":"?"}]})"), "JSON member is no base64"},
        {ScriptedServer::ok(R"({"new":)" + std::string(100'000, '[')), "JSON is nested too deep"},
        {ScriptedServer::ok(R"({"header":{"cluster_id":"7","revision":"5"},)"
                            R"("kvs":[{"key":"cQ==","mod_revision":"5"}]})"),
         "the answer makes no sense"},
        {"HTTP/1.1 200 OK\r\nContent-Length: 100\r\n\r\n{", "no answer in time"},
        {"HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\n{", "the connection has ended"},
        {ScriptedServer::inParts() + ScriptedServer::endless(), "body limit exceeded"},
        {"HTTP/1.1 200 OK\r\nX: " + std::string(100'000, 'x'), "header limit exceeded"},
        {"SSH-2.0\r\n\r\n", "bad version"}};
    EtcdOptions options = atOnce();
    options.silence = std::chrono::milliseconds(500);
    for (const auto& [answer, reason] : answers) {
        const ScriptedServer server([text = answer](const std::string&) { return text; });
        const auto source = follow(server, options);
        EXPECT_TRUE(isLost(*source, server, reason))
            << source->state().lastError << " instead of " << reason;
        EXPECT_TRUE(source->keys().empty());
    }
}

TEST(EtcdHostileServer, IsLeftWhenItsChangesHaveNoEnd) {
    const ScriptedServer server([](const std::string& path) {
        return path == watchPath ? ScriptedServer::inParts() + ScriptedServer::endless()
                                 : ScriptedServer::ok(goodRange());
    });
    EXPECT_TRUE(isLost(*follow(server), server, "the answer is too long"));
}

TEST(EtcdHostileServer, TakesNoValueAway) {
    std::atomic<bool> isWrong{false};
    const ScriptedServer server([&](const std::string& path) {
        if (path == rangePath) return ScriptedServer::ok(isWrong ? "{}" : goodRange());
        isWrong = true;
        return ScriptedServer::inParts() + "0\r\n\r\n";
    });
    const auto source = follow(server);
    EXPECT_TRUE(isLost(*source, server, "JSON answer is of no cluster"));
    EXPECT_THAT(source->keys(), ElementsAre("a"));
}

TEST(EtcdHostileServer, LetsNoValueGoBackInRevision) {
    const auto event = [](const std::string& key, const std::string& revision) {
        return R"({"result":{"header":{"cluster_id":"7","revision":"9"},"events":[{"kv":{"key":")" +
               key + R"(","mod_revision":")" + revision + "\",\"value\":\"Mg==\"}}]}}\n";
    };
    const ScriptedServer server([&](const std::string& path) {
        if (path != watchPath) return ScriptedServer::ok(goodRange());
        const std::string lines = event("cC9h", "4") + event("cC9i", "6");
        std::ostringstream size;
        size << std::hex << lines.size();
        return ScriptedServer::inParts() + size.str() + "\r\n" + lines + "\r\n";
    });
    const auto source = follow(server);
    ASSERT_TRUE(comesAbout([&] { return source->has("b"); }));
    EXPECT_EQ(textOf(source->get("a")), "string 1");
}

TEST(EtcdHostileServer, LeavesTheOutcomeOfAWriteUnknown) {
    const ScriptedServer server([](const std::string& path) {
        if (path == watchPath) return std::string("HTTP/1.1 200 OK\r\nContent-Length: 9\r\n\r\n");
        return ScriptedServer::ok(path == rangePath ? goodRange() : "{}");
    });
    EtcdOptions options = atOnce();
    options.compareAndSwap = true;
    const auto source = follow(server, options);
    source->set("b", 1);
    EXPECT_THROW(source->committed().get(), UnknownOutcome);
}

TEST(EtcdHostileServer, KeepsNobodyWaiting) {
    const ScriptedServer server([](const std::string&) { return ""; });
    auto source = follow(server);
    source->set("b", 1);
    EXPECT_TRUE(completes([&] { source.reset(); }));
}

}  // namespace
}  // namespace velkor::testing
