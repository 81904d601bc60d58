#include <gtest/gtest.h>

#include <ostream>
#include <sstream>
#include <string>

#include "tests/configuration/sources/PropertyReading.hpp"

namespace velkor::configuration {
namespace {

using namespace std::string_literals;
using testing::Properties;

struct SyntaxCase {
    const char* name;
    std::string text;
    Properties expected;
};

void PrintTo(const SyntaxCase& row, std::ostream* out) {
    *out << ::testing::PrintToString(row.text);
}

class PropertyFileSyntax : public ::testing::TestWithParam<SyntaxCase> {};

TEST_P(PropertyFileSyntax, GivesTheseProperties) {
    const testing::TemporaryFile file(GetParam().text);
    EXPECT_EQ(testing::readProperties(file), GetParam().expected);
}

TEST_P(PropertyFileSyntax, IsTheSameByteByByte) {
    std::istringstream stream(GetParam().text);
    EXPECT_EQ(testing::ReferencePropertyReader(stream).read(), GetParam().expected);
}

std::string nameOf(const ::testing::TestParamInfo<SyntaxCase>& info) {
    return info.param.name;
}

INSTANTIATE_TEST_SUITE_P(
    LineStart, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"EmptyFile", "", {}}, SyntaxCase{"OnlyLineFeed", "\n", {}},
        SyntaxCase{"OnlyCarriageReturn", "\r", {}},
        SyntaxCase{"OnlyLineBreaks", "\r\n\n\r\r\n", {}},
        SyntaxCase{"OnlyHashComment", "# nothing\n", {}},
        SyntaxCase{"OnlyBangComment", "! nothing\n", {}},
        SyntaxCase{"CommentWithoutLineBreak", "# a=1", {}},
        SyntaxCase{"CommentMarkAsLastByte", "a=1\n#", {{"a", "1"}}},
        SyntaxCase{"CommentsAndLineBreaks", "# a\n\n! b\r\n\r# c", {}},
        SyntaxCase{"EmptyCommentThenProperty", "#\na=1\n", {{"a", "1"}}},
        SyntaxCase{"CommentEndedByCarriageReturn", "#x\ra=1\n", {{"a", "1"}}},
        SyntaxCase{"CommentEndedByBoth", "#x\r\na=1\n", {{"a", "1"}}},
        SyntaxCase{"CommentKeepsNoContinuation", "#x\\\na=1\n", {{"a", "1"}}},
        SyntaxCase{"CommentBetweenProperties", "a=1\n#b=2\nc=3\n", {{"a", "1"}, {"c", "3"}}},
        SyntaxCase{"BangInsideAHashComment", "#!x\na=1\n", {{"a", "1"}}},
        SyntaxCase{"CommentAfterEmptyLines", "\n\n#b=2\na=1\n", {{"a", "1"}}},
        SyntaxCase{"IndentedHashIsAValue", " # x\n", {{"", "# x"}}},
        SyntaxCase{"IndentedBangIsAValue", " ! x\n", {{"", "! x"}}},
        SyntaxCase{"TabbedHashIsAValue", "\t#x=1\n", {{"", "#x=1"}}},
        SyntaxCase{"TrailingCommentIsPartOfTheValue", "a=1 # x\n", {{"a", "1 # x"}}},
        SyntaxCase{"HashInsideAKey", "a#b=1\n", {{"a#b", "1"}}},
        SyntaxCase{"BangInsideAKey", "a!b=1\n", {{"a!b", "1"}}},
        SyntaxCase{"EscapedHashBeginsAKey", "\\#a=1\n", {{"#a", "1"}}},
        SyntaxCase{"EscapedBangBeginsAKey", "\\!a=1\n", {{"!a", "1"}}},
        SyntaxCase{"LeadingBlanksGiveTheEmptyKey", "  a=1\n", {{"", "a=1"}}},
        SyntaxCase{"LeadingTabGivesTheEmptyKey", "\ta=1\n", {{"", "a=1"}}},
        SyntaxCase{"OneBlankAlone", " \n", {{"", ""}}},
        SyntaxCase{"OnlyBlanks", " \t \n", {{"", ""}}},
        SyntaxCase{
            "ByteOrderMarkIsContent", "\xEF\xBB\xBF"s + "a=1\n", {{"\xEF\xBB\xBF"s + "a", "1"}}},
        SyntaxCase{"ByteOrderMarkHidesAComment", "\xEF\xBB\xBF#a=1\n", {{"\xEF\xBB\xBF#a", "1"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Key, PropertyFileSyntax,
    ::testing::Values(SyntaxCase{"EndedByEqualsSign", "a=1\n", {{"a", "1"}}},
                      SyntaxCase{"EndedByColon", "a:1\n", {{"a", "1"}}},
                      SyntaxCase{"EndedByBlank", "a 1\n", {{"a", "1"}}},
                      SyntaxCase{"EndedByTab", "b\t1\n", {{"b", "1"}}},
                      SyntaxCase{"WithDots", "a.b.c=1\n", {{"a.b.c", "1"}}},
                      SyntaxCase{"CaseMatters", "A=1\na=2\n", {{"A", "1"}, {"a", "2"}}},
                      SyntaxCase{"RunsOverALineFeed", "foo\nbar=1\n", {{"foo\nbar", "1"}}},
                      SyntaxCase{"RunsOverACarriageReturn", "foo\rbar=1\n", {{"foo\rbar", "1"}}},
                      SyntaxCase{"RunsOverBoth", "foo\r\nbar=1\n", {{"foo\r\nbar", "1"}}},
                      SyntaxCase{"RunsOverEmptyLines", "foo\n\n\nbar=1\n", {{"foo\n\n\nbar", "1"}}},
                      SyntaxCase{"SwallowsACommentLine", "foo\n#bar=1\n", {{"foo\n#bar", "1"}}},
                      SyntaxCase{"EmptyBeforeEqualsSign", "=v\n", {{"", "v"}}},
                      SyntaxCase{"EmptyBeforeColon", ":v\n", {{"", "v"}}},
                      SyntaxCase{"SameTwiceKeepsTheLast", "a=1\na=2\n", {{"a", "2"}}},
                      SyntaxCase{"SameTwiceKeepsTheLastWithoutLineBreak", "a=1\na=2", {{"a", "2"}}},
                      SyntaxCase{"SameTwiceKeepsTheLastEmptyOne", "a=1\na=\n", {{"a", ""}}},
                      SyntaxCase{"EmptyKeyTwiceKeepsTheLast", "=1\n=2\n", {{"", "2"}}},
                      SyntaxCase{"Utf8",
                                 "gr\xC3\xB6\xC3\x9F"
                                 "e=1\n",
                                 {{"gr\xC3\xB6\xC3\x9F"
                                   "e",
                                   "1"}}},
                      SyntaxCase{"NulByte", "a\0b=1\n"s, {{"a\0b"s, "1"}}},
                      SyntaxCase{"BytesAboveAscii", "\xFF\x80=1\n", {{"\xFF\x80", "1"}}},
                      SyntaxCase{"VerticalTabIsNoSeparator", "a\vb=1\n", {{"a\vb", "1"}}},
                      SyntaxCase{"NoBreakSpaceIsNoSeparator",
                                 "a\xA0"
                                 "b=1\n",
                                 {{"a\xA0"
                                   "b",
                                   "1"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    KeyEscape, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"EqualsSign", "a\\=b=c\n", {{"a=b", "c"}}},
        SyntaxCase{"Colon", "a\\:b=c\n", {{"a:b", "c"}}},
        SyntaxCase{"Blank", "a\\ b=c\n", {{"a b", "c"}}},
        SyntaxCase{"Tab", "a\\\tb=c\n", {{"a\tb", "c"}}},
        SyntaxCase{"Backslash", "a\\\\b=c\n", {{"a\\b", "c"}}},
        SyntaxCase{"BackslashThenSeparator", "a\\\\=c\n", {{"a\\", "c"}}},
        SyntaxCase{"LetterN", "a\\nb=c\n", {{"anb", "c"}}},
        SyntaxCase{"LetterT", "a\\tb=c\n", {{"atb", "c"}}},
        SyntaxCase{"CapitalU", "a\\U0041=c\n", {{"aU0041", "c"}}},
        SyntaxCase{"LineFeed", "a\\\nb=c\n", {{"a\nb", "c"}}},
        SyntaxCase{"CarriageReturn", "a\\\rb=c\n", {{"a\rb", "c"}}},
        SyntaxCase{"LineFeedKeepsIndentAsSeparator", "a\\\n b=c\n", {{"a\n", "b=c"}}},
        SyntaxCase{"NulByte", "a\\\0b=c\n"s, {{"a\0b"s, "c"}}},
        SyntaxCase{"Unicode", "\\u0041\\u00e9=1\n", {{"A\xC3\xA9", "1"}}},
        SyntaxCase{"UnicodeSeparatorBelongsToTheKey", "a\\u003Db=1\n", {{"a=b", "1"}}},
        SyntaxCase{"UnicodeLineFeedBelongsToTheKey", "a\\u000ab=1\n", {{"a\nb", "1"}}},
        SyntaxCase{"UnicodeTakesSeparators", "a\\u41= =1\n", {{"aA", "1"}}},
        SyntaxCase{"UnicodeTakesALineBreak", "a\\u41\n\nb=1\n", {{"aAb", "1"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Separator, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"BlankOnBothSides", "a = 1\n", {{"a", "1"}}},
        SyntaxCase{"OnlyOneBlankIsSkippedAfterABlankAndASign", "a =  1\n", {{"a", " 1"}}},
        SyntaxCase{"OnlyOneTabIsSkippedAfterABlankAndASign", "a =\t\t1\n", {{"a", "\t1"}}},
        SyntaxCase{"AllBlanksAreSkippedAfterADirectSign", "key=   value\n", {{"key", "value"}}},
        SyntaxCase{"AllBlanksAreSkippedAfterADirectColon", "key: \t value\n", {{"key", "value"}}},
        SyntaxCase{"ManyBlanksBeforeTheSign", "a \t  =1\n", {{"a", "1"}}},
        SyntaxCase{"ManyBlanksAlone", "a \t  1\n", {{"a", "1"}}},
        SyntaxCase{"SecondEqualsSign", "a==1\n", {{"a", "1"}}},
        SyntaxCase{"EqualsSignThenColon", "a=:1\n", {{"a", "1"}}},
        SyntaxCase{"ColonThenEqualsSign", "a:=1\n", {{"a", "1"}}},
        SyntaxCase{"ThirdSignIsContent", "a===1\n", {{"a", "=1"}}},
        SyntaxCase{"SecondSignAfterBlanks", "a=  =1\n", {{"a", "1"}}},
        SyntaxCase{"OneBlankAfterTheSecondSign", "a==  1\n", {{"a", " 1"}}},
        SyntaxCase{"SignAfterABlankedSignIsContent", "a ==1\n", {{"a", "=1"}}},
        SyntaxCase{"SignAfterTheSkippedBlankIsContent", "a = =1\n", {{"a", "=1"}}},
        SyntaxCase{"LineBreakGivesAnEmptyValue", "a=\n", {{"a", ""}}},
        SyntaxCase{"BlankAndLineBreakGiveAnEmptyValue", "a \n", {{"a", ""}}},
        SyntaxCase{"SignBlankAndLineBreakGiveAnEmptyValue", "a = \n", {{"a", ""}}},
        SyntaxCase{"EmptyValueDoesNotTakeTheNextLine", "a=\nb=2\n", {{"a", ""}, {"b", "2"}}},
        SyntaxCase{"EscapeBeginsAValue", "a=\\=1\n", {{"a", "=1"}}},
        SyntaxCase{"EscapedBlankBeginsAValue", "a=\\ 1\n", {{"a", " 1"}}},
        SyntaxCase{"HashBeginsAValue", "a=#1\n", {{"a", "#1"}}},
        SyntaxCase{"ContinuationBeginsAValue", "a=\\\n  1\n", {{"a", "1"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Value, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"KeepsSigns", "a=1=2\n", {{"a", "1=2"}}},
        SyntaxCase{"KeepsColons", "a=http://x:1\n", {{"a", "http://x:1"}}},
        SyntaxCase{"KeepsInnerBlanks", "a=b  c\td\n", {{"a", "b  c\td"}}},
        SyntaxCase{"KeepsTrailingBlanks", "a=1 \t \n", {{"a", "1 \t "}}},
        SyntaxCase{"KeepsQuotes", "a=\"'x'\"\n", {{"a", "\"'x'\""}}},
        SyntaxCase{
            "StaysNarrowTextWhateverItLooksLike", "a=true\nb=5\n", {{"a", "true"}, {"b", "5"}}},
        SyntaxCase{"EndedByLineFeed", "a=1\nb=2\n", {{"a", "1"}, {"b", "2"}}},
        SyntaxCase{"EndedByCarriageReturn", "a=1\rb=2\r", {{"a", "1"}, {"b", "2"}}},
        SyntaxCase{"EndedByBoth", "a=1\r\nb=2\r\n", {{"a", "1"}, {"b", "2"}}},
        SyntaxCase{"EmptyLinesBetween", "a=1\n\n\r\n\rb=2\n", {{"a", "1"}, {"b", "2"}}},
        SyntaxCase{
            "Utf8", "a=\xE2\x82\xAC\xF0\x9F\x98\x80\n", {{"a", "\xE2\x82\xAC\xF0\x9F\x98\x80"}}},
        SyntaxCase{"IllFormedUtf8", "a=\xC3(\xFF\n", {{"a", "\xC3(\xFF"}}},
        SyntaxCase{"NulByte", "a=b\0c\n"s, {{"a", "b\0c"s}}},
        SyntaxCase{"ControlZIsContent",
                   "a=b\x1A"
                   "c\n",
                   {{"a",
                     "b\x1A"
                     "c"}}},
        SyntaxCase{"FormFeedIsContent", "a=b\fc\n", {{"a", "b\fc"}}},
        SyntaxCase{"NextLineCharacterIsContent",
                   "a=b\x85"
                   "c\n",
                   {{"a",
                     "b\x85"
                     "c"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    ValueEscape, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"LetterT", "a=x\\ty\n", {{"a", "xty"}}},
        SyntaxCase{"LetterN", "a=x\\ny\n", {{"a", "xny"}}},
        SyntaxCase{"LetterR", "a=x\\ry\n", {{"a", "xry"}}},
        SyntaxCase{"Backslash", "a=x\\\\y\n", {{"a", "x\\y"}}},
        SyntaxCase{"TwoBackslashes", "a=x\\\\\\\\y\n", {{"a", "x\\\\y"}}},
        SyntaxCase{"BackslashBeforeALineBreak", "a=x\\\\\nb=1\n", {{"a", "x\\"}, {"b", "1"}}},
        SyntaxCase{"Hash", "a=\\#\n", {{"a", "#"}}}, SyntaxCase{"Quote", "a=\\'\n", {{"a", "'"}}},
        SyntaxCase{"CapitalU", "a=\\U0041\n", {{"a", "U0041"}}},
        SyntaxCase{"Digit", "a=\\0\n", {{"a", "0"}}},
        SyntaxCase{"NulByte", "a=\\\0\n"s, {{"a", "\0"s}}},
        SyntaxCase{"HighByte", "a=\\\xE9\n", {{"a", "\xE9"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Continuation, PropertyFileSyntax,
    ::testing::Values(
        SyntaxCase{"SkipsLeadingBlanks", "a=one\\\n   two\n", {{"a", "onetwo"}}},
        SyntaxCase{"KeepsALeadingTab", "a=one\\\n\ttwo\n", {{"a", "one\ttwo"}}},
        SyntaxCase{"BlanksBehindATabStay", "a=one\\\n \t two\n", {{"a", "one\t two"}}},
        SyntaxCase{"SkipsEmptyLines", "a=one\\\n\ntwo\n", {{"a", "onetwo"}}},
        SyntaxCase{"SkipsBlankLines", "a=one\\\n  \n  \r\n two\n", {{"a", "onetwo"}}},
        SyntaxCase{"AfterCarriageReturn", "a=one\\\rtwo\n", {{"a", "onetwo"}}},
        SyntaxCase{"AfterBoth", "a=one\\\r\n  two\r\n", {{"a", "onetwo"}}},
        SyntaxCase{"Twice", "a=one\\\n two\\\n three\n", {{"a", "onetwothree"}}},
        SyntaxCase{"HashIsNoComment", "a=one\\\n# two\n", {{"a", "one# two"}}},
        SyntaxCase{"SignsAreContent", "a=one\\\nb=2\n", {{"a", "oneb=2"}}},
        SyntaxCase{"KeepsBlanksBeforeTheBackslash", "a=one \\\n two\n", {{"a", "one two"}}},
        SyntaxCase{"EscapedBlankKeepsTheIndent", "a=one\\\n \\ two\n", {{"a", "one two"}}},
        SyntaxCase{"AtOnceContinuedAgain", "a=one\\\n\\\ntwo\n", {{"a", "onetwo"}}},
        SyntaxCase{"UnicodeEscapeFollows", "a=one\\\n \\u0041\n", {{"a", "oneA"}}},
        SyntaxCase{"EmptyLineAfterItEndsNothing", "a=one\\\n\n\nb=2\n", {{"a", "oneb=2"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    UnicodeEscape, PropertyFileSyntax,
    ::testing::Values(SyntaxCase{"Ascii", "a=\\u0041\n", {{"a", "A"}}},
                      SyntaxCase{"LowerCaseDigits", "a=\\u00e9\n", {{"a", "\xC3\xA9"}}},
                      SyntaxCase{"UpperCaseDigits", "a=\\u00E9\n", {{"a", "\xC3\xA9"}}},
                      SyntaxCase{"ThreeBytes", "a=\\u20AC\n", {{"a", "\xE2\x82\xAC"}}},
                      SyntaxCase{"LastOfOneByte", "a=\\u007F\n", {{"a", "\x7F"}}},
                      SyntaxCase{"FirstOfTwoBytes", "a=\\u0080\n", {{"a", "\xC2\x80"}}},
                      SyntaxCase{"LastOfTwoBytes", "a=\\u07FF\n", {{"a", "\xDF\xBF"}}},
                      SyntaxCase{"FirstOfThreeBytes", "a=\\u0800\n", {{"a", "\xE0\xA0\x80"}}},
                      SyntaxCase{"LastOfThreeBytes", "a=\\uFFFF\n", {{"a", "\xEF\xBF\xBF"}}},
                      SyntaxCase{"Nul", "a=\\u0000\n", {{"a", "\0"s}}},
                      SyntaxCase{"LowSurrogate", "a=\\uDC00\n", {{"a", "\xED\xB0\x80"}}},
                      SyntaxCase{"HighSurrogate", "a=\\uD83D\n", {{"a", "\xED\xA0\xBD"}}},
                      SyntaxCase{"SurrogatePairIsNotCombined",
                                 "a=\\uD83D\\uDE00\n",
                                 {{"a", "\xED\xA0\xBD\xED\xB8\x80"}}},
                      SyntaxCase{"FifthDigitIsContent", "a=\\u00411\n", {{"a", "A1"}}},
                      SyntaxCase{"StopsAtTheFirstOtherCharacter", "a=\\u41zz!\n", {{"a", "A!"}}},
                      SyntaxCase{"NoDigitsGiveNul", "a=\\uzzzz\n", {{"a", "\0"s}}},
                      SyntaxCase{"LeadingBlank", "a=\\u 041\n", {{"a", "A"}}},
                      SyntaxCase{"LeadingBlanks", "a=\\u  41\n", {{"a", "A"}}},
                      SyntaxCase{"LeadingTab", "a=\\u\t041\n", {{"a", "A"}}},
                      SyntaxCase{"LeadingVerticalTab", "a=\\u\v041\n", {{"a", "A"}}},
                      SyntaxCase{"LeadingFormFeed", "a=\\u\f041\n", {{"a", "A"}}},
                      SyntaxCase{"LeadingLineBreaks", "a=\\u\r\n41\n", {{"a", "A"}}},
                      SyntaxCase{"OnlyBlanksGiveNul", "a=\\u    \n", {{"a", "\0"s}}},
                      SyntaxCase{"NoBreakSpaceIsNoBlank",
                                 "a=\\u\xA0"
                                 "041\n",
                                 {{"a", "\0"s}}},
                      SyntaxCase{"PlusSign", "a=\\u+041\n", {{"a", "A"}}},
                      SyntaxCase{"MinusSignGivesNothing", "a=\\u-041\n", {{"a", ""}}},
                      SyntaxCase{"MinusOneGivesNothing", "a=<\\u-001>\n", {{"a", "<>"}}},
                      SyntaxCase{"MinusNothingGivesNul", "a=\\u-000\n", {{"a", "\0"s}}},
                      SyntaxCase{"BlankThenSign", "a=\\u +41\n", {{"a", "A"}}},
                      SyntaxCase{"SignThenBlankGivesNul", "a=\\u+ 41\n", {{"a", "\0"s}}},
                      SyntaxCase{"TwoSignsGiveNul", "a=\\u+-41\n", {{"a", "\0"s}}},
                      SyntaxCase{"TwoMinusSignsGiveNul", "a=\\u--41\n", {{"a", "\0"s}}},
                      SyntaxCase{"Prefix", "a=\\u0x41\n", {{"a", "A"}}},
                      SyntaxCase{"CapitalPrefix", "a=\\u0X41\n", {{"a", "A"}}},
                      SyntaxCase{"PrefixAloneGivesNul", "a=\\u0xzz\n", {{"a", "\0"s}}},
                      SyntaxCase{"PrefixTwiceGivesNul", "a=\\u0x0x\n", {{"a", "\0"s}}},
                      SyntaxCase{"SignedPrefix", "a=\\u+0x7\n", {{"a", "\x07"}}},
                      SyntaxCase{"BlankThenPrefix", "a=\\u 0xA\n", {{"a", "\n"}}},
                      SyntaxCase{"NegativePrefixGivesNothing", "a=\\u-0x7\n", {{"a", ""}}},
                      SyntaxCase{"NulByteEndsTheDigits",
                                 "a=\\u41\0"
                                 "1\n"s,
                                 {{"a", "A"}}},
                      SyntaxCase{"NulByteFirstGivesNul",
                                 "a=\\u\0"
                                 "041\n"s,
                                 {{"a", "\0"s}}},
                      SyntaxCase{"TakesALineBreak", "a=\\u41\nzb\n", {{"a", "Ab"}}},
                      SyntaxCase{"TakesABackslash", "a=\\u41\\nx\n", {{"a", "Ax"}}},
                      SyntaxCase{"ExponentIsADigit", "a=\\u1e2f\n", {{"a", "\xE1\xB8\xAF"}}}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    EndOfInput, PropertyFileSyntax,
    ::testing::Values(SyntaxCase{"InAValueStoresIt", "k=v", {{"k", "v"}}},
                      SyntaxCase{"InAValueAfterOthers", "a=1\nk=v", {{"a", "1"}, {"k", "v"}}},
                      SyntaxCase{"AfterBlankSignBlankStoresEmpty", "k = ", {{"k", ""}}},
                      SyntaxCase{"AfterBlankSignStoresEmpty", "k =", {{"k", ""}}},
                      SyntaxCase{"AfterBlankColonStoresEmpty", "k :", {{"k", ""}}},
                      SyntaxCase{"AfterTwoSignsStoresEmpty", "k==", {{"k", ""}}},
                      SyntaxCase{"AfterOneSignStoresNothing", "k=", {}},
                      SyntaxCase{"AfterOneSignAndBlanksStoresNothing", "k=  ", {}},
                      SyntaxCase{"InAKeyStoresNothing", "k", {}},
                      SyntaxCase{"AfterABlankStoresNothing", "k ", {}},
                      SyntaxCase{"InAKeyWithLineBreakStoresNothing", "k\n", {}},
                      SyntaxCase{"InAKeyEscapeStoresNothing", "k\\", {}},
                      SyntaxCase{"InAnEmptyKeysValueStoresNothing", "=v", {}},
                      SyntaxCase{"InAnIndentedLineStoresNothing", " v", {}},
                      SyntaxCase{"AfterALoneBackslashStoresNothing", "k=v\\", {}},
                      SyntaxCase{"InAContinuationStoresNothing", "k=v\\\n", {}},
                      SyntaxCase{"InAContinuationsIndentStoresNothing", "k=v\\\n  \n", {}},
                      SyntaxCase{"BehindAContinuationStoresIt", "k=v\\\n w", {{"k", "vw"}}},
                      SyntaxCase{"ContinuationTabStoresIt", "k=v\\\n\t", {{"k", "v\t"}}},
                      SyntaxCase{"DroppedTextLeavesAnEarlierValue", "k=1\nk=2\\", {{"k", "1"}}},
                      SyntaxCase{"AfterAnEscapeStoresIt", "k=\\v", {{"k", "v"}}},
                      SyntaxCase{"TrailingBlanksAreKept", "k=v ", {{"k", "v "}}},
                      SyntaxCase{"FourDigits", "k=\\u0041", {{"k", "A"}}},
                      SyntaxCase{"ThreeDigits", "k=\\u041", {{"k", "A"}}},
                      SyntaxCase{"TwoDigits", "k=\\u41", {{"k", "A"}}},
                      SyntaxCase{"OneDigit", "k=\\u7", {{"k", "\x07"}}},
                      SyntaxCase{"NoDigits", "k=x\\u", {{"k", "x\0"s}}},
                      SyntaxCase{"OnlyASign", "k=\\u-", {{"k", "\0"s}}},
                      SyntaxCase{"ShortPrefix", "k=\\u0x", {{"k", "\0"s}}},
                      SyntaxCase{"ShortEscapeTakesTheLineBreak", "k=\\u41\n", {{"k", "A"}}},
                      SyntaxCase{"ShortNegativeGivesAnEmptyValue", "k=\\u-1", {{"k", ""}}},
                      SyntaxCase{"ShortEscapeInAKeyStoresNothing", "k\\u41", {}},
                      SyntaxCase{"EscapeOnlyOfAKeyStoresNothing", "\\u0041", {}},
                      SyntaxCase{"KeyOfOneNulByteIsNotEmpty", "\\u0000=v", {{"\0"s, "v"}}},
                      SyntaxCase{"KeyOfNothingButADroppedCodePointIsEmpty", "\\u-001=v", {}}),
    nameOf);

}  // namespace
}  // namespace velkor::configuration
