#include "settings/Conversion.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <limits>
#include <optional>
#include <ostream>
#include <ratio>
#include <string>
#include <vector>

#include "tests/settings/Spelled.hpp"
#include "tests/support/ScopedCommaCLocale.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationValue;

struct Row {
    ConfigurationValue value;
    std::string type;
    std::string (*read)(const ConfigurationValue&);
    std::string result;
};

void PrintTo(const Row& row, std::ostream* out) {
    *out << velkor::testing::textOf(row.value) << " as " << row.type;
}

template <class T>
Row as(ConfigurationValue value, std::string result) {
    return {std::move(value), Conversion<T>::typeName(), &readAs<T>, std::move(result)};
}

template <class T>
Row as(const char* text, std::string result) {
    return as<T>(ConfigurationValue(std::string(text)), std::move(result));
}

template <class T>
Row as(const char16_t* text, std::string result) {
    return as<T>(ConfigurationValue(std::u16string(text)), std::move(result));
}

using std::optional;
using std::vector;
using Text = std::string;
using WideText = std::u16string;
using Nanoseconds = std::chrono::nanoseconds;
using Milliseconds = std::chrono::milliseconds;
using Seconds = std::chrono::seconds;
using Hours = std::chrono::hours;
using ShortSeconds = std::chrono::duration<std::int8_t>;
using CountedSeconds = std::chrono::duration<std::uint16_t>;
using RealSeconds = std::chrono::duration<double>;
using RealMilliseconds = std::chrono::duration<float, std::milli>;
using Frames = std::chrono::duration<int, std::ratio<1, 60>>;
using Weeks = std::chrono::duration<int, std::ratio<7 * 86400>>;

constexpr double infinity = std::numeric_limits<double>::infinity();
const Text notTruth = "! not one of: true, false, on, off, yes, no, 1, 0";
const Text notWhole = "! not a whole number in plain digits";
const Text notInt = "! not within -2147483648 to 2147483647";
const Text list = "! a list, where one value is wanted";
const Text notTime = "! not a number with a unit: ns, us, ms, s, min, h or d";
const Text notSize =
    "! not a number with a unit: B, kB, KiB, MB, MiB, GB, GiB, TB, TiB, PB, PiB, EB or EiB";
const Text notLevel = "! not one of: debug, info, warning, warn";

