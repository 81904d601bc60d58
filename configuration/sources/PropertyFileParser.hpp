#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/sources/TextTable.hpp"

namespace velkor::configuration {

/// Makes a table of the text of one property file. Every byte sequence parses to something.
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
    /// What the next byte belongs to.
    enum class State {
        lineStart,
        key,
        keyEscape,
        separator,
        value,
        valueEscape,
        continuationIndent
    };

    /// One step through the file: the bytes from `begin` to `end` were read in the state `from`,
    /// and led to `to`.
    struct Step {
        State from;
        State to;
        std::size_t begin;
        std::size_t end;
    };

    /// Whether each property is written to the log.
    enum class Records { written, omitted };

    /// Takes over `content`, the whole file.
    explicit PropertyFileParser(std::string content, Records kept = Records::written);

    /// To be called once, or the other one.
    TextTable parse();

    /// As above, and calls `observe` with each step.
    template <class Observe>
    TextTable parse(Observe&& observe) {
        State state = State::lineStart;
        while (!atEnd()) {
            const std::size_t begin = position;
            const State next = step(state);
            observe(Step{state, next, begin, position});
            state = next;
        }
        return finish(state);
    }

private:
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
    TextTable finish(State state);

    bool atEnd() const { return position == text.size(); }
    char next() const { return text[position]; }
    void takeUpTo(std::size_t end);
    void takeEscaped();
    void takeUnicodeEscape();
    void storeProperty(std::string_view logPrefix);

    // Keys and values are gathered at its beginning, over what has been read: they never take more
    // room than in the file.
    std::string text;
    std::size_t position = 0;              // of the next byte to be read
    std::size_t taken = 0;                 // the size of what is gathered
    TextTable::Property current = {0, 0};  // where that of this line begins
    std::vector<TextTable::Property> properties;
    const Records records;
};

}  // namespace velkor::configuration
