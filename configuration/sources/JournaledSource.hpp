#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// A change of a source that keeps them.
struct RecordedChange {
    std::int64_t number = 0;  ///< Grows with every change of the source.
    std::chrono::system_clock::time_point when{};
    std::string author{};
    std::string action{};                        ///< "set", "unset", "undo", "expired" or "other".
    std::string key{};                           ///< As the source knows it: without its group.
    std::optional<ConfigurationValue> before{};  ///< Nothing: the key had no value.
    std::optional<ConfigurationValue> after{};   ///< Nothing: it has none since.
};

/// What a `ConfigurationSource` implements beside it if it keeps the changes that were made.
class VELKOR_EXPORT JournaledSource {
public:
    virtual ~JournaledSource() = 0;

    /// The newest changes, at most `limit`, of a key, of all keys that a prefix with "." at its end
    /// begins, or, where that is empty, of all keys. The newest comes first. Called from any
    /// thread, without the mutex of a store; may wait for a disk. Throws what names the reason.
    virtual std::vector<RecordedChange> changes(const std::string& keyOrPrefix,
                                                std::size_t limit) = 0;
};

}  // namespace velkor::configuration
