// Any bytes as a line of the console, and as the words, keys and patterns in it.

#include <algorithm>
#include <memory>
#include <optional>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/Values.hpp"
#include "host/TerminalText.hpp"
#include "host/console/CommandLine.hpp"
#include "host/console/ValueWords.hpp"
#include "host/look/KeyPattern.hpp"
#include "host/look/PropertyLine.hpp"
#include "tests/support/ReferencePropertyReader.hpp"

namespace velkor::fuzz {
namespace {

using configuration::ConfigurationValue;
using host::CommandLine;

bool isBlank(char byte) {
    return byte == ' ' || byte == '\t' || byte == '\r' || byte == '\n' || byte == '\v' ||
           byte == '\f';
}

// ---- Words of a line

/// A line read one byte after the other, each of which is looked at in the light of what is open.
struct LiteralWords {
    struct Word {
        std::string text;
        std::size_t begin;
        std::size_t end;
    };

    explicit LiteralWords(std::string_view line) {
        std::optional<Word> word;
        char open = ' ';  // a quote that is open, a backslash that waits for a byte
        for (std::size_t i = 0; i < line.size(); ++i) {
            const char byte = line[i];
            if (open == ' ' && isBlank(byte)) {
                if (word) words.push_back(*word);
                word.reset();
                continue;
            }
            if (!word) word = Word{"", i, i};
            open = readByte(open, byte, line.substr(i + 1), word->text, i);
            word->end = i + 1;
        }
        if (open == '\\') error = "Nothing follows the last backslash.";
        if (open == '\'' || open == '"') error = std::string("Unbalanced quote: ") + open;
        if (word && error.empty()) words.push_back(*word);
    }

