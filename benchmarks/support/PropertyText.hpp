#pragma once

#include <cstddef>
#include <string>

#include "benchmarks/support/Fixtures.hpp"

namespace velkor::benchmarks {

/// The text of a property file as people write them: short values, now and then a long one, one
/// with an escape or one over two lines, a comment and an empty line before every tenth entry.
inline std::string propertyText(std::size_t entries) {
    std::string text;
    for (std::size_t i = 0; i < entries; ++i) {
        if (i % 10 == 0) text += "\n# Limits of the workers in one pool, per second.\n";
        text += keyNumber(i) + " = ";
        if (i % 100 == 50) {
            text += "/srv/data/pools/" + std::to_string(i) + ":/srv/spare";
        } else if (i % 100 == 51) {
            text += "5\\u20AC";
        } else if (i % 100 == 52) {
            text += "soft,\\\n    hard";
        } else {
            text += std::to_string(i * 7919);
        }
        text += '\n';
    }
    return text;
}

}  // namespace velkor::benchmarks
