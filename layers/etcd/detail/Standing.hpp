#pragma once

#include <cstdint>
#include <string>

#include "configuration/sources/MonitoredSource.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::layers::etcd {

/// How a source stands with the server: connected or since when not, up to which revision, at which
/// endpoint, the last error, how old the values may be. Thread-safe.
class Standing {
public:
    Standing();

    configuration::SourceState state() const VELKOR_EXCLUDES(mutex);

    /// The changes come from `endpoint`. Gives whether they did not until now.
    bool noteConnected(const std::string& endpoint) VELKOR_EXCLUDES(mutex);

    /// They don't come. Gives whether this is news: they did, or it is the first error.
    bool noteLost(const std::string& reason) VELKOR_EXCLUDES(mutex);

    /// A write was refused, or is of unknown outcome.
    void noteWriteError(std::string reason) noexcept VELKOR_EXCLUDES(mutex);

    /// The values were those of the server at `time`.
    void noteUpdated(configuration::SourceState::Time time) VELKOR_EXCLUDES(mutex);

    void noteRevision(std::int64_t newRevision) VELKOR_EXCLUDES(mutex);

private:
    mutable common::Mutex mutex;
    configuration::SourceState current VELKOR_GUARDED_BY(mutex);
    std::string endpoint VELKOR_GUARDED_BY(mutex);
    std::int64_t revision VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::layers::etcd
