#include "http/detail/transport/OptionRules.hpp"

#include <chrono>
#include <cstddef>
#include <string>
#include <utility>

#include "http/Refused.hpp"
#include "http/detail/transport/Endpoint.hpp"

namespace velkor::http::detail::transport {
namespace {

void checkReach(const ServerOptions& options, const Endpoint& endpoint) {
    if (endpoint.isLocal()) return;
    const std::string who = "other machines can reach " + endpoint.text() + ": that needs ";
    if (options.tlsCertificate.empty() && !options.behindProxy) {
        throw Refused(who + "TLS (a certificate and a key), or saying that a proxy ends it");
    }
    if (options.tokenFile.empty()) throw Refused(who + "a file of tokens");
}

void checkTimes(const ServerOptions& options) {
    const std::pair<const char*, std::chrono::milliseconds> times[] = {
        {"requestTimeout", options.requestTimeout},
        {"writeTimeout", options.writeTimeout},
        {"idleTimeout", options.idleTimeout},
        {"commentInterval", options.commentInterval}};
    for (const auto& [name, time] : times) {
        if (time < std::chrono::milliseconds(1)) {
            throw Refused(std::string(name) + " must be at least 1 ms");
        }
        if (time > std::chrono::hours(24)) {
            throw Refused(std::string(name) + " must be at most 24 h");
        }
    }
}

void checkLimits(const ServerOptions& options) {
    const std::pair<const char*, std::size_t> limits[] = {
        {"maxHeaderBytes", options.maxHeaderBytes},
        {"maxBodyBytes", options.maxBodyBytes},
        {"maxBufferedBytes", options.maxBufferedBytes},
        {"maxJsonDepth", options.maxJsonDepth},
        {"maxJsonContainers", options.maxJsonContainers},
        {"maxConnections", options.maxConnections},
        {"maxConnectionsPerAddress", options.maxConnectionsPerAddress},
        {"maxStreams", options.maxStreams}};
    for (const auto& [name, limit] : limits) {
        if (limit == 0) throw Refused(std::string(name) + " must be at least 1");
    }
}

}  // namespace

void checkOptions(const ServerOptions& options) {
    constexpr unsigned mostThreads = 64;
    if (options.endpoints.empty()) throw Refused("no address to listen on is given");
    if (options.threads < 1 || options.threads > mostThreads) {
        throw Refused("threads must be 1 to 64");
    }
    checkLimits(options);
    checkTimes(options);
    for (const std::string& text : options.endpoints) checkReach(options, Endpoint(text));
}

}  // namespace velkor::http::detail::transport
