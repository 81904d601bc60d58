#pragma once

#include <chrono>
#include <string>

#include "http/detail/routes/JsonWriter.hpp"

namespace velkor::http::detail {

/// Writes the member "key", and beside it "href" when JSON can't hold `key` as it is: the exact way
/// to its layers.
void writeKey(JsonWriter& json, const std::string& key);

/// `time` as of RFC 3339, in UTC, with milliseconds: "2026-01-31T08:00:00.000Z".
std::string utcText(std::chrono::system_clock::time_point time);

}  // namespace velkor::http::detail
