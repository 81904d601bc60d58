#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

#include "configuration/sources/ConfigurationSource.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// A source that was made, and how many remarks `check` has on the file that it was made of.
struct MadeSource {
    std::shared_ptr<configuration::ConfigurationSource> source;
    std::size_t remarks = 0;
};

/// How the sources of one kind are made.
struct SourceKind {
    std::string_view name;

    /// What a source is called whose request names none.
    std::string (*usualName)(const SourceRequest& request);

    /// The source that a request describes. Throws `std::runtime_error` with one line that names
    /// the location and the reason.
    MadeSource (*make)(const SourceRequest& request, const SourceLimits& limits);
};

/// The kind called `name`. Throws `std::invalid_argument` "Unknown kind of source: " and the name.
const SourceKind& sourceKind(std::string_view name);

}  // namespace velkor::host
