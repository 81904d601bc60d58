#pragma once

#include <cstddef>
#include <string>

#include "benchmarks/support/Fixtures.hpp"

namespace velkor::benchmarks {

/// How a text with an escape, and one over two lines, is written.
struct SpecialValues {
    const char* escaped = "5\\u20AC";
    const char* continued = "soft,\\\n    hard";
};

/// The text of a property file as people write them: short values, now and then a long one, one
/// with an escape or one over two lines, a comment and an empty line before every tenth entry.
inline std::string propertyText(std::size_t entries, const SpecialValues& special = {}) {
    std::string text;
    for (std::size_t i = 0; i < entries; ++i) {
        if (i % 10 == 0) text += "\n# Limits of the workers in one pool, per second.\n";
        text += keyNumber(i) + " = ";
        if (i % 100 == 50) {
            text += "/srv/data/pools/" + std::to_string(i) + ":/srv/spare";
        } else if (i % 100 == 51) {
            text += special.escaped;
        } else if (i % 100 == 52) {
            text += special.continued;
        } else {
            text += std::to_string(i * 7919);
        }
        text += '\n';
    }
    return text;
}

/// The same properties in the format of a key file, which has groups, no such escapes and no
/// continued lines.
inline std::string keyFileText(std::size_t entries) {
    return "[" + keyGroup + "]\n" + propertyText(entries, {"5\u20AC", "soft,hard"});
}

}  // namespace velkor::benchmarks
