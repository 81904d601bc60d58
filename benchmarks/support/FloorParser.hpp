#pragma once

#include <string_view>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::benchmarks {

/// The whole property grammar in one pass over one buffer, into a table that is reserved for one
/// property a line.
configuration::ValueMap floorParse(std::string_view text);

}  // namespace velkor::benchmarks
