#include "http/Server.hpp"

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "http/detail/Service.hpp"
#include "http/detail/transport/Endpoint.hpp"
#include "http/detail/transport/Listener.hpp"
#include "http/detail/transport/OptionRules.hpp"

namespace velkor::http {

class Server::Impl {
public:
    Impl(std::shared_ptr<configuration::ConfigurationImpl> store, const ServerOptions& options)
        : counts(std::make_shared<detail::TransportCounts>()),
          handler(detail::makeService(std::move(store), options, counts)),
          listener(options, handler, counts) {}

    ~Impl() { stop(); }

    void stop() noexcept {
        if (listener.stop()) handler->stop();
    }

    const std::shared_ptr<detail::TransportCounts> counts;
    const std::shared_ptr<detail::Handler> handler;
    detail::transport::Listener listener;
};

Server::Server(std::shared_ptr<configuration::ConfigurationImpl> store,
               const ServerOptions& options)
    : impl([&] {
          if (!store) throw std::invalid_argument("a server needs a store");
          detail::transport::checkOptions(options);
          return std::make_unique<Impl>(std::move(store), options);
      }()) {}

Server::~Server() = default;

std::vector<std::string> Server::endpoints() const {
    std::vector<std::string> texts;
    for (const auto& endpoint : impl->listener.endpoints()) texts.push_back(endpoint.text());
    return texts;
}

std::uint16_t Server::port() const noexcept {
    const auto& endpoints = impl->listener.endpoints();
    const auto found = std::find_if(endpoints.begin(), endpoints.end(),
                                    [](const auto& endpoint) { return !endpoint.isUnix(); });
    return found == endpoints.end() ? std::uint16_t{0} : found->port();
}

void Server::stop() noexcept {
    impl->stop();
}

}  // namespace velkor::http
