#pragma once

#include <algorithm>
#include <chrono>
#include <cstdint>

namespace velkor::layers::detail {

/// A time as the system's clock tells it.
using Time = std::chrono::system_clock::time_point;

/// `time` as it stands in the file: whole microseconds since 1970 (UTC).
inline std::int64_t toFile(Time time) {
    return std::chrono::duration_cast<std::chrono::microseconds>(time.time_since_epoch()).count();
}

/// The time that stands in the file as `count`, or the nearest from 1970 to the last one there is.
inline Time fromFile(std::int64_t count) {
    const std::int64_t kept = std::clamp(count, std::int64_t{0}, toFile(Time::max()));
    return Time(std::chrono::duration_cast<Time::duration>(std::chrono::microseconds(kept)));
}

/// `time` and `length`, not negative, or the last time there is.
inline Time later(Time time, std::chrono::milliseconds length) {
    const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(Time::max() - time);
    return time + std::min(length, left);
}

}  // namespace velkor::layers::detail
