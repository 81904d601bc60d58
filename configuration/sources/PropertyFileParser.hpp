#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::configuration {

/// Reads the text of one property file into a table. Every byte sequence parses to something.
///
///     # comment            ! comment             (first byte of a line only)
///     key = value          key: value            key value
///     a\=b = \u20AC                              (the key "a=b", the value "€" in UTF-8)
///
/// A backslash at the end of a value's line joins the next line to it, less that line's leading
/// spaces; tabs are kept. Any other escaped byte stands for itself, whatever it is; only `\u` means
/// more. A key ends at a separator and not at a line break. A later line with the same key wins.
class PropertyFileParser {
public:
    /// Parses `text`, which is read during `parse` only, into `properties`.
    PropertyFileParser(std::string_view text, ValueMap& properties);

    void parse();

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

    // Each handles the bytes from `position` on, at least one of which is left, and says what
    // comes next.
    State onLineStart();
    State onKey();
    State onKeyEscape();
    State onSeparator();
    State onValue();
    State onValueEscape();
    State onContinuationIndent();
    State step(State state);

    bool atEnd() const { return position == text.size(); }
    char current() const { return text[position]; }
    void appendEscaped(std::string& target);
    void appendUnicodeEscape(std::string& target);
    void storeProperty(std::string_view logPrefix);

    std::string_view text;
    std::size_t position = 0;
    ValueMap& properties;
    std::string key;
    std::string value;
};

}  // namespace velkor::configuration
