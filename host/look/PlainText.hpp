#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::host {

/// `value` as nothing but text: a narrow text as it is, UTF-16 as UTF-8, numbers in the C locale
/// with all their digits, `true` or `false`, an array by its elements with commas between them, as
/// `settings::Conversion` reads it again.
std::string plainText(const configuration::ConfigurationValue& value);

}  // namespace velkor::host
