#include "http/detail/transport/OptionRules.hpp"

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

void checkLimits(const ServerOptions& options) {
    const std::pair<const char*, long long> limits[] = {
        {"maxHeaderBytes", static_cast<long long>(options.maxHeaderBytes)},
        {"maxBodyBytes", static_cast<long long>(options.maxBodyBytes)},
        {"maxBufferedBytes", static_cast<long long>(options.maxBufferedBytes)},
        {"maxJsonDepth", static_cast<long long>(options.maxJsonDepth)},
        {"maxJsonContainers", static_cast<long long>(options.maxJsonContainers)},
        {"requestTimeout", options.requestTimeout.count()},
        {"writeTimeout", options.writeTimeout.count()},
        {"idleTimeout", options.idleTimeout.count()},
        {"commentInterval", options.commentInterval.count()},
        {"maxConnections", static_cast<long long>(options.maxConnections)},
        {"maxConnectionsPerAddress", static_cast<long long>(options.maxConnectionsPerAddress)},
        {"maxStreams", static_cast<long long>(options.maxStreams)}};
    for (const auto& [name, limit] : limits) {
        if (limit < 1) throw Refused(std::string(name) + " must be at least 1");
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
    for (const std::string& text : options.endpoints) checkReach(options, Endpoint(text));
}

}  // namespace velkor::http::detail::transport
