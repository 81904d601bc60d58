#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "configuration/sources/ConfigurationSource.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// How the sources of one kind are made.
struct SourceKind {
    std::string_view name;

    /// What a source is called whose request names none.
    std::string (*usualName)(const SourceRequest& request);

    /// The source that a request describes. Throws `std::runtime_error` with one line that names
    /// the location and the reason.
    std::shared_ptr<configuration::ConfigurationSource> (*make)(const SourceRequest& request,
                                                                const SourceLimits& limits);
};

/// The kind called `name`. Throws `std::invalid_argument` "Unknown kind of source: " and the name.
const SourceKind& sourceKind(std::string_view name);

}  // namespace velkor::host
