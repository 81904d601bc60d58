#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceRequest.hpp"
#include "layers/files/ReloadingFileSource.hpp"

namespace velkor::host {

/// What became of requested sources.
struct LoadedSources {
    /// Files that are read again when they change, by the names of their sources.
    using WatchedFiles = std::map<std::string, std::shared_ptr<const layers::ReloadingFileSource>>;

    std::vector<std::string> failures{};
    std::vector<std::string> notices{};  ///< "PATH: N remarks, see check" for files with remarks.
    std::vector<std::string> names{};    ///< Of the sources that were added.
    WatchedFiles watchedFiles{};
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
