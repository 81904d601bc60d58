#include "settings/detail/Text.hpp"

#include <algorithm>
#include <boost/variant/static_visitor.hpp>
#include <vector>

#include "framework/common/TextConversion.hpp"
#include "settings/detail/Numbers.hpp"

namespace velkor::settings::detail {

namespace {

constexpr std::string_view blanks = " \t\n\v\f\r";

common::TextConversion utf8Conversion() {
    return common::TextConversion("UTF-8");
}

// What is ill-formed is replaced on the way, so only a well-formed text comes back the same.

Converted<std::string> strictlyNarrowed(const std::u16string& text) {
    const common::TextConversion conversion = utf8Conversion();
    std::string narrow = conversion.fromUtf16(text);
    if (conversion.toUtf16(narrow) != text) return Reason{"ill-formed UTF-16"};
    return narrow;
}

Converted<std::u16string> strictlyWidened(const std::string& text) {
    const common::TextConversion conversion = utf8Conversion();
    std::u16string wide = conversion.toUtf16(text);
    if (conversion.fromUtf16(wide) != text) return Reason{"ill-formed UTF-8"};
    return wide;
}

class TextForm : public boost::static_visitor<Converted<std::string>> {
public:
    Converted<std::string> operator()(bool value) const {
        return std::string(value ? "true" : "false");
    }
    Converted<std::string> operator()(int value) const { return std::to_string(value); }
    Converted<std::string> operator()(unsigned int value) const { return std::to_string(value); }
    Converted<std::string> operator()(double value) const { return showNumber(value); }
    Converted<std::string> operator()(const std::string& text) const { return text; }
    Converted<std::string> operator()(const std::u16string& text) const {
        return strictlyNarrowed(text);
    }

    template <class Element>
    Converted<std::string> operator()(const std::vector<Element>&) const {
        return Reason{"a list, where one value is wanted"};
    }
};

constexpr char lowered(char letter) {
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

}  // namespace

Converted<std::string> textOf(const configuration::ConfigurationValue& value) {
    return boost::apply_visitor(TextForm(), value);
}

Converted<std::u16string> utf16Of(const configuration::ConfigurationValue& value) {
    if (const auto* text = boost::get<std::u16string>(&value)) return *text;
    return textOf(value).then(strictlyWidened);
}

std::string utf8(const std::u16string& text) {
    return utf8Conversion().fromUtf16(text);
}

std::string_view trimmed(std::string_view text) noexcept {
    const auto first = text.find_first_not_of(blanks);
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(blanks) + 1 - first);
}

bool sameIgnoringCase(std::string_view left, std::string_view right) noexcept {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](char a, char b) { return lowered(a) == lowered(b); });
}

bool isEmptyText(const configuration::ConfigurationValue& value, bool blanksCount) {
    const bool isText = boost::get<std::string>(&value) || boost::get<std::u16string>(&value);
    if (!isText) return false;
    const Converted<std::string> text = textOf(value);
    if (!text) return false;
    return blanksCount ? text.value().empty() : trimmed(text.value()).empty();
}

}  // namespace velkor::settings::detail
