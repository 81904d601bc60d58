#include "fuzz/http/LiteralJson.hpp"

#include <Poco/NumberFormatter.h>

#include <cctype>
#include <cmath>
#include <string_view>
#include <vector>

#include "framework/common/TextConversion.hpp"

namespace velkor::fuzz::http {

namespace {

std::string cleaned(const std::string& text) {
    const common::TextConversion utf8("UTF-8");
    return utf8.fromUtf16(utf8.toUtf16(text));
}

// Two digits, as many as a byte has.
std::string hexOf(unsigned char byte) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    return {digits[byte / 16U], digits[byte % 16U]};
}

std::string jsonCharacter(char byte) {
    switch (byte) {
        case '"':
            return "\\\"";
        case '\\':
            return "\\\\";
        case '\b':
            return "\\b";
        case '\f':
            return "\\f";
        case '\n':
            return "\\n";
        case '\r':
            return "\\r";
        case '\t':
            return "\\t";
        default:
            break;
    }
    const auto code = static_cast<unsigned char>(byte);
    return code < 0x20 ? "\\u00" + hexOf(code) : std::string(1, byte);
}

/// Writes the content of a value.
struct ContentWriter : boost::static_visitor<std::string> {
    std::string operator()(bool content) const { return content ? "true" : "false"; }
    std::string operator()(int content) const { return std::to_string(content); }
    std::string operator()(unsigned int content) const { return std::to_string(content); }
    std::string operator()(const std::string& content) const { return jsonText(content); }

    std::string operator()(double content) const {
        if (std::isnan(content) || std::isinf(content)) return "null";
        if (content == 0) return std::signbit(content) ? "-0.0" : "0";
        return Poco::NumberFormatter::format(content);
    }

    std::string operator()(const std::u16string& content) const {
        return jsonText(common::TextConversion("UTF-8").fromUtf16(content));
    }

    template <class T>
    std::string operator()(const std::vector<T>& content) const {
        std::string text;
        for (const T& element : content) {
            if (!text.empty()) text += ',';
            text += (*this)(element);
        }
        return '[' + text + ']';
    }
};

}  // namespace

bool isCleanText(const std::string& text) {
    return cleaned(text) == text;
}

std::string jsonText(const std::string& text) {
    std::string json;
    for (const char byte : cleaned(text)) json += jsonCharacter(byte);
    return '"' + json + '"';
}

std::string jsonValue(const configuration::ConfigurationValue& value, bool isSecret) {
    const std::string tag(configuration::typeTags.at(static_cast<std::size_t>(value.which())));
    const std::string content = isSecret ? "\"•••\"" : boost::apply_visitor(ContentWriter(), value);
    return R"({"type":")" + tag + R"(","value":)" + content + '}';
}

std::string jsonKey(const std::string& key) {
    const std::string member = "\"key\":" + jsonText(key);
    if (isCleanText(key)) return member;
    return member + R"(,"href":"/config/)" + percentCode(key) + '"';
}

std::string percentCode(const std::string& bytes) {
    std::string text;
    for (const char byte : bytes) {
        const auto code = static_cast<unsigned char>(byte);
        const bool isPlain = code < 0x80 && (std::isalnum(code) != 0 || byte == '-' ||
                                             byte == '.' || byte == '_' || byte == '~');
        text += isPlain ? std::string(1, byte) : '%' + hexOf(code);
    }
    return text;
}

}  // namespace velkor::fuzz::http
