#pragma once

#include <string>
#include <vector>

namespace velkor::host {

/// The parts of `text` between its commas, one at least; each may be empty.
inline std::vector<std::string> splitAtCommas(const std::string& text) {
    std::vector<std::string> parts(1);
    for (const char byte : text) {
        if (byte == ',') {
            parts.emplace_back();
        } else {
            parts.back() += byte;
        }
    }
    return parts;
}

}  // namespace velkor::host
