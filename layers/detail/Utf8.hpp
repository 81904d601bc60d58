#pragma once

#include <algorithm>
#include <string>
#include <string_view>

#include "framework/common/TextConversion.hpp"

namespace velkor::layers::detail {

/// Whether JSON can hold `bytes` as they are.
inline bool isUtf8(std::string_view bytes) {
    if (std::all_of(bytes.begin(), bytes.end(), [](char byte) { return byte >= 0; })) return true;
    const common::TextConversion utf8("UTF-8");
    return utf8.fromUtf16(utf8.toUtf16(std::string(bytes))) == bytes;
}

}  // namespace velkor::layers::detail
