#pragma once

#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/routes/ChangeHub.hpp"
#include "http/detail/routes/Metrics.hpp"

namespace velkor::http::detail {

/// The value of `key`, if there is one, and then the newest one after changes. Shares no store:
/// the stream is over when the store goes. Values of secret keys are masked by what is secret when
/// they are shown.
std::unique_ptr<EventFeed> watchFeed(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                                     const std::string& key, std::shared_ptr<Metrics> metrics);

/// What changes from now on among the keys that `prefix` begins, the newest of each key, as `hub`
/// of that store passes it on; otherwise as above. The stream of a client that leaves changes of
/// more than 1,000 keys waiting is over.
std::unique_ptr<EventFeed> changeFeed(
    const std::shared_ptr<configuration::ConfigurationImpl>& store, const std::string& prefix,
    const std::shared_ptr<ChangeHub>& hub, std::shared_ptr<Metrics> metrics);

}  // namespace velkor::http::detail
