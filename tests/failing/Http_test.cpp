// What answers requests, on the thread that calls it: each is answered once, with what was asked
// for or with a refusal, and the next one is answered as if nothing had been. What the server's own
// threads do beside that, with sockets, is left out.

#include <string>
#include <utility>
#include <variant>

#include "http/detail/Service.hpp"
#include "http/detail/access/Tokens.hpp"
#include "http/detail/transport/RequestParser.hpp"
#include "http/detail/transport/ResponseText.hpp"
#include "settings/Setting.hpp"
#include "tests/failing/StoreScene.hpp"
#include "tests/support/JobsAtOnce.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {
namespace {

using http::detail::Answer;
using http::detail::EventFeed;
using http::detail::Handler;
using http::detail::Request;
using http::detail::Response;
using http::detail::transport::RequestParser;

Request request(const std::string& method, const std::string& target, std::string body = "") {
    Request made{method, target, {{"host", "localhost"}}, std::move(body), {}};
    made.client.address = "127.0.0.1:50312";
    return made;
}

/// What a request was answered with.
struct Asked {
    int answers = 0;
    Answer answer;

    int status() const {
        const auto* const response = std::get_if<Response>(&answer);
        return response == nullptr ? 200 : response->status;
    }
    std::string body() const {
        const auto* const response = std::get_if<Response>(&answer);
        return response == nullptr ? "" : response->body;
    }
};

/// A server without sockets and threads in front of a store.
struct HttpScene : StoreScene {
    HttpScene() {
        options.allowWrites = true;
        service = make();
    }

    std::shared_ptr<Handler> make() const {
        return http::detail::makeService(store, options,
                                         std::make_shared<http::detail::TransportCounts>(),
                                         std::make_unique<JobsAtOnce>());
    }

    void ask(Asked& asked, Request&& sent) const {
        service->handle(std::move(sent), [&asked](Answer&& given) {
            ++asked.answers;
            asked.answer = std::move(given);
        });
    }

    std::unique_ptr<EventFeed> open(const std::string& target) const {
        Asked asked;
        ask(asked, request("GET", target));
        auto feed = std::move(std::get<std::unique_ptr<EventFeed>>(asked.answer));
        feed->start([] {});
        return feed;
    }

    /// The next request is answered, and the store is as it should be.
    void expectServing() {
        Asked asked;
        ask(asked, request("GET", "/config/" + near));
        EXPECT_EQ(asked.status(), 200) << asked.body();
        expectAlive();
    }

