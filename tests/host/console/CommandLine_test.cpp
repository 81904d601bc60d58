#include "host/console/CommandLine.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;
using velkor::testing::thrownText;

std::vector<std::string> wordsOf(const std::string& text) {
    CommandLine line(text);
    std::vector<std::string> words;
    while (auto word = line.nextWord()) words.push_back(*std::move(word));
    return words;
}

struct SplitCase {
    const char* name;
    std::string line;
    std::vector<std::string> words;

    friend std::ostream& operator<<(std::ostream& out, const SplitCase& it) {
        return out << it.name << ": " << it.line;
    }
};

class CommandLineTest : public ::testing::TestWithParam<SplitCase> {};

TEST_P(CommandLineTest, IsSplitLikeAShellDoes) {
    EXPECT_EQ(wordsOf(GetParam().line), GetParam().words);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, CommandLineTest,
    ::testing::Values(SplitCase{"NothingHasNoWords", "", {}},
                      SplitCase{"BlanksHaveNoWords", " \t ", {}},
                      SplitCase{"BlanksSeparate", " set  a\tb ", {"set", "a", "b"}},
                      SplitCase{"CarriageReturnAtTheEndIsABlank", "get a\r", {"get", "a"}},
                      SplitCase{"LineFeedIsABlank", "get\na", {"get", "a"}},
                      SplitCase{"SingleQuotesKeepBlanks", "set a 'b  c'", {"set", "a", "b  c"}},
                      SplitCase{"SingleQuotesKeepBackslashes", R"('a\n\\"b')", {R"(a\n\\"b)"}},
                      SplitCase{"DoubleQuotesKeepBlanks", R"(set "a b" c)", {"set", "a b", "c"}},
                      SplitCase{"BackslashQuotesInDoubleQuotes", R"("a\"b\\c")", {R"(a"b\c)"}},
                      SplitCase{"OtherBackslashesInDoubleQuotesStay", R"("a\nb")", {R"(a\nb)"}},
                      SplitCase{"SingleQuoteInDoubleQuotes", R"("it's")", {"it's"}},
                      SplitCase{"BackslashKeepsABlank", R"(a\ b c)", {"a b", "c"}},
                      SplitCase{"BackslashKeepsAQuote", R"(it\'s)", {"it's"}},
                      SplitCase{"BackslashKeepsABackslash", R"(a\\b)", {R"(a\b)"}},
                      SplitCase{"PiecesThatTouchAreOneWord", R"(a'b c'"d e"f)", {"ab cd ef"}},
                      SplitCase{
                          "EmptyQuotesAreAnEmptyWord", R"(set a '' "")", {"set", "a", "", ""}},
                      SplitCase{"NothingIsExpanded", "$HOME * ~ `x`", {"$HOME", "*", "~", "`x`"}},
                      SplitCase{"NulIsAByteLikeAnother", "a\0b c"s, {"a\0b"s, "c"}},
                      SplitCase{"BytesThatAreNoTextStay", "\xff\xfe x", {"\xff\xfe", "x"}}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(CommandLine, ReportsAnUnbalancedSingleQuote) {
    EXPECT_EQ(thrownText<CommandLineError>([] { wordsOf("a 'b"); }), "Unbalanced quote: '");
}

TEST(CommandLine, ReportsAnUnbalancedDoubleQuote) {
    EXPECT_EQ(thrownText<CommandLineError>([] { wordsOf(R"(a "b\")"); }), "Unbalanced quote: \"");
}

TEST(CommandLine, ReportsABackslashAtTheEnd) {
    EXPECT_EQ(thrownText<CommandLineError>([] { wordsOf("a \\"); }),
              "Nothing follows the last backslash.");
}

TEST(CommandLine, IsAtItsEndAfterAnError) {
    CommandLine line("a 'b c");
    line.nextWord();
    EXPECT_THROW(line.nextWord(), CommandLineError);
    EXPECT_EQ(line.wordStart(), 2U);
    EXPECT_EQ(line.nextWord(), std::nullopt);
}

TEST(CommandLine, RestIsWhatWasTyped) {
    CommandLine line("send  Get  {\"key\": 'a  b\\'} \t\r");
    line.nextWord();
    line.nextWord();
    EXPECT_EQ(line.takeRest(), "{\"key\": 'a  b\\'}");
    EXPECT_EQ(line.nextWord(), std::nullopt);
}

TEST(CommandLine, RestOfASpentLineIsEmpty) {
    CommandLine line("send \t");
    line.nextWord();
    EXPECT_EQ(line.takeRest(), "");
}

class QuotedWordTest : public ::testing::TestWithParam<std::string> {};

TEST_P(QuotedWordTest, ReadsAsTheSameWordAgain) {
    EXPECT_EQ(wordsOf(quotedWord(GetParam())), std::vector<std::string>{GetParam()});
}

INSTANTIATE_TEST_SUITE_P(Words, QuotedWordTest,
                         ::testing::Values("", "a", "a b", "it's", "\"", "\\", " \t\n\r\v\f",
                                           "a\0b"s, "\u00e9"));

}  // namespace
}  // namespace velkor::host
