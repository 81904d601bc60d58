#pragma once

#include <string>
#include <vector>

namespace velkor::host {

/// `rows` as lines of text whose columns begin below each other, two blanks apart, measured in
/// characters. No line ends in blanks. Each row has as many cells as the first.
std::string formatTable(const std::vector<std::vector<std::string>>& rows);

}  // namespace velkor::host
