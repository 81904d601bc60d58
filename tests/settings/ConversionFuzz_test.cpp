#include <gtest/gtest.h>

#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <optional>
#include <random>
#include <ratio>
#include <string>
#include <vector>

#include "settings/Conversion.hpp"
#include "tests/settings/SecondReading.hpp"
#include "tests/settings/Spelled.hpp"

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationValue;
using Words = std::vector<std::string>;
using Random = std::mt19937_64;

constexpr int rounds = 10000;

std::size_t below(Random& random, std::size_t limit) {
    return static_cast<std::size_t>(random() % limit);
}

// A text of up to `most` words.
std::string sentence(Random& random, const Words& words, std::size_t most) {
    std::string text;
    for (std::size_t count = below(random, most + 1); count > 0; --count) {
        text += words[below(random, words.size())];
    }
    return text;
}

// What `Conversion` makes of `text`, without its reason.
template <class T>
std::string firstReading(const std::string& text) {
    const std::string read = readAs<T>(ConfigurationValue(text));
    return read.substr(0, read.rfind("! ", 0) == 0 ? 1 : read.find(" ticks"));
}

// Both readings must agree on every text, and often enough on more than that it is none.
template <class T, class Second>
void expectSameReadings(const Words& words, std::size_t most, Second&& second) {
    Random random(20240611);
    int read = 0;
    for (int round = 0; round < rounds; ++round) {
        const std::string text = sentence(random, words, most);
        const std::string result = firstReading<T>(text);
        ASSERT_EQ(result, second(text)) << '"' << text << '"';
        if (result != "!") ++read;
    }
    EXPECT_GT(read, rounds / 50);
    EXPECT_LT(read, rounds - rounds / 50);
}

const Words digits = {"0", "1", "2", "5", "9", "00", "12", "65535", "32768", "2147483648"};

Words with(Words words, const Words& more) {
    words.insert(words.end(), more.begin(), more.end());
    return words;
}

const Words wholeWords = with(digits, {"-", "-", " ", "\t", "+", ".", "e", "x", "\xFF",
                                       "18446744073709551615", "9223372036854775808"});

TEST(ConversionFuzz, ReadsTruthLikeASecondReading) {
    expectSameReadings<bool>(
        {"true", "FALSE", "on", "o", "ff", "f", "Yes", "n", "O", "1", "0", " ", "\n", "\v"}, 4,
        secondTruth);
}

TEST(ConversionFuzz, ReadsInt16LikeASecondReading) {
    expectSameReadings<std::int16_t>(wholeWords, 4, [](const std::string& text) {
        return secondWhole(text, {"32768", "32767"});
    });
}

TEST(ConversionFuzz, ReadsUint8LikeASecondReading) {
    expectSameReadings<std::uint8_t>(wholeWords, 3, [](const std::string& text) {
        return secondWhole(text, {"0", "255"});
    });
}

TEST(ConversionFuzz, ReadsInt64LikeASecondReading) {
    expectSameReadings<std::int64_t>(wholeWords, 5, [](const std::string& text) {
        return secondWhole(text, {"9223372036854775808", "9223372036854775807"});
    });
}

TEST(ConversionFuzz, ReadsUint64LikeASecondReading) {
    expectSameReadings<std::uint64_t>(wholeWords, 5, [](const std::string& text) {
        return secondWhole(text, {"0", "18446744073709551615"});
    });
}

TEST(ConversionFuzz, ReadsDoublesLikeASecondReading) {
    expectSameReadings<double>(
        with(digits, {"-", ".", ".", "e", "E-", "e+", "e30", "e-32", "1234567", " ", "inf", ","}),
        7, [](const std::string& text) {
            const std::optional<double> number = secondNumber(text);
            return number ? spelled(*number) : "!";
        });
}

SecondUnits timesInMilliseconds() {
    return {{{"ns", {}, {1000, 1000}},
             {"us", {}, {1000}},
             {"\xC2\xB5s", {}, {1000}},
             {"\xCE\xBCs", {}, {1000}},
             {"ms", {}, {}},
             {"s", {1000}, {}},
             {"m", {1000, 60}, {}},
             {"min", {1000, 60}, {}},
             {"h", {1000, 3600}, {}},
             {"d", {1000, 3600, 24}, {}}},
            "",
            true,
            {"9223372036854775808", "9223372036854775807"}};
}

