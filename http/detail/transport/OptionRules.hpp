#pragma once

#include "http/ServerOptions.hpp"

namespace velkor::http::detail::transport {

/// Throws `Refused`, with the texts that `Server` says, when `options` are not sound by themselves,
/// or let other machines come without what protects the store from them. Looks at no file.
void checkOptions(const ServerOptions& options);

}  // namespace velkor::http::detail::transport
