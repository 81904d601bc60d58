#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// The value that an operator means by `text`: "true" and "false" are bool, a text with a "." is
/// double and any other int where it begins with such a number, in the C locale and within the
/// range of the type; everything else is narrow text. What follows the number is ignored.
VELKOR_EXPORT ConfigurationValue typedText(const std::string& text);

}  // namespace velkor::configuration
