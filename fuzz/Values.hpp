#pragma once

#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::fuzz {

/// `value` with all that tells it from any other, in a form of its own: its tag, and its content
/// with each text between quotes and each double by its bits. Two values are the same exactly when
/// this is.
std::string exactly(const configuration::ConfigurationValue& value);

}  // namespace velkor::fuzz