const Row rows[] = {
    // Truth values.
    as<bool>(true, "true"),
    as<bool>(false, "false"),
    as<bool>("true", "true"),
    as<bool>("false", "false"),
    as<bool>("on", "true"),
    as<bool>("off", "false"),
    as<bool>("yes", "true"),
    as<bool>("no", "false"),
    as<bool>("1", "true"),
    as<bool>("0", "false"),
    as<bool>("TRUE", "true"),
    as<bool>("oFf", "false"),
    as<bool>(" yes\r\n", "true"),
    as<bool>(u"on", "true"),
    as<bool>(1, "true"),
    as<bool>(ConfigurationValue(0U), "false"),
    as<bool>(1.0, "true"),
    as<bool>("", notTruth),
    as<bool>("y", notTruth),
    as<bool>("tru", notTruth),
    as<bool>("truee", notTruth),
    as<bool>("true false", notTruth),
    as<bool>("01", notTruth),
    as<bool>(2, notTruth),
    as<bool>(0.5, notTruth),
    as<bool>(u"\u017Fno", notTruth),
    as<bool>(vector<bool>{true}, list),

    // Integers.
    as<int>(5, "5"),
    as<int>(-5, "-5"),
    as<int>(5U, "5"),
    as<int>(3.0, "3"),
    as<int>(-0.0, "0"),
    as<int>("8080", "8080"),
    as<int>("-1", "-1"),
    as<int>("-0", "0"),
    as<int>("010", "10"),
    as<int>(" \t42\n\v\f\r", "42"),
    as<int>(u"42", "42"),
    as<int>("2147483647", "2147483647"),
    as<int>("-2147483648", "-2147483648"),
    as<int>("2147483648", notInt),
    as<int>("-2147483649", notInt),
    as<int>("99999999999999999999999999999999", notInt),
    as<int>("-99999999999999999999999999999999", notInt),
    as<int>(4294967295U, notInt),
    as<int>(3e9, notInt),
    as<int>(1e20, notInt),
    as<int>(3.5, notWhole),
    as<int>(1e300, notWhole),
    as<int>(infinity, notWhole),
    as<int>(-infinity, notWhole),
    as<int>(std::numeric_limits<double>::quiet_NaN(), notWhole),
    as<int>(true, notWhole),
    as<int>("", notWhole),
    as<int>("  ", notWhole),
    as<int>("-", notWhole),
    as<int>("--1", notWhole),
    as<int>("+1", notWhole),
    as<int>("- 1", notWhole),
    as<int>("1 2", notWhole),
    as<int>("12x", notWhole),
    as<int>("0x10", notWhole),
    as<int>("1,000", notWhole),
    as<int>("1'000", notWhole),
    as<int>("3.0", notWhole),
    as<int>("1e3", notWhole),
    as<int>(u"\u0661", notWhole),
    as<int>(u"\u00A05", notWhole),
    as<int>(ConfigurationValue(Text("5\0", 2)), notWhole),
    as<int>(vector<int>{5}, list),
    as<int>(vector<Text>{"5"}, list),
    as<signed char>("-128", "-128"),
    as<signed char>("127", "127"),
    as<signed char>("128", "! not within -128 to 127"),
    as<signed char>(65, "65"),
    as<unsigned char>("255", "255"),
    as<unsigned char>("256", "! not within 0 to 255"),
    as<std::int16_t>("32767", "32767"),
    as<std::int16_t>("-32769", "! not within -32768 to 32767"),
    as<std::uint16_t>("65535", "65535"),
    as<std::uint16_t>(65536, "! not within 0 to 65535"),
    as<unsigned int>("4294967295", "4294967295"),
    as<unsigned int>(4294967295.0, "4294967295"),
    as<unsigned int>("4294967296", "! not within 0 to 4294967295"),
    as<unsigned int>(-1, "! not within 0 to 4294967295"),
    as<unsigned int>("-0", "0"),
    as<std::int64_t>("9223372036854775807", "9223372036854775807"),
    as<std::int64_t>("-9223372036854775808", "-9223372036854775808"),
    as<std::int64_t>("9223372036854775808",
                     "! not within -9223372036854775808 to 9223372036854775807"),
    as<std::int64_t>(9007199254740993.0, "9007199254740992"),
    as<std::uint64_t>("18446744073709551615", "18446744073709551615"),
    as<std::uint64_t>("18446744073709551616", "! not within 0 to 18446744073709551615"),
    as<long long>("-7", "-7"),

    // Numbers.
    as<double>(0.1, "0.10000000000000001"),
    as<double>(5, "5"),
    as<double>(4294967295U, "4294967295"),
    as<double>("0.5", "0.5"),
    as<double>("-.5", "-0.5"),
    as<double>("5.", "5"),
    as<double>("1e3", "1000"),
    as<double>("1E+3", "1000"),
    as<double>("1.7976931348623157e308", "1.7976931348623157e+308"),
    as<double>("4.9406564584124654e-324", "4.9406564584124654e-324"),
    as<double>(" 2.5 ", "2.5"),
    as<double>(u"2.5", "2.5"),
    as<double>("-0", "-0"),
    as<double>("2,5", "! not a number"),
    as<double>("1.234,5", "! not a number"),
    as<double>("+1", "! not a number"),
    as<double>("0x1p3", "! not a number"),
    as<double>("1e", "! not a number"),
    as<double>("", "! not a number"),
    as<double>("one", "! not a number"),
    as<double>("1 m", "! not a number"),
    as<double>(true, "! not a number"),
    as<double>("inf", "! not a finite number"),
    as<double>("-infinity", "! not a finite number"),
    as<double>("nan", "! not a finite number"),
    as<double>(infinity, "! not a finite number"),
    as<double>("1e400", "! out of the range of double"),
    as<double>("-1e400", "! out of the range of double"),
    as<double>("1e-400", "! out of the range of double"),
    as<double>("0e-400", "0"),
    as<double>(vector<double>{1}, list),
    as<float>("0.1", "0.10000000149011612"),
    as<float>(0.1, "0.10000000149011612"),
    as<float>(16777217, "16777216"),
    as<float>("3.4028235e38", "3.4028234663852886e+38"),
    as<float>("3.5e38", "! out of the range of float"),
    as<float>(1e300, "! out of the range of float"),
    as<float>(1e-300, "! out of the range of float"),

    // Texts.
    as<Text>("", ""),
    as<Text>("  kept  ", "  kept  "),
    as<Text>("\xFF", "\xFF"),
    as<Text>(u"\u20AC \U0001F600", "\xE2\x82\xAC \xF0\x9F\x98\x80"),
    as<Text>(ConfigurationValue(WideText(1, char16_t(0xD800))), "! ill-formed UTF-16"),
    as<Text>(u"\uFFFD", "\xEF\xBF\xBD"),
    as<Text>(true, "true"),
    as<Text>(-5, "-5"),
    as<Text>(5U, "5"),
    as<Text>(0.1, "0.1"),
    as<Text>(1e9, "1000000000"),
    as<Text>(1e21, "1e+21"),
    as<Text>(1e-7, "1e-07"),
    as<Text>(infinity, "inf"),
    as<Text>(vector<Text>{"a"}, list),
    as<WideText>("a\xE2\x82\xAC", "a\\u20AC"),
    as<WideText>("\xEF\xBF\xBD", "\\uFFFD"),
    as<WideText>("\xFF", "! ill-formed UTF-8"),
    as<WideText>("\xED\xA0\x80", "! ill-formed UTF-8"),
    as<WideText>("\xE2\x82", "! ill-formed UTF-8"),
    as<WideText>(u"  kept  ", "  kept  "),
    as<WideText>(ConfigurationValue(WideText(1, char16_t(0xDC00))), "\\uDC00"),
    as<WideText>(7, "7"),
    as<WideText>(vector<WideText>{u"a"}, list),

    // Enumerations.
    as<Level>("debug", "10"),
    as<Level>("info", "20"),
    as<Level>("warn", "30"),
    as<Level>("warning", "30"),
    as<Level>("WARNING", "30"),
    as<Level>(" Info\n", "20"),
    as<Level>(u"info", "20"),
    as<Level>("", notLevel),
    as<Level>("inf", notLevel),
    as<Level>("10", notLevel),
    as<Level>(10, notLevel),
    as<Level>(vector<Text>{"info"}, list),

    // Durations.
    as<Milliseconds>("250ms", "250 ticks"),
    as<Milliseconds>("1.5 s", "1500 ticks"),
    as<Milliseconds>("2h", "7200000 ticks"),
    as<Milliseconds>("1min", "60000 ticks"),
    as<Milliseconds>("1m", "60000 ticks"),
    as<Milliseconds>("1d", "86400000 ticks"),
    as<Milliseconds>("5000us", "5 ticks"),
    as<Milliseconds>("5000\xC2\xB5s", "5 ticks"),
    as<Milliseconds>(u"5000\u00B5s", "5 ticks"),
    as<Milliseconds>(u"5000\u03BCs", "5 ticks"),
    as<Milliseconds>("3000000ns", "3 ticks"),
    as<Milliseconds>("0.001s", "1 ticks"),
    as<Milliseconds>("0.0010000000000000000000000000000000000000000000000000s", "1 ticks"),
    as<Milliseconds>("-1.5s", "-1500 ticks"),
    as<Milliseconds>("1h30m", "5400000 ticks"),
    as<Milliseconds>(" 1 h  30 min 0.5s ", "5400500 ticks"),
    as<Milliseconds>("-1h30min", "-5400000 ticks"),
    as<Milliseconds>("0", "0 ticks"),
    as<Milliseconds>("-0.00", "0 ticks"),
    as<Milliseconds>(ConfigurationValue(0), "0 ticks"),
    as<Milliseconds>(0.0, "0 ticks"),
    as<Milliseconds>("007s", "7000 ticks"),
    as<Milliseconds>("250", notTime),
    as<Milliseconds>(250, notTime),
    as<Milliseconds>(0.5, notTime),
    as<Milliseconds>("", notTime),
    as<Milliseconds>("-", notTime),
    as<Milliseconds>("ms", notTime),
    as<Milliseconds>(".5s", notTime),
    as<Milliseconds>("5.s", notTime),
    as<Milliseconds>("1e3s", notTime),
    as<Milliseconds>("+1s", notTime),
    as<Milliseconds>("1,5s", notTime),
    as<Milliseconds>("- 1s", notTime),
    as<Milliseconds>("1h -30min", notTime),
    as<Milliseconds>("1h 30", notTime),
    as<Milliseconds>("1S", notTime),
    as<Milliseconds>("1MS", notTime),
    as<Milliseconds>("1sec", notTime),
    as<Milliseconds>("1s.", notTime),
    as<Milliseconds>("1[1]s", notTime),
    as<Milliseconds>("1[1/1000]s", notTime),
    as<Milliseconds>(true, notTime),
    as<Milliseconds>(infinity, notTime),
    as<Milliseconds>("30min 1h", "! its units do not go from large to small"),
    as<Milliseconds>("1min 1m", "! its units do not go from large to small"),
    as<Milliseconds>("1us", "! not a whole number of milliseconds"),
    as<Milliseconds>("0.0001s", "! not a whole number of milliseconds"),
    as<Milliseconds>("0.00000000000000000000000000000000000000000000000001s",
                     "! not a whole number of milliseconds"),
    as<Milliseconds>("1s 1us", "! not a whole number of milliseconds"),
    as<Milliseconds>(vector<Text>{"1s"}, list),
    as<Nanoseconds>("9223372036854775807ns", "9223372036854775807 ticks"),
    as<Nanoseconds>("-9223372036854775808ns", "-9223372036854775808 ticks"),
    as<Nanoseconds>("106752d",
                    "! not within -9223372036854775808 to 9223372036854775807 nanoseconds"),
    as<Nanoseconds>("340282366920938463463374607431768211456d",
                    "! not within -9223372036854775808 to 9223372036854775807 nanoseconds"),
    as<Nanoseconds>("0.0000000000000115740740740740740740d", "! not a whole number of nanoseconds"),
    as<Nanoseconds>("0.00000000000001d", "! not a whole number of nanoseconds"),
    as<Nanoseconds>("0.0000000000003125d", "27 ticks"),
    as<Hours>("1.5d", "36 ticks"),
    as<Hours>("60min", "1 ticks"),
    as<Hours>("1h 60min", "2 ticks"),
    as<Hours>("90min", "! not a whole number of hours"),
    as<Hours>("30min 1800s", "! not a whole number of hours"),
    as<ShortSeconds>("2min", "120 ticks"),
    as<ShortSeconds>("-128s", "-128 ticks"),
    as<ShortSeconds>("128s", "! not within -128 to 127 seconds"),
    as<CountedSeconds>("18h", "64800 ticks"),
    as<CountedSeconds>("-1s", "! not within 0 to 65535 seconds"),
    as<CountedSeconds>("-0s", "0 ticks"),
    as<Frames>("0.5s", "30 ticks"),
    as<Frames>("1[1/60]s", "1 ticks"),
    as<Frames>("1s 2[1/60]s", "62 ticks"),
    as<Frames>("1ms", "! not a whole number of [1/60]s"),
    as<Weeks>("7d", "1 ticks"),
    as<Weeks>("2[604800]s", "2 ticks"),
    as<Weeks>("1d", "! not a whole number of [604800]s"),
    as<RealSeconds>("250ms", "0.25 ticks"),
    as<RealSeconds>("1us", "9.9999999999999995e-07 ticks"),
    as<RealSeconds>("-1h 0.5s", "-3600.5 ticks"),
    as<RealSeconds>("0", "0 ticks"),
    as<RealSeconds>("1", notTime),
    as<RealMilliseconds>("0.5s", "500 ticks"),
    as<RealMilliseconds>("400000000000000000000000000000000000000ms", "! out of range"),
    as<RealMilliseconds>("-400000000000000000000000000000000000s", "! out of range"),

    // Sizes.
    as<ByteSize>("512", "512 bytes"),
    as<ByteSize>("512B", "512 bytes"),
    as<ByteSize>("2kB", "2000 bytes"),
    as<ByteSize>("2KiB", "2048 bytes"),
    as<ByteSize>("3MB", "3000000 bytes"),
    as<ByteSize>("16MiB", "16777216 bytes"),
    as<ByteSize>("16 MiB", "16777216 bytes"),
    as<ByteSize>("1.5GiB", "1610612736 bytes"),
    as<ByteSize>("1GB", "1000000000 bytes"),
    as<ByteSize>("1TB", "1000000000000 bytes"),
    as<ByteSize>("1TiB", "1099511627776 bytes"),
    as<ByteSize>("1PB", "1000000000000000 bytes"),
    as<ByteSize>("1PiB", "1125899906842624 bytes"),
    as<ByteSize>("1EB", "1000000000000000000 bytes"),
    as<ByteSize>("15EiB", "17293822569102704640 bytes"),
    as<ByteSize>("18446744073709551615", "18446744073709551615 bytes"),
    as<ByteSize>(u"1KiB", "1024 bytes"),
    as<ByteSize>(4096, "4096 bytes"),
    as<ByteSize>(4096U, "4096 bytes"),
    as<ByteSize>(1e9, "1000000000 bytes"),
    as<ByteSize>(1e19, "10000000000000000000 bytes"),
    as<ByteSize>("0.5kB", "500 bytes"),
    as<ByteSize>("0", "0 bytes"),
    as<ByteSize>("16EiB", "! not within 0 to 18446744073709551615 bytes"),
    as<ByteSize>("18446744073709551616", "! not within 0 to 18446744073709551615 bytes"),
    as<ByteSize>(-1, "! not within 0 to 18446744073709551615 bytes"),
    as<ByteSize>("-1kB", "! not within 0 to 18446744073709551615 bytes"),
    as<ByteSize>("0.5", "! not a whole number of bytes"),
    as<ByteSize>("1.0001KiB", "! not a whole number of bytes"),
    as<ByteSize>(0.5, "! not a whole number of bytes"),
    as<ByteSize>("2KB", notSize),
    as<ByteSize>("2k", notSize),
    as<ByteSize>("2mb", notSize),
    as<ByteSize>("2Mib", notSize),
    as<ByteSize>("2[1]s", notSize),
    as<ByteSize>("1MiB 1KiB", notSize),
    as<ByteSize>("1 000", notSize),
    as<ByteSize>("", notSize),
    as<ByteSize>(true, notSize),

    // What may be missing.
    as<optional<int>>("", "nothing"),
    as<optional<int>>(" \t", "nothing"),
    as<optional<int>>(u" ", "nothing"),
    as<optional<int>>("5", "some 5"),
    as<optional<int>>(5, "some 5"),
    as<optional<int>>("x", notWhole),
    as<optional<int>>(vector<int>{}, list),
    as<optional<bool>>(false, "some false"),
    as<optional<Text>>("", "nothing"),
    as<optional<Text>>(" ", "some  "),
    as<optional<WideText>>(u"", "nothing"),
    as<optional<WideText>>("a", "some a"),
    as<optional<Text>>(ConfigurationValue(WideText(1, char16_t(0xD800))), "! ill-formed UTF-16"),
    as<optional<vector<int>>>("", "nothing"),
    as<optional<vector<int>>>("1,2", "some [1|2]"),
    as<optional<vector<int>>>(vector<int>{}, "some []"),

    // Lists.
    as<vector<int>>(vector<int>{1, -2}, "[1|-2]"),
    as<vector<int>>(vector<unsigned int>{1, 2}, "[1|2]"),
    as<vector<int>>(vector<double>{1, 2}, "[1|2]"),
    as<vector<int>>(vector<Text>{"1", " 2 "}, "[1|2]"),
    as<vector<int>>(vector<WideText>{u"1"}, "[1]"),
    as<vector<int>>(vector<int>{}, "[]"),
    as<vector<int>>("", "[]"),
    as<vector<int>>("  ", "[]"),
    as<vector<int>>("1,2 , 3", "[1|2|3]"),
    as<vector<int>>(u"1,2", "[1|2]"),
    as<vector<int>>("5", "[5]"),
    as<vector<int>>(5, "[5]"),
    as<vector<int>>(5.0, "[5]"),
    as<vector<int>>("\"1\",\" 2\"", "[1|2]"),
    as<vector<int>>(vector<double>{1, 0.5}, "! element 2: not a whole number in plain digits"),
    as<vector<int>>("1,x", "! element 2: not a whole number in plain digits"),
    as<vector<int>>("1,", "! element 2: empty; an empty text is written \"\""),
    as<vector<int>>(",1", "! element 1: empty; an empty text is written \"\""),
    as<vector<int>>("1,,2", "! element 2: empty; an empty text is written \"\""),
    as<vector<int>>(true, "! element 1: not a whole number in plain digits"),
    as<vector<bool>>(vector<bool>{true, false}, "[true|false]"),
    as<vector<bool>>("on, off", "[true|false]"),
    as<vector<bool>>(true, "[true]"),
    as<vector<double>>(vector<int>{1}, "[1]"),
    as<vector<double>>("0.5,1e3", "[0.5|1000]"),
    as<vector<Text>>("a, b c ,d", "[a|b c|d]"),
    as<vector<Text>>("\"a, b\", \"\", \" c \"", "[a, b|| c ]"),
    as<vector<Text>>("\"say \\\"\\\\\\\"\"", "[say \"\\\"]"),
    as<vector<Text>>("it\"s, C:\\dir", "[it\"s|C:\\dir]"),
    as<vector<Text>>("\"\"", "[]"),
    as<vector<Text>>(vector<Text>{" a,b ", ""}, "[ a,b |]"),
    as<vector<Text>>(vector<WideText>{u"\u20AC"}, "[\xE2\x82\xAC]"),
    as<vector<Text>>(vector<WideText>{u"a", WideText(1, char16_t(0xD800))},
                     "! element 2: ill-formed UTF-16"),
    as<vector<Text>>("\"a", "! element 1: its quotation mark is not closed"),
    as<vector<Text>>("a, \"", "! element 2: its quotation mark is not closed"),
    as<vector<Text>>("\"a\"b", "! element 1: something behind its closing quotation mark"),
    as<vector<Text>>("\"a\" \"b\"", "! element 1: something behind its closing quotation mark"),
    as<vector<Text>>("\"\\n\"",
                     "! element 1: a backslash in quotation marks before neither of \" and \\"),
    as<vector<Text>>("\"\\",
                     "! element 1: a backslash in quotation marks before neither of \" and \\"),
    as<vector<WideText>>("a, \xE2\x82\xAC", "[a|\\u20AC]"),
    as<vector<WideText>>(vector<Text>{"\xFF"}, "! element 1: ill-formed UTF-8"),
    as<vector<Level>>("debug, WARN", "[10|30]"),
    as<vector<Milliseconds>>("1s, 1h 30min", "[1000 ticks|5400000 ticks]"),
    as<vector<Milliseconds>>(vector<int>{0, 5}, "! element 2: " + notTime.substr(2)),
    as<vector<ByteSize>>("1kB,1KiB", "[1000 bytes|1024 bytes]"),
    as<vector<ByteSize>>(vector<int>{1, 2}, "[1 bytes|2 bytes]"),
    as<vector<optional<int>>>("1,\"\",3", "[some 1|nothing|some 3]"),
};

