#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::layers::detail {

/// `value` as it stands in a file: its tag, ":" and the content, so that it can be read there
/// with common tools. Exact for every value of every kind.
///
/// - Truth values are "true" and "false", whole numbers decimal, doubles the shortest text that
///   gives the same number back, or "nan" and the 16 hexadecimal digits of all 64 bits.
/// - Narrow text stands as it is, byte for byte; UTF-16 as two bytes for each unit, low one first.
/// - Lists are their items one after the other: numbers followed by "," each, texts with the count
///   of their bytes and ":" in front and "," behind.
std::string encoded(const configuration::ConfigurationValue& value);

/// The value that `bytes` stand for; nothing when that is none of a kind that is known here.
std::optional<configuration::ConfigurationValue> decoded(std::string_view bytes);

}  // namespace velkor::layers::detail
