#pragma once

#include <set>
#include <string>

namespace velkor::host {

/// Whether the command line `line` may hold the value of one of the keys `secrets`: it names such a
/// key, in whatever quotes; or, if there is such a key at all, it is a message or can't be split
/// into words.
bool mayHoldSecret(const std::string& line, const std::set<std::string>& secrets);

}  // namespace velkor::host
