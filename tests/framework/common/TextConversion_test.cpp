#include "framework/common/TextConversion.hpp"

#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <ostream>
#include <stdexcept>
#include <string>

#include "tests/support/Thrown.hpp"

namespace {

using velkor::common::TextConversion;
using velkor::testing::thrownText;

std::u16string toUtf16(const std::string& text) {
    return TextConversion("UTF-8").toUtf16(text);
}

std::string fromUtf16(const std::u16string& text) {
    return TextConversion("UTF-8").fromUtf16(text);
}

// The same text in both encodings.
struct Text {
    const char* name;
    std::string narrow;
    std::u16string wide;
};

std::ostream& operator<<(std::ostream& out, const Text& text) {
    return out << text.name;
}

constexpr auto textName = [](const auto& row) { return std::string(row.param.name); };

class TextConversionOf : public ::testing::TestWithParam<Text> {};

TEST_P(TextConversionOf, GivesTheWideForm) {
    EXPECT_EQ(toUtf16(GetParam().narrow), GetParam().wide);
}

TEST_P(TextConversionOf, GivesTheNarrowForm) {
    EXPECT_EQ(fromUtf16(GetParam().wide), GetParam().narrow);
}

INSTANTIATE_TEST_SUITE_P(
    Text, TextConversionOf,
    ::testing::Values(Text{"Nothing", "", u""},
                      Text{"Ascii", "plain text\t\r\n\x7f", u"plain text\t\r\n\x7f"},
                      Text{"Nul", std::string("a\0b", 3), std::u16string(u"a\0b", 3)},
                      Text{"OnlyANul", std::string(1, '\0'), std::u16string(1, u'\0')},
                      Text{"FirstOfTwoBytes", "\xc2\x80", std::u16string(1, char16_t{0x80})},
                      Text{"LastOfTwoBytes", "\xdf\xbf", u"\u07ff"},
                      Text{"FirstOfThreeBytes", "\xe0\xa0\x80", u"\u0800"},
                      Text{"LastBeforeTheSurrogates", "\xed\x9f\xbf",
                           std::u16string(1, char16_t{0xD7FF})},
                      Text{"FirstBehindTheSurrogates", "\xee\x80\x80", u"\ue000"},
                      Text{"ReplacementCharacter", "\xef\xbf\xbd", u"\ufffd"},
                      Text{"LastOfThreeBytes", "\xef\xbf\xbf", u"\uffff"},
                      Text{"FirstOfFourBytes", "\xf0\x90\x80\x80", u"\U00010000"},
                      Text{"LastOfAll", "\xf4\x8f\xbf\xbf", u"\U0010FFFF"},
                      Text{"LeadingByteOrderMark", "\xef\xbb\xbfkey", u"\ufeffkey"},
                      Text{"OnlyAByteOrderMark", "\xef\xbb\xbf", u"\ufeff"},
                      Text{"SwappedByteOrderMark", "\xef\xbf\xbe", u"\ufffe"},
                      Text{"EveryLength", "a\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80z", u"aé€😀z"}),
    textName);

// Something ill-formed and the number of replacement characters that stand for it.
template <class Units>
struct IllFormed {
    const char* name;
    Units units;
    std::size_t replacements;
};

using IllFormedNarrow = IllFormed<std::string>;
using IllFormedWide = IllFormed<std::u16string>;

template <class Units>
std::ostream& operator<<(std::ostream& out, const IllFormed<Units>& text) {
    return out << text.name;
}

const Text ascii{"Ascii", "a", u"a"};
const Text accented{"Accented", "\xc3\xa9", u"é"};
const Text euro{"Euro", "\xe2\x82\xac", u"€"};
const Text smile{"Smile", "\xf0\x9f\x98\x80", u"😀"};
const std::array<Text, 4> neighbours{ascii, accented, euro, smile};

class TextConversionOfIllFormedUtf8 : public ::testing::TestWithParam<IllFormedNarrow> {
protected:
    const std::string broken = GetParam().units;
    const std::u16string replaced = std::u16string(GetParam().replacements, u'\ufffd');
};

TEST_P(TextConversionOfIllFormedUtf8, ReplacesItStandingAlone) {
    EXPECT_EQ(toUtf16(broken), replaced);
}

TEST_P(TextConversionOfIllFormedUtf8, KeepsWhatFollows) {
    for (const Text& next : neighbours) {
        EXPECT_EQ(toUtf16(broken + next.narrow), replaced + next.wide) << next;
    }
}

TEST_P(TextConversionOfIllFormedUtf8, KeepsWhatPrecedes) {
    for (const Text& previous : neighbours) {
        EXPECT_EQ(toUtf16(previous.narrow + broken), previous.wide + replaced) << previous;
    }
}

TEST_P(TextConversionOfIllFormedUtf8, KeepsBothNeighbours) {
    for (const Text& next : neighbours) {
        EXPECT_EQ(toUtf16(next.narrow + broken + next.narrow), next.wide + replaced + next.wide)
            << next;
    }
}

TEST_P(TextConversionOfIllFormedUtf8, ReplacesEachOfTwoParts) {
    EXPECT_EQ(toUtf16(broken + "|" + broken), replaced + u"|" + replaced);
}

INSTANTIATE_TEST_SUITE_P(
    Bytes, TextConversionOfIllFormedUtf8,
    ::testing::Values(IllFormedNarrow{"LoneTrailByte", "\x80", 1},
                      IllFormedNarrow{"TwoTrailBytes", "\x80\xbf", 2},
                      IllFormedNarrow{"OneOfTwoBytes", "\xc3", 1},
                      IllFormedNarrow{"OneOfThreeBytes", "\xe2", 1},
                      IllFormedNarrow{"TwoOfThreeBytes", "\xe2\x82", 1},
                      IllFormedNarrow{"OneOfFourBytes", "\xf0", 1},
                      IllFormedNarrow{"TwoOfFourBytes", "\xf0\x9f", 1},
                      IllFormedNarrow{"ThreeOfFourBytes", "\xf0\x9f\x98", 1},
                      IllFormedNarrow{"TwoTruncatedCharacters", "\xe2\x82\xe2\x82", 2},
                      IllFormedNarrow{"TruncatedLeadBytesOfEachLength", "\xc3\xe2\xf0", 3},
                      IllFormedNarrow{"OverlongNul", "\xc0\x80", 2},
                      IllFormedNarrow{"OverlongTwoBytes", "\xc1\xbf", 2},
                      IllFormedNarrow{"OverlongThreeBytes", "\xe0\x9f\xbf", 3},
                      IllFormedNarrow{"OverlongFourBytes", "\xf0\x8f\xbf\xbf", 4},
                      IllFormedNarrow{"FirstSurrogate", "\xed\xa0\x80", 3},
                      IllFormedNarrow{"LastSurrogate", "\xed\xbf\xbf", 3},
                      IllFormedNarrow{"BeyondTheLastCharacter", "\xf4\x90\x80\x80", 4},
                      IllFormedNarrow{"LeadByteBeyondTheRange", "\xf5\x80\x80\x80", 4},
                      IllFormedNarrow{"ByteFe", "\xfe", 1}, IllFormedNarrow{"ByteFf", "\xff", 1}),
    textName);

class TextConversionOfIllFormedUtf16 : public ::testing::TestWithParam<IllFormedWide> {
protected:
    std::string replaced() const {
        std::string text;
        for (std::size_t i = 0; i < GetParam().replacements; ++i) text += "\xef\xbf\xbd";
        return text;
    }

