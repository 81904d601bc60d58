#pragma once

#include <string>
#include <string_view>

namespace velkor::host {

/// A line of a property file, without its end, that reads as `key` with `value`, whatever bytes
/// they hold. Control characters, blanks that could be overlooked and what has a meaning in such a
/// file are escaped; everything else stays as it is, bytes that are no UTF-8 as well.
std::string propertyLine(std::string_view key, std::string_view value);

}  // namespace velkor::host
