#pragma once

#include <algorithm>
#include <chrono>
#include <optional>

namespace velkor::layers::detail {

/// When a file that is being changed is to be read: as soon as it has been left alone for a while,
/// and not much later than it changed, however often it is changed again. Knows no clock.
class QuietTime {
public:
    using TimePoint = std::chrono::steady_clock::time_point;

    static constexpr std::chrono::milliseconds quiet{50};
    static constexpr std::chrono::milliseconds most{1000};

    /// The file was closed, replaced or removed: there is something to read.
    void changed(TimePoint now) {
        if (!limit) limit = now + most;
        time = std::min(now + quiet, *limit);
    }

    /// Somebody is at it, who will close it: what is due is put off as far as that goes.
    void written() {
        if (time) time = limit;
    }

    /// The file was made anew and is still open: there is nothing to read until it is closed.
    void begun() { time.reset(); }

    /// When to read; nothing while there is nothing to read.
    std::optional<TimePoint> due() const { return time; }

    /// It is being read now.
    void reset() {
        time.reset();
        limit.reset();
    }

private:
    std::optional<TimePoint> time;
    std::optional<TimePoint> limit;  // kept when what is due has become void
};

}  // namespace velkor::layers::detail
