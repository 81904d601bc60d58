#pragma once

#include <functional>
#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "http/ServerOptions.hpp"

namespace velkor::host {

/// Serves `store` over HTTP until what this gives is destroyed, which takes a second at most.
/// `announce` is called here with one line for each endpoint, "Listening on " and what clients call
/// it: "http://127.0.0.1:41234/", "https://[::1]:8443/", "unix:/run/store.socket".
///
/// The process may open as many files from now on as the system lets it.
///
/// Throws `UsageError` with the reason when the server refuses to start, see `http::Server`,
/// which itself passes on when it is the system that refuses;
/// "--listen needs velkor::http, which this velkor-config was built without" when that is so.
std::shared_ptr<const void> serve(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                                  const http::ServerOptions& options,
                                  const std::function<void(const std::string& line)>& announce);

}  // namespace velkor::host