class ConversionRow : public ::testing::TestWithParam<Row> {};

TEST_P(ConversionRow, GivesItsResult) {
    EXPECT_EQ(GetParam().read(GetParam().value), GetParam().result);
}

TEST_P(ConversionRow, GivesTheSameWithCommasInNumbersEverywhere) {
    const velkor::testing::ScopedCommaCLocale ofC;
    const velkor::testing::ScopedGlobalLocale ofCpp(
        std::locale(std::locale::classic(), new velkor::testing::CommaNumbers));
    EXPECT_EQ(GetParam().read(GetParam().value), GetParam().result);
}

INSTANTIATE_TEST_SUITE_P(Conversion, ConversionRow, ::testing::ValuesIn(rows));

struct NameRow {
    std::string actual;
    std::string expected;
};

void PrintTo(const NameRow& row, std::ostream* out) {
    *out << row.expected;
}

const NameRow names[] = {
    {Conversion<bool>::typeName(), "bool"},
    {Conversion<int>::typeName(), "int"},
    {Conversion<unsigned int>::typeName(), "uint"},
    {Conversion<signed char>::typeName(), "int8"},
    {Conversion<std::uint16_t>::typeName(), "uint16"},
    {Conversion<std::int64_t>::typeName(), "int64"},
    {Conversion<float>::typeName(), "float"},
    {Conversion<double>::typeName(), "double"},
    {Conversion<Text>::typeName(), "text"},
    {Conversion<WideText>::typeName(), "text"},
    {Conversion<Level>::typeName(), "one of: debug, info, warning, warn"},
    {Conversion<Milliseconds>::typeName(), "duration in milliseconds"},
    {Conversion<std::chrono::minutes>::typeName(), "duration in minutes"},
    {Conversion<RealSeconds>::typeName(), "duration in seconds"},
    {Conversion<Frames>::typeName(), "duration in [1/60]s"},
    {Conversion<ByteSize>::typeName(), "size in bytes"},
    {Conversion<optional<int>>::typeName(), "int, or nothing"},
    {Conversion<vector<Text>>::typeName(), "list of text"},
};

