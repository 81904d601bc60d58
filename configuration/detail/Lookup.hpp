#pragma once

#include <string>

#include "configuration/Option.hpp"
#include "configuration/detail/KeyBuffer.hpp"
#include "configuration/detail/SourceRegistry.hpp"

namespace velkor::configuration::detail {

/// The search for the layer that decides one key, and the way to its value. Used with the store's
/// mutex held.
class Lookup {
public:
    /// Searches `sources` for `key`; both must live as long. What a source throws passes on.
    Lookup(SourceRegistry& sources, const std::string& wanted)
        : key(wanted), buffer(sources.keyBuffers()), layer(sources.firstHolder(key, buffer)) {}

    /// Whether there is such a layer.
    explicit operator bool() const noexcept { return static_cast<bool>(layer); }

    /// Logs the read and gives the value. There is such a layer.
    ConfigurationValue value() const;

    /// Logs the read and gives the value with its source. There is such a layer.
    Option option() const;

private:
    ConfigurationValue valueAfterRecord() const;

    const std::string& key;
    KeyBuffer buffer;
    Layer layer;
};

}  // namespace velkor::configuration::detail
