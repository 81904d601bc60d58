#include "host/look/FileFormat.hpp"

#include "host/console/Command.hpp"

namespace velkor::host {

std::optional<FileFormat> chosenFormat(const WordOptions& options) {
    const auto given = options.values.find(formatOption);
    if (given == options.values.end()) return std::nullopt;
    if (given->second == "properties") return FileFormat::properties;
    if (given->second == "json") return FileFormat::json;
    throw CommandError("--format " + given->second + ": properties or json is needed");
}

}  // namespace velkor::host
