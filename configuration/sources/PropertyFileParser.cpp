#include "configuration/sources/PropertyFileParser.hpp"

#include <array>
#include <boost/locale/utf.hpp>
#include <charconv>
#include <cstdint>
#include <iterator>

#include "configuration/Loggers.hpp"

namespace velkor::configuration {

namespace {

// A set of bytes with a lookup that does not depend on its size.
class ByteSet {
public:
    constexpr explicit ByteSet(std::string_view bytes) {
        for (const char byte : bytes) members[static_cast<unsigned char>(byte)] = true;
    }
    constexpr bool contains(char byte) const { return members[static_cast<unsigned char>(byte)]; }

    // The first position from `start` on whose byte is a member, or the size of `text`.
    std::size_t findIn(std::string_view text, std::size_t start) const {
        while (start < text.size() && !contains(text[start])) ++start;
        return start;
    }

private:
    std::array<bool, 256> members{};
};

constexpr ByteSet lineBreaks("\r\n");
constexpr ByteSet blanks(" \t");
constexpr ByteSet commentMarks("#!");
constexpr ByteSet assignments(":=");
constexpr ByteSet keyEnds(" \t:=\\");
constexpr ByteSet valueEnds("\r\n\\");
constexpr ByteSet continuationIndents("\r\n ");
constexpr ByteSet numberSpace(" \t\n\v\f\r");

constexpr std::size_t unicodeEscapeLength = 4;

// What strtoul makes of `digits` in base 16 and the C locale, cut to 32 bits: leading white space,
// a sign and a 0x prefix are allowed, and the first other character ends the number.
std::uint32_t hexadecimalPrefix(std::string_view digits) {
    while (!digits.empty() && numberSpace.contains(digits.front())) digits.remove_prefix(1);
    const bool negative = !digits.empty() && digits.front() == '-';
    if (negative || (!digits.empty() && digits.front() == '+')) digits.remove_prefix(1);
    if (digits.size() >= 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X')) {
        digits.remove_prefix(2);
    }
    std::uint32_t number = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), number, 16);
    return negative ? 0U - number : number;
}

}  // namespace

PropertyFileParser::PropertyFileParser(std::string_view fileText, ValueMap& table)
    : text(fileText), properties(table) {}

void PropertyFileParser::parse() {
    State state = State::lineStart;
    while (!atEnd()) state = step(state);
    // A last line needs no line break, but it does need a key and a separator.
    if (state == State::value && !key.empty()) storeProperty("Parsed final property: ");
}

PropertyFileParser::State PropertyFileParser::step(State state) {
    switch (state) {
        case State::lineStart:
            return onLineStart();
        case State::key:
            return onKey();
        case State::keyEscape:
            return onKeyEscape();
        case State::separator:
            return onSeparator();
        case State::value:
            return onValue();
        case State::valueEscape:
            return onValueEscape();
        case State::continuationIndent:
            return onContinuationIndent();
    }
    return state;
}

PropertyFileParser::State PropertyFileParser::onLineStart() {
    if (lineBreaks.contains(current())) {
        ++position;
        return State::lineStart;
    }
    if (commentMarks.contains(current())) {
        position = lineBreaks.findIn(text, position);
        return State::lineStart;
    }
    return State::key;
}

PropertyFileParser::State PropertyFileParser::onKey() {
    const std::size_t end = keyEnds.findIn(text, position);
    key.append(text, position, end - position);
    position = end;
    if (atEnd()) return State::key;
    const bool escape = current() == '\\';
    ++position;
    return escape ? State::keyEscape : State::separator;
}

PropertyFileParser::State PropertyFileParser::onKeyEscape() {
    appendEscaped(key);
    return State::key;
}

// Any blanks, then at most one assignment sign; behind the sign one more blank belongs to it.
PropertyFileParser::State PropertyFileParser::onSeparator() {
    if (blanks.contains(current())) {
        ++position;
        return State::separator;
    }
    if (assignments.contains(current())) {
        ++position;
        if (!atEnd() && blanks.contains(current())) ++position;
    }
    return State::value;
}

PropertyFileParser::State PropertyFileParser::onValue() {
    const std::size_t end = valueEnds.findIn(text, position);
    value.append(text, position, end - position);
    position = end;
    if (atEnd()) return State::value;
    const bool escape = current() == '\\';
    ++position;
    if (escape) return State::valueEscape;
    storeProperty("Parsed property: ");
    return State::lineStart;
}

PropertyFileParser::State PropertyFileParser::onValueEscape() {
    if (lineBreaks.contains(current())) {
        ++position;
        return State::continuationIndent;
    }
    appendEscaped(value);
    return State::value;
}

PropertyFileParser::State PropertyFileParser::onContinuationIndent() {
    if (!continuationIndents.contains(current())) return State::value;
    ++position;
    return State::continuationIndent;
}

void PropertyFileParser::appendEscaped(std::string& target) {
    const char escaped = current();
    ++position;
    if (escaped == 'u') {
        appendUnicodeEscape(target);
    } else {
        target += escaped;
    }
}

void PropertyFileParser::appendUnicodeEscape(std::string& target) {
    constexpr std::uint32_t lastCodePoint = 0x10FFFF;
    const std::string_view digits = text.substr(position, unicodeEscapeLength);
    position += digits.size();
    const std::uint32_t codePoint = hexadecimalPrefix(digits);
    // Surrogates are encoded one by one, as any other code point.
    if (codePoint <= lastCodePoint) {
        boost::locale::utf::utf_traits<char>::encode(codePoint, std::back_inserter(target));
    }
}

void PropertyFileParser::storeProperty(std::string_view logPrefix) {
    properties.insert_or_assign(key, ConfigurationValue(value));
    propertyFileLogger.write(common::trace, logPrefix, key, " = ", value);
    key.clear();
    value.clear();
}

}  // namespace velkor::configuration
