#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// How a source stands with what it takes its values from.
struct SourceState {
    using Time = std::chrono::system_clock::time_point;

    bool isWell = true;           ///< Its values are those of a file or server that answers.
    std::optional<Time> since{};  ///< Since when it is so; nothing: since its start.

    /// When its values were last known to be those of their origin; nothing: never, or always.
    std::optional<Time> updated{};

    std::string lastError{};  ///< In one line; of a source that is well one that is over.

    /// What else there is to say of it, for people to read: "endpoint", "revision".
    std::vector<std::pair<std::string, std::string>> details{};
};

/// What a `ConfigurationSource` implements beside it if it may lose what its values come from.
class VELKOR_EXPORT MonitoredSource {
public:
    virtual ~MonitoredSource() = 0;

    /// How it stands now. Called from any thread; waits for nothing.
    virtual SourceState state() const = 0;
};

}  // namespace velkor::configuration
