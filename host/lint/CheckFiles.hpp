#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "host/console/Command.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// What became of files that were checked.
struct CheckedFiles {
    std::size_t remarks = 0;     ///< On all of them.
    std::size_t unreadable = 0;  ///< How many files could not be read.
};

/// Writes each remark on the property files at `paths` to `output` as a line of its own, see
/// `remarkText`, and notes what `readPropertyFile` says of those that can't be read.
CheckedFiles checkFiles(const std::vector<std::string>& paths, const SourceLimits& limits,
                        CommandOutput& output);

}  // namespace velkor::host
