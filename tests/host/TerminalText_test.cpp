#include "host/TerminalText.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <string>

namespace velkor::host {
namespace {

using namespace std::string_literals;

struct EscapeCase {
    const char* name;
    std::string text;
    std::string shown;

    friend std::ostream& operator<<(std::ostream& out, const EscapeCase& it) {
        return out << it.name;
    }
};

class TerminalTextTest : public ::testing::TestWithParam<EscapeCase> {};

TEST_P(TerminalTextTest, EscapesWhatATerminalWouldActOn) {
    EXPECT_EQ(escapedForTerminal(GetParam().text, LineFeeds::escaped), GetParam().shown);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, TerminalTextTest,
    ::testing::Values(EscapeCase{"Nothing", "", ""}, EscapeCase{"PlainText", "a b~", "a b~"},
                      EscapeCase{"Escape", "\x1b[31m", "\\x1b[31m"},
                      EscapeCase{"Nul", "a\0b"s, "a\\x00b"}, EscapeCase{"Delete", "\x7f", "\\x7f"},
                      EscapeCase{"Tab", "a\tb", "a\\tb"},
                      EscapeCase{"CarriageReturn", "a\rb", "a\\rb"},
                      EscapeCase{"LineFeed", "a\nb", "a\\nb"},
                      EscapeCase{"TwoByteCharacter", "\u00e9", "\u00e9"},
                      EscapeCase{"ThreeByteCharacter", "\u20ac", "\u20ac"},
                      EscapeCase{"FourByteCharacter", "\U0001F600", "\U0001F600"},
                      EscapeCase{"FirstCharacterAfterTheControls", "\u00a0", "\u00a0"},
                      EscapeCase{"UpperControl", "\u009b", "\\xc2\\x9b"},
                      EscapeCase{"StrayContinuation", "a\x9b", "a\\x9b"},
                      EscapeCase{"CutSequence", "\xe2\x82", "\\xe2\\x82"},
                      EscapeCase{"OverlongForm", "\xc0\x9b", "\\xc0\\x9b"},
                      EscapeCase{"LoneSurrogate", "\xed\xa0\x80", "\\xed\\xa0\\x80"},
                      EscapeCase{"BeyondUnicode", "\xf4\x90\x80\x80", "\\xf4\\x90\\x80\\x80"},
                      EscapeCase{"BackslashIsKept", "a\\b", "a\\b"}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(TerminalText, KeepsLineFeedsWhereTheyAreWanted) {
    EXPECT_EQ(escapedForTerminal("a\nb\r\n", LineFeeds::kept), "a\nb\\r\n");
}

TEST(TerminalText, AbbreviatesOnlyWhatIsTooLong) {
    EXPECT_EQ(abbreviated("abcd", 4), "abcd");
    EXPECT_EQ(abbreviated("abcde", 4), "abcd...");
}

TEST(TerminalText, AbbreviatesBetweenTwoCharacters) {
    EXPECT_EQ(abbreviated("ab\u20accd", 4), "ab...");
}

TEST(TerminalText, CountsCharactersNotBytes) {
    EXPECT_EQ(characterCount("Krak\u00f3w \u20ac"), 8U);
}

}  // namespace
}  // namespace velkor::host