const Words timeWords =
    with(digits, {"ms", "s", "s ", "m", "min ", "h", "h ",  "d ", "us", "\xC2\xB5s",
                  "ns", "0", ".",  "5", " ",    "-", "000", "",   "S",  ","});

TEST(ConversionFuzz, ReadsMillisecondsLikeASecondReading) {
    expectSameReadings<std::chrono::milliseconds>(timeWords, 6, [](const std::string& text) {
        return secondQuantity(text, timesInMilliseconds());
    });
}

TEST(ConversionFuzz, ReadsNanosecondsLikeASecondReading) {
    SecondUnits units = timesInMilliseconds();
    for (SecondUnit& unit : units.units) {
        for (const int factor : {1000, 1000}) unit.multiply.push_back(factor);
    }
    expectSameReadings<std::chrono::nanoseconds>(
        timeWords, 6, [&](const std::string& text) { return secondQuantity(text, units); });
}

TEST(ConversionFuzz, ReadsCountedHoursLikeASecondReading) {
    SecondUnits units = timesInMilliseconds();
    for (SecondUnit& unit : units.units) {
        for (const int divisor : {1000, 3600}) unit.divide.push_back(divisor);
    }
    units.limits = {"0", "65535"};
    using CountedHours = std::chrono::duration<std::uint16_t, std::ratio<3600>>;
    expectSameReadings<CountedHours>(
        timeWords, 6, [&](const std::string& text) { return secondQuantity(text, units); });
}

TEST(ConversionFuzz, ReadsSizesLikeASecondReading) {
    const SecondUnits units = {{{"B", {}, {}},
                                {"kB", {1000}, {}},
                                {"KiB", {1024}, {}},
                                {"MB", {1000, 1000}, {}},
                                {"MiB", {1024, 1024}, {}},
                                {"GB", {1000, 1000, 1000}, {}},
                                {"GiB", {1024, 1024, 1024}, {}},
                                {"TB", {1000, 1000, 1000, 1000}, {}},
                                {"TiB", {1024, 1024, 1024, 1024}, {}},
                                {"PB", {1000, 1000, 1000, 1000, 1000}, {}},
                                {"PiB", {1024, 1024, 1024, 1024, 1024}, {}},
                                {"EB", {1000, 1000, 1000, 1000, 1000, 1000}, {}},
                                {"EiB", {1024, 1024, 1024, 1024, 1024, 1024}, {}}},
                               "B",
                               false,
                               {"0", "18446744073709551615"}};
    const Words words = with(digits, {"B", "kB", "K", "iB", "MiB", "MB", "GiB", "TB", "PiB", "EB",
                                      ".", ".5", " ", "-", "125", "KiB", "5", "b"});
    expectSameReadings<ByteSize>(words, 4, [&](const std::string& text) {
        const std::string bytes = secondQuantity(text, units);
        return bytes == "!" ? bytes : bytes + " bytes";
    });
}

TEST(ConversionFuzz, ReadsListsLikeASecondReading) {
    const Words words = {"a", "b ", ",", ", ", "\"", "\"", "\\", "\\\"", " ", "\t", "\",", ",\""};
    expectSameReadings<std::vector<std::string>>(words, 9, [](const std::string& text) {
        const auto elements = secondList(text);
        return elements ? spelled(*elements) : "!";
    });
}

TEST(ConversionFuzz, TakesUtf8LikeASecondReading) {
    Words words = {"a", "\xC3\xA4", "\xE2\x82\xAC", "\xF0\x9F\x98\x80"};
    for (const int byte : {0x80, 0x8F, 0x90, 0x9F, 0xA0, 0xBF, 0xC1, 0xC2, 0xDF, 0xE0, 0xE1, 0xED,
                           0xEF, 0xF0, 0xF1, 0xF4, 0xF5, 0xFF}) {
        words.emplace_back(1, static_cast<char>(byte));
    }
    Random random(7);
    int wellFormed = 0;
    for (int round = 0; round < rounds; ++round) {
        const std::string text = sentence(random, words, 5);
        const auto read = Conversion<std::u16string>::from(ConfigurationValue(text));
        ASSERT_EQ(static_cast<bool>(read), isUtf8(text)) << ::testing::PrintToString(text);
        if (!read) continue;
        ++wellFormed;
        ASSERT_EQ(Conversion<std::u16string>::show(read.value()), text);
    }
    EXPECT_GT(wellFormed, rounds / 50);
}

