#include "fuzz/Values.hpp"

#include <cstdint>
#include <cstring>
#include <string_view>
#include <vector>

#include "fuzz/Finding.hpp"

namespace velkor::fuzz {

namespace {

/// Writes the content of a value out.
struct Speller : boost::static_visitor<std::string> {
    std::string operator()(bool content) const { return content ? "true" : "false"; }
    std::string operator()(int content) const { return std::to_string(content); }
    std::string operator()(unsigned int content) const { return std::to_string(content); }
    std::string operator()(const std::string& content) const { return spelled(content); }

    std::string operator()(double content) const {
        std::uint64_t bits = 0;
        std::memcpy(&bits, &content, sizeof bits);
        return std::to_string(content) + " bits " + std::to_string(bits);
    }

    std::string operator()(const std::u16string& content) const {
        std::string text;
        for (const char16_t unit : content) text += std::to_string(unit) + ' ';
        return '\'' + text + '\'';
    }

    template <class T>
    std::string operator()(const std::vector<T>& content) const {
        std::string text;
        for (const T& element : content) text += (*this)(element) + ',';
        return '[' + text + ']';
    }
};

}  // namespace

std::string exactly(const configuration::ConfigurationValue& value) {
    const std::string_view tag =
        configuration::typeTags.at(static_cast<std::size_t>(value.which()));
    return std::string(tag) + ' ' + boost::apply_visitor(Speller(), value);
}

}  // namespace velkor::fuzz
