#pragma once

#include <cstdio>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::testing {

/// Spells one value with its kind out, so that values can be compared and shown in a failure:
/// "int 5", "stringArray [a, b]". Doubles keep all their digits, UTF-16 beyond ASCII becomes
/// \uXXXX.
class ValueSpeller : public boost::static_visitor<std::string> {
public:
    std::string operator()(bool value) const { return value ? "true" : "false"; }
    std::string operator()(int value) const { return std::to_string(value); }
    std::string operator()(unsigned int value) const { return std::to_string(value); }
    std::string operator()(const std::string& text) const { return text; }

    std::string operator()(double value) const {
        char digits[40];
        std::snprintf(digits, sizeof digits, "%.17g", value);
        return digits;
    }

    std::string operator()(const std::u16string& text) const {
        std::string spelled;
        for (const char16_t unit : text) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\u%04X", static_cast<unsigned>(unit));
            spelled += unit < 0x80 ? std::string(1, static_cast<char>(unit)) : escape;
        }
        return spelled;
    }

    template <class T>
    std::string operator()(const std::vector<T>& values) const {
        std::string spelled;
        const char* separator = "";
        for (const T& value : values) {
            spelled += separator + (*this)(value);
            separator = ", ";
        }
        return "[" + spelled + "]";
    }
};

inline std::string textOf(const configuration::ConfigurationValue& value) {
    const auto kind = static_cast<std::size_t>(value.which());
    return std::string(configuration::typeTags.at(kind)) + " " +
           boost::apply_visitor(ValueSpeller(), value);
}

}  // namespace velkor::testing
