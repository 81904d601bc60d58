#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/JournaledSource.hpp"
#include "framework/Future.hpp"

namespace velkor::host {

/// The layer of a session that outlasts it. Thread-safe. What an operation throws names the place
/// and the reason in one line.
class StateLayer {
public:
    virtual ~StateLayer() = default;

    /// The layer as a source; never null, always the same.
    virtual std::shared_ptr<configuration::ConfigurationSource> source() const = 0;

    /// Stores `value` for `lifetime`, which is positive; then the layer unsets `key` by itself.
    virtual void setFor(const std::string& key, configuration::ConfigurationValue value,
                        std::chrono::milliseconds lifetime) = 0;

    /// Resolves when all that was written before is on disk; fails with the reason when it is not.
    virtual Future<bool> committed() = 0;

    /// As `configuration::JournaledSource::changes`.
    virtual std::vector<configuration::RecordedChange> history(const std::string& keyOrPrefix,
                                                               std::size_t limit) = 0;

    /// Takes back the change with that number, or the newest one, by a change of its own, which it
    /// gives.
    virtual configuration::RecordedChange undo(std::optional<std::int64_t> number) = 0;
};

/// The layer in the file at `path`, which is made when it is missing. Changes are by `author`.
/// Throws `std::runtime_error` with one line that names the path and the reason; "--state needs
/// velkor::sqlite, which this velkor-config was built without: " and the path when that is so.
std::shared_ptr<StateLayer> openState(const std::string& path, const std::string& author);

}  // namespace velkor::host
