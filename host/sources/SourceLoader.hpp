#pragma once

#include <string>
#include <vector>

#include "configuration/Configuration.hpp"
#include "host/Options.hpp"

namespace velkor::host {

/// Adds the requested sources to `store`, in their order, and gives one text for each that could
/// not be added: the store's own, such as "Property file could not be opened: " and the path.
///
/// A source without a name is called like its file, without folder and last extension; where
/// another request or the store has that name, "-2", "-3" and so on is added to it.
std::vector<std::string> loadSources(configuration::Configuration& store,
                                     const std::vector<SourceRequest>& requests);

}  // namespace velkor::host
