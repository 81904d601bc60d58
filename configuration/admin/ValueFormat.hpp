#pragma once

#include <iosfwd>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// Writes `value` as operators read it: true, 5, 0.1, 'text', [1, 2]. Numbers are formatted as
/// `out` is set up; UTF-16 becomes UTF-8; nothing inside a text is escaped.
VELKOR_EXPORT void formatValue(std::ostream& out, const ConfigurationValue& value);

}  // namespace velkor::configuration
