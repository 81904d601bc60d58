#pragma once

#include <memory>

#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"

namespace velkor::configuration {
class ConfigurationImpl;
}

namespace velkor::http::detail {

class Jobs;

/// What answers requests to `store`, within `options`; it reports `counts` among its own. Throws
/// `Refused` when a file that the options name can't be used.
std::shared_ptr<Handler> makeService(std::shared_ptr<configuration::ConfigurationImpl> store,
                                     const ServerOptions& options,
                                     std::shared_ptr<const TransportCounts> counts);

/// The same, with `jobs`, which are not null, in the place of a thread for what may take long.
std::shared_ptr<Handler> makeService(std::shared_ptr<configuration::ConfigurationImpl> store,
                                     const ServerOptions& options,
                                     std::shared_ptr<const TransportCounts> counts,
                                     std::unique_ptr<Jobs> jobs);

}  // namespace velkor::http::detail
