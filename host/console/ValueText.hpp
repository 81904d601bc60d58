#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::host {

/// `value` exactly as the get command shows it, numbers in the C locale; ••• if it is secret.
std::string valueText(const configuration::ConfigurationValue& value, bool isSecret = false);

/// "KEY = VALUE", exactly as the list command shows it, without a line end; "KEY = •••" if the
/// value is secret.
std::string optionText(const std::string& key, const configuration::ConfigurationValue& value,
                       bool isSecret = false);

}  // namespace velkor::host