// What is shown is read as the same value again.
template <class T, class Make>
void expectRoundTrips(Make&& make) {
    Random random(4711);
    for (int round = 0; round < rounds; ++round) {
        const T value = make(random);
        const std::string text = Conversion<T>::show(value);
        ASSERT_EQ(readAs<T>(ConfigurationValue(text)), spelled(value)) << '"' << text << '"';
    }
}

// Of every size, each as likely.
template <class T>
T anyWhole(Random& random) {
    return static_cast<T>(static_cast<T>(random()) >> below(random, sizeof(T) * 8));
}

// Any bits that are a finite number.
template <class T, class Bits>
T anyNumber(Random& random) {
    while (true) {
        const Bits bits = static_cast<Bits>(random());
        T number{};
        std::memcpy(&number, &bits, sizeof number);
        if (std::isfinite(number)) return number;
    }
}

TEST(ConversionRoundTrip, KeepsIntegers) {
    expectRoundTrips<std::int8_t>(anyWhole<std::int8_t>);
    expectRoundTrips<std::uint8_t>(anyWhole<std::uint8_t>);
    expectRoundTrips<std::int16_t>(anyWhole<std::int16_t>);
    expectRoundTrips<int>(anyWhole<int>);
    expectRoundTrips<unsigned int>(anyWhole<unsigned int>);
    expectRoundTrips<std::int64_t>(anyWhole<std::int64_t>);
    expectRoundTrips<std::uint64_t>(anyWhole<std::uint64_t>);
}

template <class Duration>
Duration anyTicks(Random& random) {
    return Duration(anyWhole<typename Duration::rep>(random));
}

template <class Duration>
void expectTicksRoundTrip() {
    expectRoundTrips<Duration>(anyTicks<Duration>);
}

TEST(ConversionRoundTrip, KeepsTicks) {
    expectTicksRoundTrip<std::chrono::nanoseconds>();
    expectTicksRoundTrip<std::chrono::milliseconds>();
    expectTicksRoundTrip<std::chrono::hours>();
    expectTicksRoundTrip<std::chrono::duration<std::int8_t>>();
    expectTicksRoundTrip<std::chrono::duration<std::uint64_t>>();
}

TEST(ConversionRoundTrip, KeepsTicksOfUnusualLength) {
    expectTicksRoundTrip<std::chrono::duration<int, std::ratio<1, 60>>>();
    expectTicksRoundTrip<std::chrono::duration<std::int64_t, std::ratio<1001, 30000>>>();
    expectTicksRoundTrip<std::chrono::duration<std::int64_t, std::atto>>();
    expectTicksRoundTrip<std::chrono::duration<std::int64_t, std::exa>>();
}

template <class Duration>
Duration anyRealTicks(Random& random) {
    return Duration(anyNumber<double, std::uint64_t>(random));
}

TEST(ConversionRoundTrip, KeepsRealTicks) {
    using Seconds = std::chrono::duration<double>;
    using Pictures = std::chrono::duration<double, std::ratio<1001, 30000>>;
    expectRoundTrips<Seconds>(anyRealTicks<Seconds>);
    expectRoundTrips<Pictures>(anyRealTicks<Pictures>);
}

TEST(ConversionRoundTrip, KeepsFloatTicks) {
    using FloatTicks = std::chrono::duration<float, std::milli>;
    expectRoundTrips<FloatTicks>(
        [](Random& random) { return FloatTicks(anyNumber<float, std::uint32_t>(random)); });
}

TEST(ConversionRoundTrip, KeepsDoubles) {
    expectRoundTrips<double>(anyNumber<double, std::uint64_t>);
}

TEST(ConversionRoundTrip, KeepsFloats) {
    expectRoundTrips<float>(anyNumber<float, std::uint32_t>);
}

TEST(ConversionRoundTrip, KeepsSizes) {
    expectRoundTrips<ByteSize>([](Random& random) {
        const std::uint64_t units[] = {1, 1000, 1024, 1000000, 1048576};
        return ByteSize{anyWhole<std::uint32_t>(random) * units[below(random, 5)]};
    });
}

TEST(ConversionRoundTrip, KeepsEnumerators) {
    expectRoundTrips<Level>([](Random& random) {
        const Level levels[] = {Level::debug, Level::info, Level::warning};
        return levels[below(random, 3)];
    });
}

