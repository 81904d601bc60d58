#pragma once

#include <optional>

#include "host/console/OptionWords.hpp"

namespace velkor::host {

/// What a file of options can be written in.
enum class FileFormat { properties, json };

inline constexpr const char* formatOption = "--format";

/// The format that `options` ask for; nothing if they ask for none. Throws `CommandError` "--format
/// X: properties or json is needed".
std::optional<FileFormat> chosenFormat(const OptionWords& options);

}  // namespace velkor::host
