#pragma once

#include <exception>

#include "configuration/sources/MonitoredSource.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::layers::detail {

/// Whether the disk took what was written last, and why it did not. Thread-safe.
class DiskHealth {
public:
    configuration::SourceState state() const VELKOR_EXCLUDES(mutex);

    /// Notes that writes were refused now, with `reason`. Without memory the text is left out.
    void noteRefusal(const std::exception_ptr& reason) noexcept VELKOR_EXCLUDES(mutex);

    /// Notes that writes got onto the disk now.
    void noteCommit() noexcept VELKOR_EXCLUDES(mutex);

private:
    mutable common::Mutex mutex;
    configuration::SourceState current VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::layers::detail
