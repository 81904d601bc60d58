#include "http/detail/routes/Items.hpp"

#include <array>
#include <cstdio>
#include <ctime>

#include "http/detail/routes/Target.hpp"

namespace velkor::http::detail {

void writeKey(JsonWriter& json, const std::string& key) {
    json.member("key", key);
    if (!isUtf8(key)) json.member("href", "/config/" + percentEncoded(key));
}

std::string utcText(std::chrono::system_clock::time_point time) {
    using std::chrono::floor;
    const auto whole = floor<std::chrono::seconds>(time);
    const auto milliseconds = floor<std::chrono::milliseconds>(time) - whole;
    const std::time_t seconds = std::chrono::system_clock::to_time_t(whole);
    std::tm parts{};
    ::gmtime_r(&seconds, &parts);
    std::array<char, 64> text{};
    const int size =
        std::snprintf(text.data(), text.size(), "%04d-%02d-%02dT%02d:%02d:%02d.%03dZ",
                      parts.tm_year + 1900, parts.tm_mon + 1, parts.tm_mday, parts.tm_hour,
                      parts.tm_min, parts.tm_sec, static_cast<int>(milliseconds.count()));
    return {text.data(), static_cast<std::size_t>(size)};
}

}  // namespace velkor::http::detail
