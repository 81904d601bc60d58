#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::layers {

/// `text` as it stands in a property file: what could mean more is escaped.
inline std::string escaped(std::string_view text) {
    constexpr std::string_view digits = "0123456789abcdef";
    constexpr unsigned char firstPrintable = 0x20;
    constexpr unsigned char firstBeyondAscii = 0x80;
    std::string result;
    for (const char byte : text) {
        const auto code = static_cast<unsigned char>(byte);
        const bool isLetterOrDigit = ('0' <= byte && byte <= '9') || ('A' <= byte && byte <= 'Z') ||
                                     ('a' <= byte && byte <= 'z');
        if (code < firstPrintable) {
            result += "\\u00";
            result += digits[code / digits.size()];
            result += digits[code % digits.size()];
            continue;
        }
        if (!isLetterOrDigit && code < firstBeyondAscii) result += '\\';
        result += byte;
    }
    return result;
}

/// A property file that holds `values`, which are narrow texts.
inline std::string propertyText(const configuration::ValueMap& values) {
    std::string text;
    for (const auto& [key, value] : values) {
        text += escaped(key) + "=" + escaped(boost::get<std::string>(value)) + "\n";
    }
    return text;
}

}  // namespace velkor::layers