    const std::u16string broken = GetParam().units;
};

TEST_P(TextConversionOfIllFormedUtf16, ReplacesItStandingAlone) {
    EXPECT_EQ(fromUtf16(broken), replaced());
}

TEST_P(TextConversionOfIllFormedUtf16, KeepsWhatFollows) {
    for (const Text& next : neighbours) {
        EXPECT_EQ(fromUtf16(broken + next.wide), replaced() + next.narrow) << next;
    }
}

TEST_P(TextConversionOfIllFormedUtf16, KeepsWhatPrecedes) {
    for (const Text& previous : neighbours) {
        EXPECT_EQ(fromUtf16(previous.wide + broken), previous.narrow + replaced()) << previous;
    }
}

TEST_P(TextConversionOfIllFormedUtf16, KeepsBothNeighbours) {
    for (const Text& next : neighbours) {
        EXPECT_EQ(fromUtf16(next.wide + broken + next.wide), next.narrow + replaced() + next.narrow)
            << next;
    }
}

std::u16string units(std::initializer_list<char16_t> list) {
    return list;
}

INSTANTIATE_TEST_SUITE_P(
    Units, TextConversionOfIllFormedUtf16,
    ::testing::Values(IllFormedWide{"FirstHighSurrogate", units({0xD800}), 1},
                      IllFormedWide{"LastHighSurrogate", units({0xDBFF}), 1},
                      IllFormedWide{"FirstLowSurrogate", units({0xDC00}), 1},
                      IllFormedWide{"LastLowSurrogate", units({0xDFFF}), 1},
                      IllFormedWide{"TwoHighSurrogates", units({0xD800, 0xD801}), 2},
                      IllFormedWide{"TwoLowSurrogates", units({0xDC00, 0xDC01}), 2},
                      IllFormedWide{"PairInTheWrongOrder", units({0xDE00, 0xD83D}), 2}),
    textName);

// Everything at once

std::u16string everyCharacter() {
    std::u16string text;
    for (std::uint32_t point = 0; point <= 0x10FFFF; ++point) {
        if (point >= 0xD800 && point <= 0xDFFF) continue;
        if (point < 0x10000) {
            text.push_back(static_cast<char16_t>(point));
        } else {
            text.push_back(static_cast<char16_t>(0xD800 + ((point - 0x10000) >> 10)));
            text.push_back(static_cast<char16_t>(0xDC00 + ((point - 0x10000) & 0x3FF)));
        }
    }
    return text;
}

TEST(TextConversion, EveryCharacterOfEveryPlaneSurvivesBothWays) {
    const std::u16string all = everyCharacter();
    const std::string narrow = fromUtf16(all);
    EXPECT_EQ(narrow.size(), 0x80U + 2 * 0x780U + 3 * (0xF800U - 0x800U) + 4 * 0x100000U);
    EXPECT_TRUE(toUtf16(narrow) == all);
}

// Four bytes of every kind that matters, in every order: no ASCII neighbour may get lost.
TEST(TextConversion, NoArrangementOfBytesSwallowsAnAsciiNeighbour) {
    const std::string kinds =
        "A\x7f\x80\x8f\x90\x9f\xa0\xbf\xc0\xc2\xdf\xe0\xe1\xed\xef\xf0\xf1\xf4\xf5\xff";
    const auto onlyAscii = [](const auto& text) {
        std::string kept;
        for (const auto unit : text) {
            if (unit >= 0 && unit < 0x80) kept.push_back(static_cast<char>(unit));
        }
        return kept;
    };
    const std::size_t count = kinds.size();
    for (std::size_t order = 0; order < count * count * count * count; ++order) {
        const std::string text{'<',
                               kinds[order % count],
                               kinds[order / count % count],
                               kinds[order / count / count % count],
                               kinds[order / count / count / count],
                               '>'};
        ASSERT_EQ(onlyAscii(toUtf16(text)), onlyAscii(text));
    }
}

TEST(TextConversion, ResultOfIllFormedInputIsWellFormed) {
    for (int first = 0; first < 256; ++first) {
        for (int second = 0; second < 256; ++second) {
            const std::string bytes{static_cast<char>(first), static_cast<char>(second)};
            const std::u16string converted = toUtf16(bytes);
            ASSERT_EQ(toUtf16(fromUtf16(converted)), converted) << first << ' ' << second;
        }
    }
}

// Codecs

struct Codec {
    const char* name;
    std::string codec;
};

std::ostream& operator<<(std::ostream& out, const Codec& row) {
    return out << row.name;
}

class TextConversionCodec : public ::testing::TestWithParam<Codec> {};

TEST_P(TextConversionCodec, IsUnknown) {
    const std::string& codec = GetParam().codec;
    const std::string expected = "Unknown text codec: " + codec;
    EXPECT_EQ(thrownText<std::invalid_argument>([&] { TextConversion conversion(codec); }),
              expected.c_str());
}

INSTANTIATE_TEST_SUITE_P(Name, TextConversionCodec,
                         ::testing::Values(Codec{"Empty", ""}, Codec{"LowerCase", "utf-8"},
                                           Codec{"WithoutDash", "UTF8"},
                                           Codec{"TrailingBlank", "UTF-8 "},
                                           Codec{"LeadingBlank", " UTF-8"},
                                           Codec{"TrailingNul", std::string("UTF-8\0", 6)},
                                           Codec{"Utf16", "UTF-16"}, Codec{"Latin1", "ISO-8859-1"}),
                         textName);

TEST(TextConversion, UnknownCodecIsPinned) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { TextConversion conversion("latin1"); }),
              "Unknown text codec: latin1");
}

}  // namespace
