#include "host/console/TimeText.hpp"

#include <array>
#include <ctime>

namespace velkor::host {

std::string timeText(std::chrono::system_clock::time_point when) {
    const auto second = std::chrono::floor<std::chrono::seconds>(when);
    const std::time_t seconds = std::chrono::system_clock::to_time_t(second);
    std::tm utc{};
    gmtime_r(&seconds, &utc);
    std::array<char, sizeof "-2147483648-01-01T00:00:00Z"> text;
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%SZ", &utc)};
}

}  // namespace velkor::host
