#pragma once

#include <unistd.h>

#include <string>

#include "configuration/sources/TableSource.hpp"
#include "framework/common/Export.hpp"
#include "layers/environment/EnvironmentNames.hpp"

namespace velkor::layers {

/// A read-only layer that holds the environment variables which stand for keys, see
/// `EnvironmentNames`. They are read once, in the constructor; what becomes of the environment
/// later is not seen. Every value is narrow text (`std::string`), byte for byte what follows the
/// first "=". Made by `std::make_shared`.
///
/// After construction the values never change: concurrent `get`, `has` and `keys` are safe.
class VELKOR_EXPORT EnvironmentSource : public configuration::TableSource {
public:
    /// Reads `variables`, texts NAME=VALUE up to a null pointer, by default those of the process:
    /// nothing may change them meanwhile. What has no "=" is no variable, and of two variables of
    /// one name the first one counts, as for `getenv`. A null pointer is an empty environment.
    explicit EnvironmentSource(const EnvironmentNames& names,
                               const char* const* variables = ::environ);

    /// Throws `std::runtime_error` "EnvironmentSource does not support writing".
    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override;
};

}  // namespace velkor::layers
