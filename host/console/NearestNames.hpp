#pragma once

#include <string>
#include <vector>

namespace velkor::host {

/// The names among `known` that somebody may have meant who typed `name`, at most three, the most
/// similar first, among equally similar ones as in `known`: those that it begins, and those that
/// few edits (insert, delete, change, swap neighbours; one, and one more for every four bytes of
/// `name`) turn it into. Takes time in proportion to `name` for each candidate of about its length.
std::vector<std::string> nearestNames(const std::string& name,
                                      const std::vector<std::string>& known);

/// `names` as a text: "a, b, c".
std::string joinedNames(const std::vector<std::string>& names);

}  // namespace velkor::host
