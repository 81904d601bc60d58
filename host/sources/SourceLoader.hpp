#pragma once

#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// Adds the requested sources to `store`, in their order, and gives one text for each that could
/// not be added: what its kind or the store says, or "Out of memory while loading: " and the
/// location.
///
/// A source without a name gets the usual one of its kind: a file is called like itself, without
/// folder and last extension. Where another request or the store has that name, "-2", "-3" and so
/// on is added to it.
std::vector<std::string> loadSources(configuration::ConfigurationImpl& store,
                                     const std::vector<SourceRequest>& requests,
                                     const SourceLimits& limits);

}  // namespace velkor::host