    http::ServerOptions options;
    std::shared_ptr<Handler> service;
};

/// Sends `sent`, which is answered by what has `part` in it.
Asked tryAsk(Trial& trial, const HttpScene& scene, Request sent, const std::string& part) {
    Asked asked;
    const bool passed = trial.passes([&] { scene.ask(asked, std::move(sent)); });
    EXPECT_LE(asked.answers, 1);
    // A refusal takes memory as well.
    if (!trial.isLasting() || !trial.isOfMemory()) {
        EXPECT_EQ(asked.answers, 1);
    }
    if (asked.answers == 0) return asked;
    EXPECT_TRUE(passed);
    if (asked.status() == 200) {
        EXPECT_NE(asked.body().find(part), std::string::npos) << asked.body();
    } else {
        EXPECT_TRUE(trial.hasStruck());
        EXPECT_EQ(asked.status(), trial.isOfMemory() ? 503 : 500) << asked.body();
    }
    return asked;
}

void tryGet(Trial& trial, const std::string& target, const std::string& part) {
    HttpScene scene;
    const settings::Setting<std::string> declared(scene.store, scene.near, settings::secret());
    tryAsk(trial, scene, request("GET", target), part);
    scene.expectServing();
}

void makeAServer(Trial& trial) {
    HttpScene scene;
    std::shared_ptr<Handler> made;
    trial.passes([&] { made = scene.make(); });
    made = nullptr;
    scene.expectServing();
}

void readTokens(Trial& trial) {
    const TemporaryFile file("read " + longText("r") + "\nwrite " + longText("w") + "\n");
    std::filesystem::permissions(file.path(), std::filesystem::perms::owner_read);
    bool isKnown = false;
    if (trial.passes([&] {
            const http::detail::Tokens tokens(file.path());
            isKnown = tokens.holderOf(longText("w")).has_value();
        })) {
        EXPECT_TRUE(isKnown);
    }
}

void readARequest(Trial& trial) {
    const std::string text = "POST /" + longText("path") +
                             " HTTP/1.1\r\nHost: " + longText("host") +
                             "\r\nContent-Length: 3\r\n\r\nabc";
    Request read;
    if (trial.passes([&] {
            RequestParser parser(1000, 1000);
            parser.put(text);
            EXPECT_EQ(parser.state(), RequestParser::State::complete);
            read = parser.take();
        })) {
        EXPECT_EQ(read.body, "abc");
    }
}

void writeAHead(Trial& trial) {
    using http::detail::transport::Staying;
    const Response response{200, "text/plain", "text", {{"Allow", longText("value")}}};
    std::string head;
    if (trial.passes([&] {
            head = http::detail::transport::headOf(response, Staying::none, longText("date"));
        })) {
        EXPECT_NE(head.find("Content-Length: 4\r\n"), std::string::npos);
    }
}

void object(Trial& trial) {
    HttpScene scene;
    scene.options.allowWrites = false;
    scene.service = scene.make();
    std::optional<Response> objection;
    const Request head = request("PATCH", "/config");
    if (trial.passes([&] { objection = scene.service->objection(head); }) && objection) {
        EXPECT_EQ(objection->status, 403);
    }
    scene.expectServing();
}

void getAKey(Trial& trial) {
    HttpScene scene;
    tryAsk(trial, scene,
           request("POST", "/velkor/configuration/ConfigurationGet",
                   R"({"key":")" + scene.far + "\"}"),
           longText("old"));
    scene.expectServing();
}

void listKeys(Trial& trial) {
    HttpScene scene;
    tryAsk(trial, scene, request("POST", "/velkor/configuration/ConfigurationKeys", "{}"),
           scene.far);
    scene.expectServing();
}

void expectOldOrNew(const HttpScene& scene, const Asked& asked) {
    const std::string held = scene.textIn(scene.far);
    const std::string made = textOf(scene.newValue);
    if (asked.answers == 1 && asked.status() == 200) {
        EXPECT_EQ(held, made);
    } else {
        EXPECT_TRUE(held == made || held == textOf(scene.oldValue)) << held;
    }
}

void setAKey(Trial& trial) {
    HttpScene scene;
    const Asked asked =
        tryAsk(trial, scene,
               request("POST", "/velkor/configuration/ConfigurationSet",
                       R"({"source":"foreign","key":")" + scene.far +
                           R"(","value":{"type":"string","value":")" + longText("new") + "\"}}"),
               longText("old"));
    expectOldOrNew(scene, asked);
    scene.expectServing();
}

std::string changesOf(const HttpScene& scene) {
    return R"({"changes":[{"source":"foreign","key":")" + scene.far +
           R"(","value":{"type":"string","value":")" + longText("new") + "\"}}]}";
}

void changeKeys(Trial& trial) {
    HttpScene scene;
    const Asked asked =
        tryAsk(trial, scene, request("PATCH", "/config", changesOf(scene)), longText("old"));
    expectOldOrNew(scene, asked);
    scene.expectServing();
}

void tryChanges(Trial& trial) {
    HttpScene scene;
    tryAsk(trial, scene, request("PATCH", "/config?dry-run", changesOf(scene)), longText("old"));
    EXPECT_EQ(scene.textIn(scene.far), textOf(scene.oldValue));
    scene.expectServing();
}

// ---- Streams