class ConversionName : public ::testing::TestWithParam<NameRow> {};

TEST_P(ConversionName, TellsWhatIsWanted) {
    EXPECT_EQ(GetParam().actual, GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Conversion, ConversionName, ::testing::ValuesIn(names));

const NameRow shown[] = {
    {Conversion<bool>::show(true), "true"},
    {Conversion<signed char>::show(-5), "-5"},
    {Conversion<double>::show(0.1), "0.1"},
    {Conversion<double>::show(1e20), "100000000000000000000"},
    {Conversion<double>::show(1e-6), "0.000001"},
    {Conversion<double>::show(infinity), "inf"},
    {Conversion<float>::show(0.1F), "0.1"},
    {Conversion<WideText>::show(u"\u20AC"), "\xE2\x82\xAC"},
    {Conversion<Level>::show(Level::warning), "warning"},
    {Conversion<Level>::show(static_cast<Level>(7)), "7"},
    {Conversion<Milliseconds>::show(Milliseconds(0)), "0s"},
    {Conversion<Milliseconds>::show(Milliseconds(-1500)), "-1500ms"},
    {Conversion<Milliseconds>::show(Milliseconds(90000)), "90s"},
    {Conversion<Milliseconds>::show(Milliseconds(7200000)), "2h"},
    {Conversion<Frames>::show(Frames(30)), "500ms"},
    {Conversion<Frames>::show(Frames(1)), "1[1/60]s"},
    {Conversion<RealSeconds>::show(RealSeconds(0.25)), "0.25s"},
    {Conversion<ByteSize>::show(ByteSize{0}), "0B"},
    {Conversion<ByteSize>::show(ByteSize{2000}), "2kB"},
    {Conversion<ByteSize>::show(ByteSize{16777216}), "16MiB"},
    {Conversion<ByteSize>::show(ByteSize{1025}), "1025B"},
    {Conversion<optional<int>>::show(std::nullopt), ""},
    {Conversion<vector<int>>::show({1, 2}), "1, 2"},
    {Conversion<vector<Text>>::show({"a", "", "b,c", " d", "\"e"}),
     "a, \"\", \"b,c\", \" d\", \"\\\"e\""},
};

class ConversionShown : public ::testing::TestWithParam<NameRow> {};

TEST_P(ConversionShown, IsShort) {
    EXPECT_EQ(GetParam().actual, GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Conversion, ConversionShown, ::testing::ValuesIn(shown));

}  // namespace
}  // namespace velkor::settings::testing