TEST(ConversionRoundTrip, KeepsListsOfTexts) {
    const Words words = {"a", ",", "\"", "\\", " ", "\t", "\n", "\xE2\x82\xAC", "\xFF"};
    expectRoundTrips<Words>([&](Random& random) {
        Words list(below(random, 4));
        for (std::string& text : list) text = sentence(random, words, 4);
        return list;
    });
}

TEST(ConversionRoundTrip, KeepsListsOfWhatMayBeMissing) {
    using List = std::vector<std::optional<std::chrono::milliseconds>>;
    expectRoundTrips<List>([](Random& random) {
        List list(below(random, 4));
        for (auto& element : list) {
            if (below(random, 2) == 0) element = std::chrono::milliseconds(anyWhole<int>(random));
        }
        return list;
    });
}

TEST(ConversionRoundTrip, KeepsListsOfTruthValues) {
    expectRoundTrips<std::vector<bool>>([](Random& random) {
        std::vector<bool> list(below(random, 4));
        for (std::size_t i = 0; i < list.size(); ++i) list[i] = below(random, 2) == 0;
        return list;
    });
}

// So long that reading them would not end if it took more than time in proportion.

std::string repeated(const std::string& text, std::size_t times) {
    std::string result;
    result.reserve(text.size() * times);
    while (times-- > 0) result += text;
    return result;
}

constexpr std::size_t many = 1000000;

template <class T>
std::string readLong(const std::string& text) {
    return readAs<T>(ConfigurationValue(text));
}

TEST(ConversionOfLongText, ReadsAnInteger) {
    EXPECT_EQ(readLong<int>(repeated("0", many) + "7"), "7");
    EXPECT_EQ(readLong<int>(repeated(" ", many) + "7" + repeated("\n", many)), "7");
    EXPECT_EQ(readLong<int>(repeated("9", many)), "! not within -2147483648 to 2147483647");
}

TEST(ConversionOfLongText, ReadsANumber) {
    EXPECT_EQ(readLong<double>("0." + repeated("3", many)), "0.33333333333333331");
    EXPECT_EQ(readLong<double>(repeated("0", many) + "1"), "1");
    EXPECT_EQ(readLong<double>(repeated("9", many)), "! out of the range of double");
}

TEST(ConversionOfLongText, ReadsADuration) {
    using std::chrono::milliseconds;
    EXPECT_EQ(readLong<milliseconds>("1." + repeated("0", many) + "s"), "1000 ticks");
    EXPECT_EQ(readLong<milliseconds>(repeated("0", many) + "1" + repeated(" ", many) + "s"),
              "1000 ticks");
    EXPECT_EQ(readLong<milliseconds>("0." + repeated("0", many) + "1s"),
              "! not a whole number of milliseconds");
    EXPECT_EQ(readLong<milliseconds>(repeated("1d", many)),
              "! its units do not go from large to small");
    EXPECT_EQ(readLong<milliseconds>("1" + repeated("s", many)),
              "! not a number with a unit: ns, us, ms, s, min, h or d");
    EXPECT_EQ(readLong<std::chrono::duration<double>>("0." + repeated("5", many) + "s"),
              "0.55555555555555558 ticks");
}

TEST(ConversionOfLongText, ReadsAList) {
    using Texts = std::vector<std::string>;
    const auto read = Conversion<Texts>::from(repeated("a ,", many) + repeated(" ", many) + "b");
    ASSERT_TRUE(read);
    EXPECT_EQ(read.value().size(), many + 1);
    EXPECT_EQ(readLong<Texts>("\"" + repeated("\\\"", many) + "\""),
              "[" + repeated("\"", many) + "]");
    EXPECT_EQ(readLong<Texts>(repeated("\"", many)),
              "! element 1: something behind its closing quotation mark");
    EXPECT_EQ(readLong<Texts>(repeated(",", many)),
              "! element 1: empty; an empty text is written \"\"");
}

TEST(ConversionOfLongText, ReadsAnyText) {
    EXPECT_EQ(readLong<std::u16string>(repeated("\xE2\x82", many)), "! ill-formed UTF-8");
    EXPECT_EQ(readLong<Level>(repeated(" ", many) + "info"), "20");
    EXPECT_EQ(readLong<bool>(repeated("true", many)),
              "! not one of: true, false, on, off, yes, no, 1, 0");
}

}  // namespace
}  // namespace velkor::settings::testing