void tryOpen(Trial& trial, const std::string& target) {
    HttpScene scene;
    Asked asked;
    trial.passes([&] {
        scene.ask(asked, request("GET", target));
        auto* const feed = std::get_if<std::unique_ptr<EventFeed>>(&asked.answer);
        if (feed != nullptr && *feed != nullptr) (*feed)->start([] {});
    });
    EXPECT_LE(asked.answers, 1);
    asked.answer = Response();  // the client goes
    scene.expectServing();
}

/// A change of the key that a stream shows, told while something goes wrong. The stream goes on, or
/// it is over, so that the client begins again.
void tryTell(Trial& trial, const std::string& target) {
    HttpScene scene;
    const auto feed = scene.open(target);
    while (feed->next()) {
    }
    trial.passes([&] { scene.store->set(scene.near, scene.newValue); });
    scene.expectAlive();
    bool isTold = false;
    while (const auto event = feed->next()) {
        isTold = isTold || event->find(longText("newest")) != std::string::npos;
    }
    EXPECT_TRUE(isTold || feed->isOver());
    scene.expectServing();
}

void tryShow(Trial& trial, const std::string& target) {
    HttpScene scene;
    const auto feed = scene.open(target);
    scene.store->set(scene.near, scene.newValue);
    std::optional<std::string> event;
    if (trial.passes([&] { event = feed->next(); })) {
        EXPECT_NE(event.value_or("").find(longText("new")), std::string::npos);
    }
    scene.expectServing();
}

void tryEnd(Trial& trial, const std::string& target) {
    HttpScene scene;
    auto feed = scene.open(target);
    trial.passes([&] { feed.reset(); });
    scene.expectServing();
}

const std::string watched = "/watch?key=" + longText("near");

constexpr const char* json = "Poco::SharedPtr loses its object without the memory for its count";

constexpr Row httpRows[] = {
    {"MakeAServer", makeAServer},
    {"ReadTokens", readTokens},
    {"ReadARequest", readARequest},
    {"WriteAHead", writeAHead},
    {"Object", object},
    {"GetAKey", getAKey},
    {"ListKeys", listKeys, json},
    {"SetAKey", setAKey, json},
    {"ChangeKeys", changeKeys, json},
    {"TryChanges", tryChanges, json},
    {"GetThePage", [](Trial& trial) { tryGet(trial, "/", "</html>"); }},
    {"GetAPage", [](Trial& trial) { tryGet(trial, "/config?limit=1", "\"next\""); }},
    {"GetTheLayers", [](Trial& trial) { tryGet(trial, "/config/" + longText("near"), "layers"); }},
    {"GetTheSources", [](Trial& trial) { tryGet(trial, "/sources", "foreign"); }},
    {"GetTheSettings", [](Trial& trial) { tryGet(trial, "/settings", longText("near")); }},
    {"GetTheHistory", [](Trial& trial) { tryGet(trial, "/history", "kept"); }},
    {"GetTheHealth", [](Trial& trial) { tryGet(trial, "/healthz", "alive"); }},
    {"GetTheReadiness", [](Trial& trial) { tryGet(trial, "/readyz", "ready"); }},
    {"GetTheMetrics", [](Trial& trial) { tryGet(trial, "/metrics", "velkor_keys"); }},
    {"OpenAWatch", [](Trial& trial) { tryOpen(trial, watched); }},
    {"OpenChanges", [](Trial& trial) { tryOpen(trial, "/changes"); }},
    {"TellAWatch", [](Trial& trial) { tryTell(trial, watched); }},
    {"TellChanges", [](Trial& trial) { tryTell(trial, "/changes"); }},
    {"ShowAWatch", [](Trial& trial) { tryShow(trial, watched); }},
    {"ShowChanges", [](Trial& trial) { tryShow(trial, "/changes"); }},
    {"EndAWatch", [](Trial& trial) { tryEnd(trial, watched); }},
    {"EndChanges", [](Trial& trial) { tryEnd(trial, "/changes"); }},
};
VELKOR_FAILING_ROWS(FailingHttp, httpRows);

}  // namespace
}  // namespace velkor::testing
