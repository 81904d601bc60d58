// Any bytes as requests to a server: as they come over the wire, and, said in fewer bytes, as they
// are answered. Compared with a model that reads the documents literally.

#include <algorithm>
#include <array>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/http/LiteralJson.hpp"
#include "fuzz/http/LiteralWire.hpp"
#include "fuzz/http/ModelServer.hpp"
#include "fuzz/http/Sent.hpp"
#include "fuzz/http/TokenFile.hpp"
#include "http/detail/Service.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/PlainGet.hpp"
#include "http/detail/routes/Target.hpp"
#include "http/detail/transport/ResponseText.hpp"
#include "messages/JsonText.hpp"
#include "tests/support/JobsAtOnce.hpp"

namespace velkor::fuzz {
namespace {

using namespace http;
using namespace velkor::http::detail;

velkor::http::ServerOptions optionsFor(const Manner& manner) {
    static const TokenFile tokens(std::string("# for tests\nread ") + readToken + "\nwrite " +
                                  writeToken + "\n");
    velkor::http::ServerOptions options;
    options.allowWrites = manner.allowsWrites;
    if (manner.hasTokens) options.tokenFile = tokens.path();
    return options;
}

std::string headersOf(const std::vector<std::pair<std::string, std::string>>& headers) {
    std::string text;
    for (const auto& [name, value] : headers) text += name + ": " + value + '\n';
    return text;
}

/// An event stream, its model, and what its connection is told.
struct OpenStream {
    std::unique_ptr<EventFeed> real;
    std::unique_ptr<ModelFeed> model;
    std::shared_ptr<int> calls = std::make_shared<int>(0);
};

/// A server and its model.
class Session {
public:
    explicit Session(const Manner& manner) : options(optionsFor(manner)), model(manner) {}

    void perform(std::string_view line) {
        if (line.substr(0, 1) == ".") return drain();
        if (line.substr(0, 1) == "x") return close(line.substr(1));
        ask(readRequest(line));
    }

    void drain() {
        for (OpenStream& stream : streams) drain(stream);
    }

    /// Whether it is as it was at first.
    bool isAsNew() const { return !hasChanged && streams.empty(); }

private:
    static constexpr std::size_t mostStreams = 3;

    void close(std::string_view which) {
        const std::size_t number =
            which.empty() ? 0 : static_cast<unsigned char>(which.front()) % 3;
        if (number >= streams.size()) return;
        streams.erase(streams.begin() + static_cast<std::ptrdiff_t>(number));
    }

    void drain(OpenStream& stream) {
        bool isFirst = true;
        for (;;) {
            const auto expected = stream.model->next();
            if (expected && isFirst) {
                expectThat(*stream.calls == 1, "A connection that waits is called once",
                           std::to_string(*stream.calls));
            }
            isFirst = false;
            const auto actual = stream.real->next();
            expectSame("Event", expected.value_or("none"), actual.value_or("none"));
            if (!expected) break;
        }
        *stream.calls = 0;
        expectThat(!stream.real->isOver(), "A stream goes on");
    }

    void ask(const Request& request) {
        const auto objection = server->objection(request);
        int answers = 0;
        Answer answer;
        server->handle(Request(request), [&](Answer&& given) {
            ++answers;
            answer = std::move(given);
        });
        const std::string about = request.method + ' ' + spelled(request.target);
        expectThat(answers == 1, "A request is answered once", about);
        Expected expected = model.answer(request);
        compare(about, expected, answer);
        if (objection) compareObjection(about, *objection, answer);
        const bool isUnwelcome = expected.status == 401 || expected.status == 405;
        expectThat(objection || !isUnwelcome, "Objections are known before the body", about);
        const bool mayRead = request.method == "GET" || request.method == "HEAD";
        hasChanged = hasChanged || (expected.status == 200 && !mayRead);
        if (expected.feed != nullptr) open(std::move(expected), std::move(answer));
    }

    static void compareObjection(const std::string& about, const Response& objection,
                                 const Answer& answer) {
        const auto* const response = std::get_if<Response>(&answer);
        expectThat(response != nullptr, "What is objected to is no stream", about);
        expectSame("Objection to " + about, response->body, objection.body);
        expectSame("Headers of it", headersOf(response->headers), headersOf(objection.headers));
    }

