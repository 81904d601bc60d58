#include "host/serving/ListenOptions.hpp"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <chrono>
#include <cstddef>
#include <tuple>
#include <type_traits>

#include "configuration/ConfigurationValue.hpp"
#include "host/BracketGuard.hpp"
#include "host/Options.hpp"
#include "settings/Conversion.hpp"

namespace velkor::host {

namespace {

using http::ServerOptions;
using settings::ByteSize;
using settings::Conversion;
using std::chrono::milliseconds;

/// An option whose text is read as a `Read`, and is a member of the server's options.
template <class Read, class Member>
struct Quantity {
    const char* name;
    Member ServerOptions::*member;
    const char* help;
};

template <class Read, class Member>
constexpr Quantity<Read, Member> quantity(const char* name, Member ServerOptions::*member,
                                          const char* help) {
    return {name, member, help};
}

constexpr std::tuple quantities{
    quantity<unsigned>("--listen-threads", &ServerOptions::threads, "Threads that serve"),
    quantity<ByteSize>("--max-header-bytes", &ServerOptions::maxHeaderBytes,
                       "Most bytes of a request's first line and headers"),
    quantity<ByteSize>("--max-body-bytes", &ServerOptions::maxBodyBytes,
                       "Most bytes of a request's body"),
    quantity<std::size_t>("--max-json-depth", &ServerOptions::maxJsonDepth,
                          "How deep a body may be nested"),
    quantity<std::size_t>("--max-json-containers", &ServerOptions::maxJsonContainers,
                          "Most objects and arrays in a body"),
    quantity<milliseconds>("--request-timeout", &ServerOptions::requestTimeout,
                           "Most time for a whole request to come"),
    quantity<milliseconds>("--write-timeout", &ServerOptions::writeTimeout,
                           "Most time for an answer, or some of an event, to be taken"),
    quantity<milliseconds>("--idle-timeout", &ServerOptions::idleTimeout,
                           "Most time between two requests of a connection"),
    quantity<milliseconds>("--comment-interval", &ServerOptions::commentInterval,
                           "Longest silence of an event stream"),
    quantity<std::size_t>("--max-connections", &ServerOptions::maxConnections,
                          "Most open connections"),
    quantity<std::size_t>("--max-connections-per-address", &ServerOptions::maxConnectionsPerAddress,
                          "Most open connections from one address"),
    quantity<ByteSize>("--max-buffered-bytes", &ServerOptions::maxBufferedBytes,
                       "Most bytes of large bodies, answers and events of all clients"),
    quantity<std::size_t>("--max-streams", &ServerOptions::maxStreams, "Most open event streams"),
};

template <class Visit>
void forEachQuantity(const Visit& visit) {
    std::apply([&](const auto&... each) { (visit(each), ...); }, quantities);
}

template <class Read, class Member>
const char* typeOf(const Quantity<Read, Member>&) {
    if (std::is_same_v<Read, ByteSize>) return "SIZE";
    return std::is_same_v<Read, milliseconds> ? "TIME" : "N";
}

template <class Read, class Member>
std::string helpOf(const Quantity<Read, Member>& each) {
    const Read usual{ServerOptions().*each.member};
    return std::string(each.help) + "; " + Conversion<Read>::show(usual) + " unless given.";
}

std::size_t plain(ByteSize size) {
    return size.bytes;
}

template <class Value>
Value plain(Value value) {
    return value;
}

template <class Read, class Member>
void read(const Quantity<Read, Member>& each, const std::string& text, ServerOptions& server) {
    const auto value = Conversion<Read>::from(configuration::ConfigurationValue(text));
    if (!value) throw UsageError(each.name + (' ' + text) + ": " + value.reason().text);
    server.*each.member = plain(value.value());
}

}  // namespace

ListenOptions::ListenOptions(CLI::App& app) {
    add(app, "--listen", "[ADDRESS:]PORT|unix:PATH",
        "Serve the configuration over HTTP there; repeatable. Port 0 is one that is free.");
    addFlag(app, "--console", "Read commands beside it; their end ends it.");
    addFlag(app, "--allow-writes", "Let clients change the configuration.");
    add(app, "--token-file", "FILE",
        "Serve only who sends a token of FILE, lines of \"read TOKEN\" or \"write TOKEN\".");
    add(app, "--tls-cert", "FILE", "Serve over TLS, with the certificate chain in FILE (PEM).");
    add(app, "--tls-key", "FILE", "The private key of the certificate (PEM).");
    addFlag(app, "--behind-proxy", "A proxy in front of it ends TLS.");
    add(app, "--host-name", "NAME", "A name that clients may call it by; repeatable.");
    add(app, "--property-root", "FOLDER", "Let clients add the property files below FOLDER.");
    forEachQuantity([&](const auto& each) { add(app, each.name, typeOf(each), helpOf(each)); });
}

std::optional<ListenRequest> ListenOptions::request() const {
    const auto given = std::find_if(options.begin(), options.end(),
                                    [this](const auto& each) { return isGiven(each.name); });
    if (given == options.end()) return std::nullopt;
    if (!isGiven("--listen")) throw UsageError(given->name + " needs --listen");
    ListenRequest request;
    request.withConsole = isGiven("--console");
    ServerOptions& server = request.server;
    server.endpoints = textsOf("--listen");
    server.allowWrites = isGiven("--allow-writes");
    server.tokenFile = lastOf("--token-file");
    server.tlsCertificate = lastOf("--tls-cert");
    server.tlsKey = lastOf("--tls-key");
    server.behindProxy = isGiven("--behind-proxy");
    server.names = textsOf("--host-name");
    server.propertyRoot = lastOf("--property-root");
    forEachQuantity([&](const auto& each) {
        if (isGiven(each.name)) read(each, lastOf(each.name), server);
    });
    return request;
}

void ListenOptions::add(CLI::App& app, const std::string& name, const char* type,
                        const std::string& help) {
    Given& added = options.emplace_back(Given{name, nullptr, {}});
    added.option = app.add_option(name, added.texts, help);
    added.option->allow_extra_args(false)->type_name(type)->group("Serving");
}

void ListenOptions::addFlag(CLI::App& app, const std::string& name, const std::string& help) {
    options.push_back({name, app.add_flag(name, help)->group("Serving"), {}});
}

const ListenOptions::Given& ListenOptions::find(std::string_view name) const {
    return *std::find_if(options.begin(), options.end(),
                         [&](const auto& each) { return each.name == name; });
}

bool ListenOptions::isGiven(std::string_view name) const {
    return find(name).option->count() != 0;
}

std::vector<std::string> ListenOptions::textsOf(std::string_view name) const {
    std::vector<std::string> texts;
    for (const auto& text : find(name).texts) texts.push_back(unguarded(text));
    return texts;
}

std::string ListenOptions::lastOf(std::string_view name) const {
    const auto texts = textsOf(name);
    return texts.empty() ? "" : texts.back();
}

}  // namespace velkor::host
