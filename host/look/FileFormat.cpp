#include "host/look/FileFormat.hpp"

#include "host/console/Command.hpp"

namespace velkor::host {

std::optional<FileFormat> chosenFormat(const OptionWords& options) {
    const auto given = options.value(formatOption);
    if (!given) return std::nullopt;
    if (*given == "properties") return FileFormat::properties;
    if (*given == "json") return FileFormat::json;
    throw CommandError("--format " + *given + ": properties or json is needed");
}

}  // namespace velkor::host
