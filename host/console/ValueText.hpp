#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::host {

/// `value` exactly as the get command shows it, numbers in the C locale.
std::string valueText(const configuration::ConfigurationValue& value);

/// "KEY = VALUE", exactly as the list command shows it, without a line end.
std::string optionText(const std::string& key, const configuration::ConfigurationValue& value);

}  // namespace velkor::host
