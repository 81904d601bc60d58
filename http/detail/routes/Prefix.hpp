#pragma once

#include <string>

namespace velkor::http::detail {

/// Whether `text` begins with all of `prefix`, byte for byte.
inline bool beginsWith(const std::string& text, const std::string& prefix) {
    return text.compare(0, prefix.size(), prefix) == 0;
}

}  // namespace velkor::http::detail
