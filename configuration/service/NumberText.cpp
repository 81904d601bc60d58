#include "configuration/service/NumberText.hpp"

#include <Poco/NumberParser.h>

#include <algorithm>
#include <iterator>

namespace velkor::configuration {

namespace {

using Poco::NumberParser;

// What POCO leaves out of the text of a number with a fraction: thousand separators and suffixes.
bool isLeftOut(char character) {
    return character == ',' || character == 'f';
}

}  // namespace

bool parseText(const std::string& text, bool& content) {
    return NumberParser::tryParseBool(text, content);
}

bool parseText(const std::string& text, int& content) {
    return NumberParser::tryParse(text, content);
}

bool parseText(const std::string& text, unsigned int& content) {
    return NumberParser::tryParseUnsigned(text, content);
}

// POCO moves the rest of the text for each character that it leaves out. It gets no more than the
// first of them, without which a text of nothing else would be empty: that is no number, but this
// is zero.
bool parseText(const std::string& text, double& content) {
    const auto first = std::find_if(text.begin(), text.end(), isLeftOut);
    if (first == text.end()) return NumberParser::tryParseFloat(text, content);
    std::string shortened(text.begin(), first + 1);
    std::remove_copy_if(first + 1, text.end(), std::back_inserter(shortened), isLeftOut);
    return NumberParser::tryParseFloat(shortened, content);
}

}  // namespace velkor::configuration
