#pragma once

#include <memory>
#include <string>
#include <utility>

#include "configuration/sources/ConfigurationSource.hpp"

namespace velkor::configuration {

/// One registered source: how it is called and where it stands.
struct ConfigurationSourceMap {
    ConfigurationSourceMap(std::string sourceName, std::string keyPrefix, int precedence,
                           bool isReadOnly, std::shared_ptr<ConfigurationSource> layer)
        : name(std::move(sourceName)),
          group(std::move(keyPrefix)),
          order(precedence),
          readOnly(isReadOnly),
          source(std::move(layer)) {}

    std::string name;
    std::string group;  ///< Normalised: empty, or ending in ".".
    int order;
    bool readOnly;
    std::shared_ptr<ConfigurationSource> source;
};

}  // namespace velkor::configuration
