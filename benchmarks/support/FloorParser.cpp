#include "benchmarks/support/FloorParser.hpp"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

namespace velkor::benchmarks {

namespace {

void appendUtf8(std::string& target, std::uint32_t point) {
    const auto put = [&](std::uint32_t byte) { target += static_cast<char>(byte); };
    const auto tail = [&](unsigned shift) { put(0x80 | (point >> shift & 0x3F)); };
    if (point < 0x80) return put(point);
    if (point < 0x800) return put(0xC0 | point >> 6), tail(0);
    if (point < 0x10000) return put(0xE0 | point >> 12), tail(6), tail(0);
    if (point <= 0x10FFFF) return put(0xF0 | point >> 18), tail(12), tail(6), tail(0);
}

// Marks some bytes; one look tells whether a byte is among them.
using Marks = std::array<bool, 256>;

constexpr Marks marks(std::string_view bytes) {
    Marks marked{};
    for (const char byte : bytes) marked[static_cast<unsigned char>(byte)] = true;
    return marked;
}

constexpr Marks keyEnds = marks("= :\t\\");
constexpr Marks valueEnds = marks("\n\r\\");
constexpr Marks lineEnds = marks("\n\r");
constexpr Marks blanks = marks(" \t");
constexpr Marks assignments = marks(":=");
constexpr Marks indents = marks("\r\n ");
constexpr Marks comments = marks("#!");

struct Cursor {
    const char* at;
    const char* end;

    bool done() const { return at == end; }
    bool on(const Marks& marked) const { return marked[static_cast<unsigned char>(*at)]; }

    // Appends everything before the next marked byte.
    void takeUntil(const Marks& ends, std::string& target) {
        const char* const start = at;
        skipUntil(ends);
        target.append(start, static_cast<std::size_t>(at - start));
    }

    void skipUntil(const Marks& ends) {
        while (!done() && !on(ends)) ++at;
    }

    // Behind a backslash: what is escaped, into `target`.
    void takeEscaped(std::string& target) {
        if (done()) return;
        const char escaped = *at++;
        if (escaped != 'u') {
            target += escaped;
            return;
        }
        const auto length = std::min<std::ptrdiff_t>(4, end - at);
        const std::string digits(at, at + length);
        at += length;
        appendUtf8(target, static_cast<std::uint32_t>(std::strtoul(digits.c_str(), nullptr, 16)));
    }
};

// Whether there was a separator behind the key.
bool takeKey(Cursor& cursor, std::string& key) {
    while (!cursor.done()) {
        cursor.takeUntil(keyEnds, key);
        if (cursor.done()) return false;
        if (*cursor.at++ != '\\') return true;
        cursor.takeEscaped(key);
    }
    return false;
}

// Whether the value has begun; a file that ends before has none.
bool takeSeparator(Cursor& cursor) {
    while (!cursor.done() && cursor.on(blanks)) ++cursor.at;
    if (cursor.done()) return false;
    if (cursor.on(assignments)) {
        ++cursor.at;
        if (!cursor.done() && cursor.on(blanks)) ++cursor.at;
    }
    return true;
}

enum class End { line, fileInValue, fileInEscape };

// Behind a backslash and a line break.
bool takeIndent(Cursor& cursor) {
    while (!cursor.done() && cursor.on(indents)) ++cursor.at;
    return !cursor.done();
}

End takeValue(Cursor& cursor, std::string& value) {
    while (true) {
        cursor.takeUntil(valueEnds, value);
        if (cursor.done()) return End::fileInValue;
        if (*cursor.at++ != '\\') return End::line;
        if (cursor.done()) return End::fileInEscape;
        if (!cursor.on(lineEnds)) {
            cursor.takeEscaped(value);
        } else if (!takeIndent(cursor)) {
            return End::fileInEscape;
        }
    }
}

}  // namespace

configuration::ValueMap floorParse(std::string_view text) {
    configuration::ValueMap table;
    table.reserve(static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n')));
    Cursor cursor{text.data(), text.data() + text.size()};
    std::string key;
    std::string value;
    while (true) {
        while (!cursor.done() && cursor.on(lineEnds)) ++cursor.at;
        if (cursor.done()) return table;
        if (cursor.on(comments)) {
            cursor.skipUntil(lineEnds);
            continue;
        }
        key.clear();
        value.clear();
        if (!takeKey(cursor, key) || !takeSeparator(cursor)) return table;
        const End end = takeValue(cursor, value);
        if (end == End::fileInEscape || (end == End::fileInValue && key.empty())) return table;
        table.insert_or_assign(key, configuration::ConfigurationValue(value));
    }
}

}  // namespace velkor::benchmarks
