#include <gtest/gtest.h>

#include <limits>
#include <locale>
#include <ostream>
#include <string>
#include <vector>

#include "tests/configuration/admin/CommandTesting.hpp"
#include "tests/support/ScopedCommaCLocale.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"

namespace velkor::configuration {
namespace {

using namespace std::string_literals;

struct FormatCase {
    const char* name;
    ConfigurationValue value;
    std::string text;
};

void PrintTo(const FormatCase& row, std::ostream* out) {
    *out << ::testing::PrintToString(row.text);
}

class ValueFormat : public testing::CommandTest,
                    public ::testing::WithParamInterface<FormatCase> {};

TEST_P(ValueFormat, IsShownLikeThis) {
    EXPECT_EQ(shown(GetParam().value), GetParam().text);
}

TEST_P(ValueFormat, IsListedLikeThis) {
    store->set("key", GetParam().value);
    EXPECT_EQ(run("list"), "key = " + GetParam().text + "\n");
}

TEST_P(ValueFormat, IsShownTheSameUnderAHostsLocales) {
    const testing::ScopedCommaCLocale cLocale;
    const testing::ScopedGlobalLocale global(
        std::locale(std::locale::classic(), new testing::CommaNumbers));
    EXPECT_EQ(shown(GetParam().value), GetParam().text);
}

std::string nameOf(const ::testing::TestParamInfo<FormatCase>& info) {
    return info.param.name;
}

constexpr double infinity = std::numeric_limits<double>::infinity();

INSTANTIATE_TEST_SUITE_P(
    Scalars, ValueFormat,
    ::testing::Values(
        FormatCase{"True", true, "true"}, FormatCase{"False", false, "false"},
        FormatCase{"Int", 1234567, "1234567"}, FormatCase{"NegativeInt", -7, "-7"},
        FormatCase{"SmallestInt", std::numeric_limits<int>::min(), "-2147483648"},
        FormatCase{"Uint", 4294967295U, "4294967295"}, FormatCase{"WholeDouble", 2.0, "2"},
        FormatCase{"LargeDouble", 1234567.0, "1.23457e+06"}, FormatCase{"TenthDouble", 0.1, "0.1"},
        FormatCase{"SixDigitsDouble", 123456.0, "123456"},
        FormatCase{"SmallDouble", 0.00001, "1e-05"}, FormatCase{"NegativeZeroDouble", -0.0, "-0"},
        FormatCase{"RoundedDouble", 2.0 / 3, "0.666667"},
        FormatCase{"InfiniteDouble", infinity, "inf"},
        FormatCase{"NegativeInfiniteDouble", -infinity, "-inf"},
        FormatCase{"NotANumber", std::numeric_limits<double>::quiet_NaN(), "nan"},
        FormatCase{"Text", "x"s, "'x'"}, FormatCase{"EmptyText", ""s, "''"},
        FormatCase{"TextWithAQuote", "it's"s, "'it's'"},
        FormatCase{"TextWithALineBreak", "a\nb"s, "'a\nb'"},
        FormatCase{"TextWithANul", "a\0b"s, "'a\0b'"s},
        FormatCase{"IllFormedText", "\xFF"s, "'\xFF'"},
        FormatCase{"WideText", u"gr\u00FC\u00DFe"s,
                   "'gr\xC3\xBC\xC3\x9F"
                   "e'"},
        FormatCase{"WideTextBeyondTheBasicPlane", u"\U0001F600"s, "'\xF0\x9F\x98\x80'"},
        FormatCase{"EmptyWideText", u""s, "''"},
        FormatCase{"WideTextWithALoneSurrogate", std::u16string(1, char16_t{0xD800}),
                   "'\xEF\xBF\xBD'"}),
    nameOf);

INSTANTIATE_TEST_SUITE_P(
    Arrays, ValueFormat,
    ::testing::Values(
        FormatCase{"Bools", std::vector<bool>{true, false, true}, "[true, false, true]"},
        FormatCase{"Ints", std::vector<int>{1, 2, 3}, "[1, 2, 3]"},
        FormatCase{"LargeInts", std::vector<int>{-1234567}, "[-1234567]"},
        FormatCase{"Uints", std::vector<unsigned int>{0, 4294967295U}, "[0, 4294967295]"},
        FormatCase{"Doubles", std::vector<double>{2.0, 0.1, 1234567.0}, "[2, 0.1, 1.23457e+06]"},
        FormatCase{"Texts", std::vector<std::string>{"a", "", "b, c"}, "['a', '', 'b, c']"},
        FormatCase{"WideTexts", std::vector<std::u16string>{u"\u20AC", u""},
                   "['\xE2\x82\xAC', '']"},
        FormatCase{"NoBools", std::vector<bool>{}, "[]"},
        FormatCase{"NoInts", std::vector<int>{}, "[]"},
        FormatCase{"NoUints", std::vector<unsigned int>{}, "[]"},
        FormatCase{"NoDoubles", std::vector<double>{}, "[]"},
        FormatCase{"NoTexts", std::vector<std::string>{}, "[]"},
        FormatCase{"NoWideTexts", std::vector<std::u16string>{}, "[]"}),
    nameOf);

}  // namespace
}  // namespace velkor::configuration
