#pragma once

#include <openssl/types.h>

#include <memory>
#include <utility>

#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/transport/Budget.hpp"
#include "http/detail/transport/Limits.hpp"

namespace velkor::http::detail::transport {

/// What all connections of one listener have in common.
struct Shared {
    Shared(ServerOptions given, std::shared_ptr<Handler> answering,
           std::shared_ptr<TransportCounts> counted, std::shared_ptr<SSL_CTX> tlsContext)
        : options(std::move(given)),
          handler(std::move(answering)),
          counts(std::move(counted)),
          limits(std::make_shared<Limits>(options.maxConnections, options.maxConnectionsPerAddress,
                                          options.maxStreams, counts)),
          budget(options.maxBufferedBytes),
          tls(std::move(tlsContext)) {}

    const ServerOptions options;
    const std::shared_ptr<Handler> handler;
    const std::shared_ptr<TransportCounts> counts;
    const std::shared_ptr<Limits> limits;
    Budget budget;
    const std::shared_ptr<SSL_CTX> tls;  ///< Null without TLS.
};

}  // namespace velkor::http::detail::transport
