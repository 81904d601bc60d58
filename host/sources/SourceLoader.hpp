#pragma once

#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// What became of requested sources.
struct LoadedSources {
    std::vector<std::string> failures{};
    /// "PATH: N remarks, see check" for files with remarks, "NAME began without its server: REASON"
    /// for layers that did, as they were allowed to.
    std::vector<std::string> notices{};
    std::vector<std::string> names{};  ///< Of the sources that were added.
};

/// Adds the requested sources to `store`, in their order. There is one failure for each that could
/// not be added: what its kind or the store says, or "Out of memory while loading: " and the
/// location. So there is for a file that can't be read yet, but is added and watched.
///
/// A source without a name gets the usual one of its kind: a file is called like itself, without
/// folder and last extension. Where another request or the store has that name, "-2", "-3" and so
/// on is added to it.
LoadedSources loadSources(configuration::ConfigurationImpl& store,
                          const std::vector<SourceRequest>& requests, const SourceLimits& limits);

}  // namespace velkor::host
