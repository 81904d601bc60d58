#include "configuration/sources/PropertyFileParser.hpp"

#include <array>
#include <boost/locale/utf.hpp>
#include <charconv>
#include <cstdint>
#include <cstring>
#include <utility>

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

PropertyFileParser::PropertyFileParser(std::string content, Records kept)
    : text(std::move(content)), records(kept) {}

TextTable PropertyFileParser::parse() {
    return parse([](const Step&) {});
}

TextTable PropertyFileParser::finish(State state) {
    // A last line needs no line break, but it does need a key and a separator.
    const bool hasKey = current.key != current.value;
    if (state == State::value && hasKey) storeProperty("Parsed final property: ");
    text.resize(current.key);
    properties.push_back({text.size(), text.size()});
    return {std::move(text), std::move(properties)};
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
            break;
    }
    return onContinuationIndent();
}

PropertyFileParser::State PropertyFileParser::onLineStart() {
    if (lineBreaks.contains(next())) {
        ++position;
        return State::lineStart;
    }
    if (commentMarks.contains(next())) {
        position = lineBreaks.findIn(text, position);
        return State::lineStart;
    }
    return State::key;
}

PropertyFileParser::State PropertyFileParser::onKey() {
    takeUpTo(keyEnds.findIn(text, position));
    if (atEnd()) return State::key;
    const bool escape = next() == '\\';
    ++position;
    if (escape) return State::keyEscape;
    current.value = taken;
    return State::separator;
}

PropertyFileParser::State PropertyFileParser::onKeyEscape() {
    takeEscaped();
    return State::key;
}

// Any blanks, then at most one assignment sign; behind the sign one more blank belongs to it.
PropertyFileParser::State PropertyFileParser::onSeparator() {
    if (blanks.contains(next())) {
        ++position;
        return State::separator;
    }
    if (assignments.contains(next())) {
        ++position;
        if (!atEnd() && blanks.contains(next())) ++position;
    }
    return State::value;
}

PropertyFileParser::State PropertyFileParser::onValue() {
    takeUpTo(valueEnds.findIn(text, position));
    if (atEnd()) return State::value;
    const bool escape = next() == '\\';
    ++position;
    if (escape) return State::valueEscape;
    storeProperty("Parsed property: ");
    return State::lineStart;
}

PropertyFileParser::State PropertyFileParser::onValueEscape() {
    if (lineBreaks.contains(next())) {
        ++position;
        return State::continuationIndent;
    }
    takeEscaped();
    return State::value;
}

PropertyFileParser::State PropertyFileParser::onContinuationIndent() {
    if (!continuationIndents.contains(next())) return State::value;
    ++position;
    return State::continuationIndent;
}

void PropertyFileParser::takeUpTo(std::size_t end) {
    const std::size_t size = end - position;
    std::memmove(text.data() + taken, text.data() + position, size);
    taken += size;
    position = end;
}

void PropertyFileParser::takeEscaped() {
    const char escaped = next();
    ++position;
    if (escaped == 'u') {
        takeUnicodeEscape();
    } else {
        text[taken++] = escaped;
    }
}

void PropertyFileParser::takeUnicodeEscape() {
    constexpr std::uint32_t lastCodePoint = 0x10FFFF;
    const std::string_view digits = std::string_view(text).substr(position, unicodeEscapeLength);
    position += digits.size();
    const std::uint32_t codePoint = hexadecimalPrefix(digits);
    if (codePoint > lastCodePoint) return;
    // Surrogates are encoded one by one, as any other code point.
    char* const target = text.data() + taken;
    char* const end = boost::locale::utf::utf_traits<char>::encode(codePoint, target);
    taken += static_cast<std::size_t>(end - target);
}

void PropertyFileParser::storeProperty(std::string_view logPrefix) {
    const std::string_view all = text;
    properties.push_back(current);
    if (records == Records::written) {
        propertyFileLogger.write(common::trace, logPrefix,
                                 all.substr(current.key, current.value - current.key), " = ",
                                 all.substr(current.value, taken - current.value));
    }
    current = {taken, taken};
}

}  // namespace velkor::configuration
