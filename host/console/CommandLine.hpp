#pragma once

#include <cstddef>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace velkor::host {

/// A command line that can't be split into words.
class CommandLineError : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// Splits a command line into words, one at a time, much as a shell does.
///
/// Blanks (space, TAB, CR, LF, VT, FF) separate words. Between ' and ' everything stands for
/// itself. Between " and " a backslash keeps the meaning of a following " or backslash away and
/// otherwise stands for itself. Elsewhere a backslash makes the next byte an ordinary one. Pieces
/// that touch are one word; an empty pair of quotes is an empty word. Nothing is expanded.
///
/// Refers to the text, which must live as long.
class CommandLine {
public:
    explicit CommandLine(std::string_view line) : text(line) {}

    /// The next word, or nothing at the end of the line. Throws `CommandLineError` "Unbalanced
    /// quote: " followed by ' or ", or "Nothing follows the last backslash.", and is at its end
    /// then.
    std::optional<std::string> nextWord();

    /// All that follows the last word, as it was typed, without the blanks around it. The line is
    /// at its end afterwards.
    std::string_view takeRest();

    /// Where the word that `nextWord` read last, or failed to read, begins.
    std::size_t wordStart() const noexcept { return start; }

    /// The word that `nextWord` read last as it was typed, with its quotes and backslashes.
    std::string_view typedWord() const noexcept { return text.substr(start, position - start); }

    /// Whether a quote or a backslash is in the word that `nextWord` read last.
    bool wordIsQuoted() const noexcept;

    /// Whether nothing at all, not even a blank, follows what has been read.
    bool atEnd() const noexcept { return position == text.size(); }

private:
    void skipBlanks() noexcept;
    void readPiece(std::string& word);
    void readSingleQuoted(std::string& word);
    void readDoubleQuoted(std::string& word);
    [[noreturn]] void fail(const char* message);

    std::string_view text;
    std::size_t position = 0;
    std::size_t start = 0;
};

/// `word` with a backslash before each byte that would otherwise separate or quote; '' when empty.
/// As one word of a line it reads as `word` again.
std::string quotedWord(std::string_view word);

}  // namespace velkor::host
