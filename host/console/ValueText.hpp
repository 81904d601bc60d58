#pragma once

#include <sstream>
#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::host {

/// `value` exactly as the get command shows it, numbers in the C locale; ••• if it is secret.
std::string valueText(const configuration::ConfigurationValue& value, bool isSecret = false);

/// "KEY = VALUE", exactly as the list command shows it, without a line end; "KEY = •••" if the
/// value is secret.
std::string optionText(const std::string& key, const configuration::ConfigurationValue& value,
                       bool isSecret = false);

/// Writes many options, each as `optionText` does, without the cost of a stream for each.
class OptionWriter {
public:
    OptionWriter();

    /// Refers to this; good until the next call.
    const std::string& text(const std::string& key, const configuration::ConfigurationValue& value,
                            bool isSecret);

private:
    std::ostringstream values;
    std::string line;
};

}  // namespace velkor::host