    std::vector<Word> words;
    std::string error;

private:
    static char readByte(char open, char byte, std::string_view next, std::string& text,
                         std::size_t& position) {
        if (open == ' ' && (byte == '\'' || byte == '"' || byte == '\\')) return byte;
        if (open == byte && open != '\\') return ' ';
        const bool escapes = open == '"' && byte == '\\' && !next.empty() &&
                             (next.front() == '"' || next.front() == '\\');
        text += escapes ? next.front() : byte;
        if (escapes) ++position;
        return open == '\\' ? ' ' : open;
    }
};

std::string_view trimmed(std::string_view text) {
    while (!text.empty() && isBlank(text.front())) text.remove_prefix(1);
    while (!text.empty() && isBlank(text.back())) text.remove_suffix(1);
    return text;
}

void compareWord(CommandLine line, std::string_view input, const LiteralWords::Word& expected) {
    const std::string_view typed = input.substr(expected.begin, expected.end - expected.begin);
    expectSameBytes("Typed word", typed, line.typedWord());
    expectThat(line.wordStart() == expected.begin, "A word begins where it was typed",
               std::to_string(line.wordStart()));
    const bool isQuoted = typed.find_first_of("'\"\\") != std::string_view::npos;
    expectThat(line.wordIsQuoted() == isQuoted, "A quote is noticed", typed);
    expectThat(line.atEnd() == (expected.end == input.size()), "The end is noticed", typed);
    const std::string_view rest = trimmed(input.substr(expected.end));
    expectSameBytes("Rest of the line", rest, line.takeRest());
}

std::string readWords(std::string_view input, const LiteralWords& expected) {
    CommandLine line(input);
    std::string again;
    for (const auto& word : expected.words) {
        const auto actual = line.nextWord();
        if (!actual) report("Word of the line", spelled(word.text), "none");
        expectSameBytes("Word of the line", word.text, *actual);
        compareWord(line, input, word);
        again += host::quotedWord(*actual) + ' ';
    }
    std::string error;
    try {
        const auto more = line.nextWord();
        if (more) report("End of the line", "no word", spelled(*more));
    } catch (const host::CommandLineError& refused) {
        error = refused.what();
        expectThat(line.atEnd(), "A line that is refused is at its end", error);
    }
    expectSame("Refusal", expected.error, error);
    return again;
}

void checkWords(std::string_view input) {
    const LiteralWords expected(input);
    const std::string again = readWords(input, expected);
    LiteralWords requoted(again);
    expectSame("Quoted words", "", requoted.error);
    const auto sameText = [](const auto& left, const auto& right) {
        return left.text == right.text;
    };
    expectThat(std::equal(expected.words.begin(), expected.words.end(), requoted.words.begin(),
                          requoted.words.end(), sameText),
               "Quoted words are the same again", again);
    const std::string whole = host::quotedWord(input);
    CommandLine line(whole);
    expectSameBytes("A quoted word", input, line.nextWord().value_or("none"));
    expectThat(line.atEnd(), "A quoted word is one word", whole);
}

// ---- Other texts

void checkTerminalText(std::string_view input) {
    const std::string shown = host::escapedForTerminal(input, host::LineFeeds::escaped);
    for (const char byte : shown) {
        const auto code = static_cast<unsigned char>(byte);
        const bool isControl = code < 0x20 || code == 0x7F;
        if (isControl) report("A terminal is shown", "no control characters", spelled(shown));
    }
    expectSameBytes("What is safe already", shown,
                    host::escapedForTerminal(shown, host::LineFeeds::escaped));
}

bool matchesLiterally(std::string_view pattern, std::string_view key) {
    if (pattern.empty()) return key.empty();
    if (pattern.front() == '*') {
        return matchesLiterally(pattern.substr(1), key) ||
               (!key.empty() && matchesLiterally(pattern, key.substr(1)));
    }
    if (key.empty() || (pattern.front() != '?' && pattern.front() != key.front())) return false;
    const bool isCharacter = pattern.front() == '?';
    pattern.remove_prefix(1);
    do {
        key.remove_prefix(1);
    } while (isCharacter && !key.empty() && (key.front() & 0xC0) == 0x80);
    return matchesLiterally(pattern, key);
}

bool isMeant(std::string_view pattern, std::string_view key) {
    if (pattern.find_first_of("*?") != std::string_view::npos) {
        return matchesLiterally(pattern, key);
    }
    std::string beginning(pattern);
    if (pattern.empty() || pattern.back() != '.') beginning += '.';
    return key.substr(0, beginning.size()) == beginning;
}

void checkPattern(std::string_view pattern, std::string_view key) {
    constexpr std::size_t longest = 12;  // the literal reading tries every way there is
    if (pattern.size() > longest || key.size() > longest) return;
    static const auto emptyStore = std::make_shared<configuration::ConfigurationImpl>();
    const host::KeyPattern actual{std::string(pattern), *emptyStore};
    if (actual.matches(key) == isMeant(pattern, key)) return;
    report("Key " + spelled(key), isMeant(pattern, key) ? "meant" : "not meant", spelled(pattern));
}

void checkPropertyLine(std::string_view key, std::string_view value) {
    const std::string line = host::propertyLine(key, value) + '\n';
    std::istringstream stream(line);
    const testing::Properties read = testing::ReferencePropertyReader(stream).read();
    const testing::Properties expected{{std::string(key), std::string(value)}};
    if (read != expected) report("Line of a file", spelled(key) + spelled(value), spelled(line));
}

// The whole numbers that a long long holds, as they are usually written.
std::optional<ConfigurationValue> literalInteger(const std::string& word) {
    constexpr std::size_t mostDigits = 15;  // all of which a double has
    if (word.empty() || word.size() > mostDigits) return std::nullopt;
    if (word.find_first_not_of("0123456789-") != std::string::npos) return std::nullopt;
    char* end = nullptr;
    const long long number = std::strtoll(word.c_str(), &end, 10);
    if (std::to_string(number) != word) return std::nullopt;
    if (number == static_cast<int>(number)) return static_cast<int>(number);
    if (number == static_cast<unsigned int>(number)) return static_cast<unsigned int>(number);
    return static_cast<double>(number);
}

void checkValueWord(const std::string& word) {
    const ConfigurationValue value = host::wordValue(word);
    const auto integer = literalInteger(word);
    if (integer) expectSame("Value of " + word, exactly(*integer), exactly(value));
    const bool mayBeMore =
        word == "true" || word == "false" ||
        (!word.empty() && word.find_first_not_of("0123456789.eE+-") == std::string::npos);
    if (!mayBeMore) expectSame("Value of " + spelled(word), exactly(word), exactly(value));
    expectThat(host::isMeantBy(word, value), "A value is what its word means", word);
}

const Target target("console", [](std::string_view input) {
    checkWords(input);
    checkTerminalText(input);
    const std::size_t end = std::min(input.find(' '), input.size());
    const std::string_view first = input.substr(0, end);
    const std::string_view rest = input.substr(std::min(end + 1, input.size()));
    checkPattern(first, rest);
    checkPropertyLine(first, rest);
    checkValueWord(std::string(first));
});

}  // namespace
}  // namespace velkor::fuzz
