#include <gtest/gtest.h>

#include <clocale>
#include <cstdlib>
#include <locale>
#include <ostream>
#include <string>

#include "configuration/admin/TypedText.hpp"
#include "tests/configuration/admin/CommandTesting.hpp"
#include "tests/support/ScopedCommaCLocale.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"

namespace velkor::configuration {
namespace {

using namespace std::string_literals;
using testing::textOf;

struct TypingCase {
    const char* name;
    std::string text;
    std::string stored;
};

void PrintTo(const TypingCase& row, std::ostream* out) {
    *out << ::testing::PrintToString(row.text);
}

class ValueTyping : public testing::CommandTest,
                    public ::testing::WithParamInterface<TypingCase> {};

TEST_P(ValueTyping, StoresThis) {
    EXPECT_EQ(typed(GetParam().text), GetParam().stored);
}

TEST_P(ValueTyping, GivesTheSameToOtherCommands) {
    EXPECT_EQ(textOf(typedText(GetParam().text)), GetParam().stored);
}

TEST_P(ValueTyping, StoresTheSameUnderAHostsLocales) {
    {
        const testing::ScopedCommaCLocale cLocale;
        const testing::ScopedGlobalLocale global(
            std::locale(std::locale::classic(), new testing::CommaNumbers));
        run("set", {"key", GetParam().text});
    }
    EXPECT_EQ(textOf(store->get("key").get()), GetParam().stored);
}

std::string nameOf(const ::testing::TestParamInfo<TypingCase>& info) {
    return info.param.name;
}

INSTANTIATE_TEST_SUITE_P(
    Booleans, ValueTyping,
    ::testing::Values(TypingCase{"True", "true", "bool true"},
                      TypingCase{"False", "false", "bool false"},
                      TypingCase{"UpperCaseTrue", "TRUE", "string TRUE"},
                      TypingCase{"CapitalTrue", "True", "string True"},
                      TypingCase{"CapitalFalse", "False", "string False"},
                      TypingCase{"TrueWithABlankBefore", " true", "string  true"},
                      TypingCase{"TrueWithABlankBehind", "true ", "string true "},
                      TypingCase{"TrueWithALineBreak", "true\n", "string true\n"},
                      TypingCase{"TrueWithANul", "true\0"s, "string true\0"s},
                      TypingCase{"TrueWithAPoint", "true.", "string true."},
                      TypingCase{"Yes", "yes", "string yes"}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Integers, ValueTyping,
    ::testing::Values(
        TypingCase{"Plain", "42", "int 42"}, TypingCase{"Zero", "0", "int 0"},
        TypingCase{"One", "1", "int 1"}, TypingCase{"Negative", "-7", "int -7"},
        TypingCase{"NegativeZero", "-0", "int 0"}, TypingCase{"PlusSign", "+7", "int 7"},
        TypingCase{"LeadingZerosAreDecimal", "0010", "int 10"},
        TypingCase{"LeadingBlank", " 42", "int 42"},
        TypingCase{"LeadingTabAndLineBreak", "\t\n\v\f\r 42", "int 42"},
        TypingCase{"TrailingBlank", "42 ", "int 42"},
        TypingCase{"TrailingLetters", "12abc", "int 12"}, TypingCase{"Exponent", "1e5", "int 1"},
        TypingCase{"HexadecimalIsZero", "0x1F", "int 0"}, TypingCase{"Comma", "1,5", "int 1"},
        TypingCase{"Date", "2024-01-31", "int 2024"}, TypingCase{"NulBehind", "5\0x"s, "int 5"},
        TypingCase{"Largest", "2147483647", "int 2147483647"},
        TypingCase{"Smallest", "-2147483648", "int -2147483648"},
        TypingCase{"AboveTheLargest", "2147483648", "string 2147483648"},
        TypingCase{"BelowTheSmallest", "-2147483649", "string -2147483649"},
        TypingCase{"BeyondThirtyTwoBits", "4294967296", "string 4294967296"},
        TypingCase{"BeyondSixtyFourBits", "99999999999999999999", "string 99999999999999999999"},
        TypingCase{"TooLargeWithLetters", "4294967296x", "string 4294967296x"},
        TypingCase{"BlankAfterTheSign", "- 7", "string - 7"},
        TypingCase{"TwoSigns", "--7", "string --7"}, TypingCase{"SignAlone", "-", "string -"}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Doubles, ValueTyping,
    ::testing::Values(
        TypingCase{"Half", "0.5", "double 0.5"}, TypingCase{"PointFirst", ".5", "double 0.5"},
        TypingCase{"PointLast", "1.", "double 1"}, TypingCase{"Whole", "2.0", "double 2"},
        TypingCase{"Negative", "-0.25", "double -0.25"},
        TypingCase{"NegativeZero", "-0.0", "double -0"},
        TypingCase{"PlusSign", "+0.5", "double 0.5"},
        TypingCase{"LeadingBlank", " 0.5", "double 0.5"},
        TypingCase{"LeadingLineBreak", "\n0.5", "double 0.5"},
        TypingCase{"TrailingLetters", "1.5abc", "double 1.5"},
        TypingCase{"TwoPoints", "1.2.3", "double 1.2"},
        TypingCase{"PointBehindOtherText", "7 apples.", "double 7"},
        TypingCase{"Address", "127.0.0.1", "double 127"},
        TypingCase{"Exponent", "1.5e3", "double 1500"},
        TypingCase{"ExponentBeforeThePoint", "1e3.", "double 1000"},
        TypingCase{"NegativeExponent", "2.5E-1", "double 0.25"},
        TypingCase{"ExponentWithoutDigits", "1.5e", "double 1.5"},
        TypingCase{"Hexadecimal", "0x1.8p1", "double 3"},
        TypingCase{"HexadecimalUpperCase", "0X.8", "double 0.5"},
        TypingCase{"HexadecimalWithoutExponent", "0xA.", "double 10"},
        TypingCase{"Infinity", "inf.", "double inf"},
        TypingCase{"InfinityInFull", "-Infinity.", "double -inf"},
        TypingCase{"NotANumber", "nan.", "double nan"},
        TypingCase{"IntegerBeyondIntWithAPoint", "4294967296.", "double 4294967296"},
        TypingCase{"ManyDigits", "3.14159265358979323846", "double 3.1415926535897931"},
        TypingCase{"Largest", "1.7976931348623157e308", "double 1.7976931348623157e+308"},
        TypingCase{"SmallestNormal", "2.2250738585072014e-308", "double 2.2250738585072014e-308"},
        TypingCase{"Overflow", "1.0e309", "string 1.0e309"},
        TypingCase{"NegativeOverflow", "-1.0e309", "string -1.0e309"},
        TypingCase{"Underflow", "1.0e-400", "string 1.0e-400"},
        TypingCase{"InexactDenormal", "1.0e-310", "string 1.0e-310"},
        TypingCase{"ExactDenormal", "0x1.p-1074", "double 4.9406564584124654e-324"},
        TypingCase{"CommaThenPoint", "1,5.0", "double 1"},
        TypingCase{"NulBeforeThePoint", "1\0.5"s, "double 1"}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Texts, ValueTyping,
    ::testing::Values(TypingCase{"Letters", "abc", "string abc"},
                      TypingCase{"Empty", "", "string "}, TypingCase{"Blank", " ", "string  "},
                      TypingCase{"PointAlone", ".", "string ."},
                      TypingCase{"PointWithASign", "-.", "string -."},
                      TypingCase{"PointBeforeLetters", ".x", "string .x"},
                      TypingCase{"FileName", "file.txt", "string file.txt"},
                      TypingCase{"ExponentAlone", ".e5", "string .e5"},
                      TypingCase{"InfinityWithoutAPoint", "inf", "string inf"},
                      TypingCase{"NotANumberWithoutAPoint", "nan", "string nan"},
                      TypingCase{"CommaFirst", ",5", "string ,5"},
                      TypingCase{"Quoted", "'5'", "string '5'"},
                      TypingCase{"Utf8", "\xE2\x82\xAC", "string \xE2\x82\xAC"},
                      TypingCase{"IllFormedUtf8", "\xFF\xC3", "string \xFF\xC3"},
                      TypingCase{"NulByte", "\0"s, "string \0"s},
                      TypingCase{"NoBreakSpaceBeforeDigits",
                                 "\xA0"
                                 "5",
                                 "string \xA0"
                                 "5"}),
    nameOf);

class TypingUnderLocales : public testing::CommandTest {};

TEST_F(TypingUnderLocales, DecimalCommaOfTheCLocaleIsNotUsed) {
    const testing::ScopedCommaCLocale host;
    ASSERT_EQ(std::strtod("1,5", nullptr), 1.5) << "the host's locale is in force";
    run("set", {"key", "1.5"});
    EXPECT_EQ(boost::get<double>(store->get("key").get()), 1.5);
    run("set", {"key", "1,5.7"});
    EXPECT_EQ(boost::get<double>(store->get("key").get()), 1.0);
}

TEST_F(TypingUnderLocales, CLocaleOfTheProcessIsLeftAsItWas) {
    const testing::ScopedCommaCLocale host;
    run("set", {"key", "1.5"});
    EXPECT_EQ(std::strtod("1,5", nullptr), 1.5);
}

TEST_F(TypingUnderLocales, CLocaleOfTheThreadIsLeftAsItWas) {
    const locale_t own = ::newlocale(LC_ALL_MASK, "C.utf8", nullptr);
    ASSERT_NE(own, nullptr);
    const locale_t before = ::uselocale(own);
    run("set", {"key", "1.5"});
    run("set", {"key", "1.0e999"});
    const locale_t after = ::uselocale(before);
    ::freelocale(own);
    EXPECT_EQ(after, own);
}

TEST_F(TypingUnderLocales, DecimalCommaOfTheCppLocaleIsNotUsed) {
    const testing::ScopedGlobalLocale host(
        std::locale(std::locale::classic(), new testing::CommaNumbers));
    EXPECT_EQ(typed("1234.5"), "double 1234.5");
}

}  // namespace
}  // namespace velkor::configuration
