#pragma once

#include <string>
#include <vector>

#include "host/sources/SessionSources.hpp"

namespace velkor::host {

/// What `loadFile` takes.
inline constexpr const char* loadUsage =
    "FILE [--name NAME] [--group GROUP] [--order N] [--writable]";

/// Adds the property file FILE as a source, as the option --source of the program does with the
/// same settings, and gives "Loaded as " and its name. `arguments` are words as they were typed,
/// see `OptionWords`. Throws `CommandError` as that does and as `SessionSources::load`, and
/// "--order N: a number of 32 bits is needed".
std::string loadFile(SessionSources& sources, const std::vector<std::string>& arguments);

/// What `unloadSource` takes.
inline constexpr const char* unloadUsage = "SOURCE";

/// Removes SOURCE, gives nothing. Throws `CommandError` as `SessionSources::unload`.
std::string unloadSource(SessionSources& sources, const std::vector<std::string>& arguments);

}  // namespace velkor::host
