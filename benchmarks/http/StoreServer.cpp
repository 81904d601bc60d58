#include <memory>
#include <string>

#include "benchmarks/http/ServerProcess.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "http/Server.hpp"

namespace velkor::benchmarks {

void serveStore(const std::function<void(std::uint16_t)>& tellPort,
                const std::function<void()>& awaitEnd) {
    const auto store = std::make_shared<configuration::ConfigurationImpl>();
    http::ServerOptions options;
    options.allowWrites = true;
    const http::Server server(store, options);
    tellPort(server.port());
    awaitEnd();
}

}  // namespace velkor::benchmarks
