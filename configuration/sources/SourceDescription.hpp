#pragma once

#include <optional>
#include <string>

#include "configuration/sources/MonitoredSource.hpp"

namespace velkor::configuration {

/// How a source is registered, and how it stands.
struct SourceDescription {
    std::string name;
    std::string group;  ///< Empty, or ending in ".".
    int order;
    bool readOnly;
    std::optional<SourceState> state{};  ///< Of a `MonitoredSource`.
};

}  // namespace velkor::configuration
