#pragma once

#include <string>

namespace velkor::configuration {

/// How a source is registered.
struct SourceDescription {
    std::string name;
    std::string group;  ///< Empty, or ending in ".".
    int order;
    bool readOnly;
};

}  // namespace velkor::configuration
