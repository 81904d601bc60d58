#include "host/serving/Serving.hpp"

#include "host/Options.hpp"

#if VELKOR_HAS_HTTP
#include <sys/resource.h>

#include "http/Server.hpp"
#endif

namespace velkor::host {

#if VELKOR_HAS_HTTP

namespace {

constexpr const char* unixPrefix = "unix:";

// A process may usually open fewer files than the server takes connections.
void allowConnections() {
    rlimit files{};
    if (::getrlimit(RLIMIT_NOFILE, &files) != 0) return;
    files.rlim_cur = files.rlim_max;
    ::setrlimit(RLIMIT_NOFILE, &files);
}

std::string urlOf(const std::string& endpoint, bool hasTls) {
    if (endpoint.rfind(unixPrefix, 0) == 0) return endpoint;
    return (hasTls ? "https://" : "http://") + endpoint + '/';
}

}  // namespace

std::shared_ptr<const void> serve(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                                  const http::ServerOptions& options,
                                  const std::function<void(const std::string& line)>& announce) {
    allowConnections();
    try {
        const auto server = std::make_shared<http::Server>(store, options);
        for (const auto& endpoint : server->endpoints()) {
            announce("Listening on " + urlOf(endpoint, !options.tlsCertificate.empty()));
        }
        return server;
    } catch (const http::Refused& refused) {
        if (refused.cause() == http::Refused::Cause::system) throw;
        throw UsageError(refused.what());
    }
}

#else

std::shared_ptr<const void> serve(const std::shared_ptr<configuration::ConfigurationImpl>&,
                                  const http::ServerOptions&,
                                  const std::function<void(const std::string& line)>&) {
    throw UsageError("--listen needs velkor::http, which this velkor-config was built without");
}

#endif

}  // namespace velkor::host
