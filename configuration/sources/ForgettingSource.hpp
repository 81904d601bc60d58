#pragma once

#include <optional>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// What a `ConfigurationSource` implements beside it if keys can be taken out of it again.
class VELKOR_EXPORT ForgettingSource {
public:
    virtual ~ForgettingSource() = 0;

    /// Removes `key`, calls the change listener, and gives the value that was there; does nothing
    /// and gives nothing when there was none. Called as `ConfigurationSource::set` is.
    virtual std::optional<ConfigurationValue> unset(const std::string& key) = 0;
};

}  // namespace velkor::configuration
