#pragma once

#include <chrono>
#include <string>

namespace velkor::host {

/// `when` to the second in UTC, as "2026-11-21T20:50:44Z".
std::string timeText(std::chrono::system_clock::time_point when);

}  // namespace velkor::host
