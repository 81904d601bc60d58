#include "host/look/PropertyLine.hpp"

namespace velkor::host {

namespace {

bool isControl(char byte) {
    const auto code = static_cast<unsigned char>(byte);
    return code < 0x20 || code == 0x7F;
}

void appendControl(std::string& line, char byte) {
    constexpr const char* digits = "0123456789abcdef";
    const auto code = static_cast<unsigned char>(byte);
    (line += "\\u00") += {digits[code >> 4U], digits[code & 0xFU]};
}

void appendKey(std::string& line, std::string_view key) {
    constexpr std::string_view special = " \\:=#!";
    for (const char byte : key) {
        if (isControl(byte)) {
            appendControl(line, byte);
            continue;
        }
        if (special.find(byte) != special.npos) line += '\\';
        line += byte;
    }
}

void appendValue(std::string& line, std::string_view value) {
    for (std::size_t at = 0; at < value.size(); ++at) {
        const char byte = value[at];
        const bool isOuterBlank = byte == ' ' && (at == 0 || at + 1 == value.size());
        if (isControl(byte)) {
            appendControl(line, byte);
            continue;
        }
        if (byte == '\\' || isOuterBlank) line += '\\';
        line += byte;
    }
}

}  // namespace

std::string propertyLine(std::string_view key, std::string_view value) {
    std::string line;
    line.reserve(key.size() + value.size() + 3);
    appendKey(line, key);
    // The first separator ends the key; where that is a blank, a sign may follow it.
    line += key.empty() ? "= = " : " = ";
    appendValue(line, value);
    return line;
}

}  // namespace velkor::host
