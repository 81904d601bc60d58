#include "host/console/CommandLine.hpp"

#include <algorithm>

namespace velkor::host {

namespace {

constexpr std::string_view blanks = " \t\r\n\v\f";
constexpr std::string_view quotes = "'\"\\";
constexpr std::string_view wordEnds = " \t\r\n\v\f'\"\\";

}  // namespace

std::optional<std::string> CommandLine::nextWord() {
    skipBlanks();
    start = position;
    if (position == text.size()) return std::nullopt;
    std::string word;
    while (position < text.size() && blanks.find(text[position]) == std::string_view::npos) {
        readPiece(word);
    }
    return word;
}

std::string_view CommandLine::takeRest() {
    skipBlanks();
    start = position;
    position = text.size();
    const std::string_view rest = text.substr(start);
    return rest.empty() ? rest : rest.substr(0, rest.find_last_not_of(blanks) + 1);
}

bool CommandLine::wordIsQuoted() const noexcept {
    return typedWord().find_first_of(quotes) != std::string_view::npos;
}

void CommandLine::skipBlanks() noexcept {
    position = std::min(text.find_first_not_of(blanks, position), text.size());
}

void CommandLine::readPiece(std::string& word) {
    switch (text[position]) {
        case '\'':
            return readSingleQuoted(word);
        case '"':
            return readDoubleQuoted(word);
        case '\\':
            if (position + 1 == text.size()) fail("Nothing follows the last backslash.");
            word += text[position + 1];
            position += 2;
            return;
        default:
            const std::size_t end = std::min(text.find_first_of(wordEnds, position), text.size());
            word.append(text, position, end - position);
            position = end;
    }
}

void CommandLine::readSingleQuoted(std::string& word) {
    const std::size_t end = text.find('\'', position + 1);
    if (end == std::string_view::npos) fail("Unbalanced quote: '");
    word.append(text, position + 1, end - position - 1);
    position = end + 1;
}

void CommandLine::readDoubleQuoted(std::string& word) {
    for (++position; position < text.size(); ++position) {
        const char byte = text[position];
        if (byte == '"') {
            ++position;
            return;
        }
        const bool escapes = byte == '\\' && position + 1 < text.size() &&
                             (text[position + 1] == '"' || text[position + 1] == '\\');
        if (escapes) ++position;
        word += text[position];
    }
    fail("Unbalanced quote: \"");
}

void CommandLine::fail(const char* message) {
    position = text.size();
    throw CommandLineError(message);
}

std::string quotedWord(std::string_view word) {
    if (word.empty()) return "''";
    std::string quoted;
    for (const char byte : word) {
        if (wordEnds.find(byte) != std::string_view::npos) quoted += '\\';
        quoted += byte;
    }
    return quoted;
}

}  // namespace velkor::host
