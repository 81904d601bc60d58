#pragma once

#include <cstdlib>
#include <istream>
#include <map>
#include <string>

namespace velkor::testing {

using Properties = std::map<std::string, std::string>;

/// The property file format as a plain state machine that takes one byte after the other from a
/// stream. Slow and literal on purpose: what the parser is compared with.
class ReferencePropertyReader {
public:
    explicit ReferencePropertyReader(std::istream& input) : stream(input) {}

    Properties read() {
        next();
        while (stream.good()) step();
        if (state == State::value && !key.empty()) properties[key] = value;
        return properties;
    }

private:
    enum class State {
        lineStart,
        key,
        keyEscape,
        separator,
        value,
        valueEscape,
        continuationIndent
    };

    void next() { stream.get(c); }

    bool atLineBreak() const { return c == '\r' || c == '\n'; }
    bool atBlank() const { return c == ' ' || c == '\t'; }
    bool atAssignment() const { return c == ':' || c == '='; }

    void step() {
        switch (state) {
            case State::lineStart:
                return lineStart();
            case State::key:
                return readKey();
            case State::keyEscape:
                append(key);
                state = State::key;
                return;
            case State::separator:
                return separator();
            case State::value:
                return readValue();
            case State::valueEscape:
                return valueEscape();
            case State::continuationIndent:
                if (atLineBreak() || c == ' ') return next();
                state = State::value;
                return;
        }
    }

    void lineStart() {
        if (atLineBreak()) return next();
        if (c != '#' && c != '!') {
            state = State::key;
            return;
        }
        while (stream.good() && !atLineBreak()) next();
    }

    void readKey() {
        if (atBlank() || atAssignment()) {
            state = State::separator;
        } else if (c == '\\') {
            state = State::keyEscape;
        } else {
            key += c;
        }
        next();
    }

    void separator() {
        if (atBlank()) return next();
        if (atAssignment()) {
            next();
            if (atBlank()) next();
        }
        state = State::value;
    }

    void readValue() {
        if (c == '\\') {
            state = State::valueEscape;
        } else if (atLineBreak()) {
            properties[key] = value;
            key.clear();
            value.clear();
            state = State::lineStart;
        } else {
            value += c;
        }
        next();
    }

    void valueEscape() {
        if (atLineBreak()) {
            state = State::continuationIndent;
            return next();
        }
        append(value);
        state = State::value;
    }

    void append(std::string& target) {
        if (c == 'u') {
            char digits[5] = {};
            stream.read(digits, 4);
            appendCodePoint(target, static_cast<unsigned>(std::strtoul(digits, nullptr, 16)));
        } else {
            target += c;
        }
        next();
    }

    static void appendCodePoint(std::string& target, unsigned code) {
        const auto add = [&](unsigned byte) { target += static_cast<char>(byte); };
        const auto trail = [&](unsigned shift) { add(0x80U | (code >> shift & 0x3FU)); };
        if (code < 0x80) {
            add(code);
        } else if (code < 0x800) {
            add(0xC0U | code >> 6);
            trail(0);
        } else if (code < 0x10000) {
            add(0xE0U | code >> 12);
            trail(6);
            trail(0);
        } else if (code <= 0x10FFFF) {
            add(0xF0U | code >> 18);
            trail(12);
            trail(6);
            trail(0);
        }
    }

    std::istream& stream;
    State state = State::lineStart;
    char c = '\0';
    std::string key;
    std::string value;
    Properties properties;
};

}  // namespace velkor::testing
