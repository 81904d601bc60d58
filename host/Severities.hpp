#pragma once

#include <string>
#include <string_view>

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::host {

/// The name of `severity`: fatal, error, warning, debug or trace.
std::string_view severityName(common::Severity severity) noexcept;

/// The mask that `text` describes: names and decimal masks (0 to 31), separated by commas, taken
/// together. Throws `std::invalid_argument` "Unknown severity: " and the part that is neither.
unsigned parseSeverities(const std::string& text);

}  // namespace velkor::host