    static void compare(const std::string& about, const Expected& expected, const Answer& answer) {
        const auto* const response = std::get_if<Response>(&answer);
        expectThat((response == nullptr) == (expected.feed != nullptr), "A stream is a stream",
                   about);
        if (response == nullptr) return;
        expectSame("Status of " + about, std::to_string(expected.status),
                   std::to_string(response->status));
        expectSame("Content type of " + about, expected.contentType, response->contentType);
        compareBody(about, expected, response->body);
        if (expected.contentType.find("html") != std::string::npos) return;
        expectSame("Headers of " + about, headersOf(expected.headers),
                   headersOf(response->headers));
        compareHead(*response);
    }

    static void compareBody(const std::string& about, const Expected& expected,
                            const std::string& body) {
        if (!expected.body) return expectThat(!body.empty(), "There is something to show", about);
        const bool isOpen = expected.contentType == "application/problem+json" &&
                            expected.body->back() == ':';  // any detail is right
        const std::size_t size = isOpen ? expected.body->size() : body.size();
        expectSame("Body of " + about, *expected.body, body.substr(0, size));
        if (isOpen) expectThat(body.size() > size + 3, "A refusal has a reason", body);
    }

    static void compareHead(const Response& response) {
        const std::string head = transport::headOf(response, transport::Staying::none, "NOW");
        std::string expected =
            "Date: NOW\r\nCache-Control: no-store\r\n"
            "X-Content-Type-Options: nosniff\r\n";
        if (!response.contentType.empty()) {
            expected += "Content-Type: " + response.contentType + "\r\n";
        }
        for (const auto& [name, value] : response.headers) expected += name + ": " + value + "\r\n";
        if (response.status != 204 && response.contentType != "text/event-stream") {
            expected += "Content-Length: " + std::to_string(response.body.size()) + "\r\n";
        }
        expected += "Connection: close\r\n\r\n";
        expectSame("Head", spelled(expected), spelled(head.substr(head.find('\n') + 1)));
    }

    void open(Expected&& expected, Answer&& answer) {
        if (streams.size() == mostStreams) return;
        OpenStream stream{std::move(std::get<std::unique_ptr<EventFeed>>(answer)),
                          std::move(expected.feed)};
        stream.real->start([calls = stream.calls] { ++*calls; });
        streams.push_back(std::move(stream));
    }

    const velkor::http::ServerOptions options;
    const std::shared_ptr<configuration::ConfigurationImpl> store = makeStore();
    const settings::Setting<int> pin = declarePin(store);
    const std::shared_ptr<Handler> server =
        makeService(store, options, std::make_shared<TransportCounts>(),
                    std::make_unique<testing::JobsAtOnce>());
    ModelServer model;
    std::vector<OpenStream> streams;
    bool hasChanged = false;
};

/// A session of that manner: one that was there before, as long as nothing has changed in it, since
/// making one takes longer than most requests.
class Sessions {
public:
    Session& of(std::size_t manner) {
        auto& session = all.at(manner);
        if (session == nullptr || !session->isAsNew()) {
            session = std::make_unique<Session>(Manner{manner % 2 == 1, manner / 2 == 1});
        }
        return *session;
    }

private:
    std::array<std::unique_ptr<Session>, 4> all;
};

// ---- Texts in requests and answers

void checkTexts(std::string_view input) {
    const std::string encoded = percentEncoded(input);
    expectSame("Percent code", percentCode(std::string(input)), encoded);
    expectSame("Back again", spelled(input), spelled(percentDecoded(encoded).value_or("none")));
    JsonWriter writer;
    writer.text(input);
    expectSame("JSON of " + spelled(input), jsonText(std::string(input)), writer.take());
    const auto key = keyOfPlainGet(input);
    if (!key) return;
    const auto object = messages::parseJsonObject(std::string(input));
    expectThat(object->size() == 1, "A plain request has one member", input);
    expectSame("Key of " + spelled(input), object->getValue<std::string>("key"), *key);
}

// ---- The target

const Target target("http", [](std::string_view input) {
    if (input.empty()) return;
    const char first = input.front();
    input.remove_prefix(1);
    if (first == '=') return checkTexts(input);
    if (first == '<') return checkWire(input);
    static Sessions sessions;
    Session& session = sessions.of(static_cast<unsigned char>(first) % 4);
    constexpr int mostLines = 8;
    for (int i = 0; i < mostLines && !input.empty(); ++i) {
        const std::string_view line = input.substr(0, input.find('\n'));
        input.remove_prefix(std::min(input.size(), line.size() + 1));
        session.perform(line);
    }
    session.drain();
});

}  // namespace
}  // namespace velkor::fuzz
