#pragma once

#include <string>
#include <vector>

#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// Throws `UsageError` when somebody seems to have written a command where files are named: when a
/// file without a name of its own is called like one of `commands`, and there is no such file. The
/// text shows the right way, "NAME is a command and no file; say: velkor-config [OPTIONS] [FILE...]
/// -- NAME, or -c 'NAME'", with the words that follow.
void refuseMisplacedCommands(const std::vector<SourceRequest>& requests,
                             const std::vector<std::string>& commands);

}  // namespace velkor::host
