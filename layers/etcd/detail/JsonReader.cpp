#include "layers/etcd/detail/JsonReader.hpp"

#include <algorithm>
#include <charconv>

namespace velkor::layers::etcd {

namespace {

constexpr std::uint32_t replacement = 0xFFFD;

constexpr bool isDigit(char character) {
    return character >= '0' && character <= '9';
}

void append(std::string& target, std::uint32_t code) {
    const auto put = [&](std::uint32_t byte) { target += static_cast<char>(byte); };
    if (code < 0x80) {
        put(code);
    } else if (code < 0x800) {
        put(0xC0U | code >> 6U);
        put(0x80U | (code & 0x3FU));
    } else if (code < 0x10000) {
        put(0xE0U | code >> 12U);
        put(0x80U | (code >> 6U & 0x3FU));
        put(0x80U | (code & 0x3FU));
    } else {
        put(0xF0U | code >> 18U);
        put(0x80U | (code >> 12U & 0x3FU));
        put(0x80U | (code >> 6U & 0x3FU));
        put(0x80U | (code & 0x3FU));
    }
}

constexpr bool isHigh(std::uint32_t unit) {
    return unit >= 0xD800 && unit < 0xDC00;
}

constexpr bool isLow(std::uint32_t unit) {
    return unit >= 0xDC00 && unit < 0xE000;
}

/// Takes as many digits off the front of `rest`; false when there is none.
bool skipDigits(std::string_view& rest) {
    const std::size_t before = rest.size();
    while (!rest.empty() && isDigit(rest.front())) rest.remove_prefix(1);
    return rest.size() < before;
}

}  // namespace

JsonReader::Level::Level(JsonReader& reader) : owner(reader) {
    if (++owner.depth <= deepest) return;
    --owner.depth;
    throw BadJson("JSON is nested too deep");
}

std::string JsonReader::text() {
    expect('"');
    std::string content;
    for (;;) {
        const auto special = std::find_if(rest.begin(), rest.end(), [](char c) {
            return c == '"' || c == '\\' || static_cast<unsigned char>(c) < ' ';
        });
        const auto plain = static_cast<std::size_t>(special - rest.begin());
        content += rest.substr(0, plain);
        rest.remove_prefix(plain);
        if (rest.empty()) throw BadJson("JSON text ends in a string");
        const char character = rest.front();
        rest.remove_prefix(1);
        if (character == '"') return content;
        if (character != '\\') throw BadJson("JSON string holds a control character");
        readEscape(content);
    }
}

std::string_view JsonReader::plainText() {
    expect('"');
    const std::size_t end = rest.find('"');
    if (end == std::string_view::npos) throw BadJson("JSON text ends in a string");
    const std::string_view content = rest.substr(0, end);
    if (content.find('\\') != std::string_view::npos) throw BadJson("JSON string is escaped");
    rest.remove_prefix(end + 1);
    return content;
}

void JsonReader::readEscape(std::string& target) {
    if (rest.empty()) throw BadJson("JSON text ends in a string");
    const char kind = rest.front();
    rest.remove_prefix(1);
    if (kind != 'u') {
        constexpr std::string_view forms = "\"\"\\\\//b\bf\fn\nr\rt\t";
        std::size_t form = 0;
        while (form < forms.size() && forms[form] != kind) form += 2;
        if (form >= forms.size()) throw BadJson("JSON string has an unknown escape");
        target += forms[form + 1];
        return;
    }
    const std::uint32_t unit = readUnit();
    if (!isHigh(unit)) return append(target, isLow(unit) ? replacement : unit);
    if (rest.substr(0, 2) != "\\u") return append(target, replacement);
    const std::string_view before = rest;
    rest.remove_prefix(2);
    const std::uint32_t low = readUnit();
    if (isLow(low)) return append(target, 0x10000U + ((unit - 0xD800U) << 10U) + (low - 0xDC00U));
    rest = before;
    append(target, replacement);
}

std::uint32_t JsonReader::readUnit() {
    constexpr std::size_t size = 4;
    std::uint32_t unit = 0;
    const char* const begin = rest.data();
    if (rest.size() < size) throw BadJson("JSON text ends in a string");
    const auto read = std::from_chars(begin, begin + size, unit, 16);
    if (read.ec != std::errc() || read.ptr != begin + size) {
        throw BadJson("JSON string has an unknown escape");
    }
    rest.remove_prefix(size);
    return unit;
}

std::string_view JsonReader::number() {
    skipBlanks();
    const std::string_view begin = rest;
    if (!rest.empty() && rest.front() == '-') rest.remove_prefix(1);
    const bool startsWithZero = !rest.empty() && rest.front() == '0';
    const std::size_t before = rest.size();
    bool isNumber = skipDigits(rest) && !(startsWithZero && before - rest.size() > 1);
    if (isNumber && !rest.empty() && rest.front() == '.') {
        rest.remove_prefix(1);
        isNumber = skipDigits(rest);
    }
    if (isNumber && !rest.empty() && (rest.front() == 'e' || rest.front() == 'E')) {
        rest.remove_prefix(1);
        if (!rest.empty() && (rest.front() == '+' || rest.front() == '-')) rest.remove_prefix(1);
        isNumber = skipDigits(rest);
    }
    if (!isNumber) throw BadJson("JSON number is expected");
    return begin.substr(0, begin.size() - rest.size());
}

std::int64_t JsonReader::integer() {
    const std::string_view digits = isText() ? plainText() : number();
    std::int64_t content = 0;
    const char* const end = digits.data() + digits.size();
    const auto read = std::from_chars(digits.data(), end, content);
    if (read.ec != std::errc() || read.ptr != end) throw BadJson("JSON integer is expected");
    return content;
}

bool JsonReader::boolean() {
    if (takeWord("true")) return true;
    if (takeWord("false")) return false;
    throw BadJson("JSON truth value is expected");
}

bool JsonReader::null() {
    return takeWord("null");
}

void JsonReader::skip() {
    switch (peek()) {
        case '{':
            return object([this](std::string_view) { skip(); });
        case '[':
            return array([this] { skip(); });
        case '"':
            text();
            return;
        case 't':
        case 'f':
            boolean();
            return;
        case 'n':
            if (!null()) throw BadJson("JSON value is expected");
            return;
        default:
            number();
    }
}

void JsonReader::end() {
    if (peek() != '\0' || !rest.empty()) throw BadJson("JSON text goes on");
}

// What can't come at the start of anything stands for the end.
char JsonReader::peek() {
    skipBlanks();
    return rest.empty() ? '\0' : rest.front();
}

bool JsonReader::take(char character) {
    if (peek() != character || rest.empty()) return false;
    rest.remove_prefix(1);
    return true;
}

void JsonReader::expect(char character) {
    if (!take(character)) throw BadJson(std::string("JSON lacks a ") + character);
}

bool JsonReader::takeWord(std::string_view word) {
    skipBlanks();
    if (rest.substr(0, word.size()) != word) return false;
    rest.remove_prefix(word.size());
    return true;
}

void JsonReader::skipBlanks() {
    while (!rest.empty() && (rest.front() == ' ' || rest.front() == '\n' || rest.front() == '\r' ||
                             rest.front() == '\t')) {
        rest.remove_prefix(1);
    }
}

}  // namespace velkor::layers::etcd
