#include "configuration/ConfigurationValue.hpp"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using testing::textOf;

struct KindCase {
    int index;
    const char* tag;
    ConfigurationValue value;
    const char* spelled;
};

void PrintTo(const KindCase& row, std::ostream* out) {
    *out << row.tag;
}

const KindCase kinds[] = {
    {0, "bool", true, "bool true"},
    {1, "int", -5, "int -5"},
    {2, "uint", 4294967295U, "uint 4294967295"},
    {3, "double", 0.5, "double 0.5"},
    {4, "ustring", std::u16string(u"\u20AC"), "ustring \\u20AC"},
    {5, "string", std::string("\xE2\x82\xAC"), "string \xE2\x82\xAC"},
    {6, "boolArray", std::vector<bool>{true, false}, "boolArray [true, false]"},
    {7, "intArray", std::vector<int>{1, -2}, "intArray [1, -2]"},
    {8, "uintArray", std::vector<unsigned int>{1, 2}, "uintArray [1, 2]"},
    {9, "doubleArray", std::vector<double>{0.25, -1}, "doubleArray [0.25, -1]"},
    {10, "stringArray", std::vector<std::string>{"a", "b"}, "stringArray [a, b]"},
    {11, "ustringArray", std::vector<std::u16string>{u"a", u"b"}, "ustringArray [a, b]"},
};

class ConfigurationValueKind : public ::testing::TestWithParam<KindCase> {};

TEST_P(ConfigurationValueKind, HasItsIndex) {
    EXPECT_EQ(GetParam().value.which(), GetParam().index);
}

TEST_P(ConfigurationValueKind, HasItsTag) {
    EXPECT_EQ(typeTags.at(static_cast<std::size_t>(GetParam().index)), GetParam().tag);
}

TEST_P(ConfigurationValueKind, IsKeptByACopy) {
    const ConfigurationValue copy(GetParam().value);
    EXPECT_EQ(textOf(copy), GetParam().spelled);
    EXPECT_EQ(textOf(GetParam().value), GetParam().spelled);
}

TEST_P(ConfigurationValueKind, IsKeptByAMove) {
    ConfigurationValue original(GetParam().value);
    const ConfigurationValue moved(std::move(original));
    EXPECT_EQ(textOf(moved), GetParam().spelled);
}

TEST_P(ConfigurationValueKind, ReplacesEveryOtherKind) {
    for (const KindCase& other : kinds) {
        ConfigurationValue value(other.value);
        value = GetParam().value;
        EXPECT_EQ(textOf(value), GetParam().spelled) << "over " << other.tag;
    }
}

TEST_P(ConfigurationValueKind, ReplacesEveryOtherKindByAMove) {
    for (const KindCase& other : kinds) {
        ConfigurationValue value(other.value);
        ConfigurationValue original(GetParam().value);
        value = std::move(original);
        EXPECT_EQ(textOf(value), GetParam().spelled) << "over " << other.tag;
    }
}

INSTANTIATE_TEST_SUITE_P(Table, ConfigurationValueKind, ::testing::ValuesIn(kinds),
                         [](const auto& row) { return std::string(row.param.tag); });

TEST(ConfigurationValueTest, DefaultIsFalse) {
    EXPECT_EQ(textOf(ConfigurationValue()), "bool false");
}

TEST(ConfigurationValueTest, ThereAreTwelveKinds) {
    EXPECT_EQ(typeTags.size(), 12U);
    EXPECT_EQ(std::size(kinds), 12U);
}

TEST(ConfigurationValueTest, KindsAreVisitedInIndexOrder) {
    std::vector<std::string_view> tags;
    forEachValueKind([&](const auto& kind) { tags.push_back(kind.tag); });
    EXPECT_TRUE(std::equal(tags.begin(), tags.end(), typeTags.begin(), typeTags.end()));
}

TEST(ConfigurationValueTest, IntIsNeverTaggedUint) {
    const auto index = static_cast<std::size_t>(ConfigurationValue(7).which());
    EXPECT_EQ(typeTags.at(index), "int");
}

// A pointer converts to bool: the trap that the comment of the class warns of.
TEST(ConfigurationValueTest, CharacterLiteralGivesABool) {
    EXPECT_EQ(textOf(ConfigurationValue("false")), "bool true");
}

TEST(ConfigurationValueTest, AssignmentFromEachTypeSelectsItsKind) {
    ConfigurationValue value;
    value = 5;
    EXPECT_EQ(textOf(value), "int 5");
    value = 5U;
    EXPECT_EQ(textOf(value), "uint 5");
    value = 5.0;
    EXPECT_EQ(textOf(value), "double 5");
    value = std::string("5");
    EXPECT_EQ(textOf(value), "string 5");
    value = std::u16string(u"5");
    EXPECT_EQ(textOf(value), "ustring 5");
    value = false;
    EXPECT_EQ(textOf(value), "bool false");
}

TEST(ConfigurationValueTest, NarrowTextReplacesAnArrayOfWideTexts) {
    ConfigurationValue value(std::vector<std::u16string>{u"x", u"y"});
    value = std::string("text");
    EXPECT_EQ(value.which(), 5);
    EXPECT_EQ(boost::get<std::string>(value), "text");
}

TEST(ConfigurationValueTest, NarrowTextIsKeptByteForByte) {
    const std::string bytes("\xFF\0\xC3(", 4);
    EXPECT_EQ(boost::get<std::string>(ConfigurationValue(bytes)), bytes);
}

TEST(ConfigurationValueTest, WideTextMayHoldLoneSurrogates) {
    const std::u16string units{char16_t{0xD800}, u'\0', char16_t{0xDFFF}};
    EXPECT_EQ(boost::get<std::u16string>(ConfigurationValue(units)), units);
}

TEST(ConfigurationValueTest, CopyIsDeep) {
    const ConfigurationValue original(std::vector<std::string>{"a"});
    ConfigurationValue copy(original);
    boost::get<std::vector<std::string>>(copy).front() = "b";
    EXPECT_EQ(textOf(original), "stringArray [a]");
}

TEST(ConfigurationValueTest, AssignmentOfTheSameKindReusesTheStorage) {
    ConfigurationValue value(std::vector<int>(100, 1));
    const int* storage = boost::get<std::vector<int>>(value).data();
    const ConfigurationValue other(std::vector<int>(50, 2));
    value = other;
    EXPECT_EQ(boost::get<std::vector<int>>(value).data(), storage);
    EXPECT_EQ(boost::get<std::vector<int>>(value), std::vector<int>(50, 2));
}

TEST(ConfigurationValueTest, SelfAssignmentChangesNothing) {
    ConfigurationValue value(std::string("text"));
    const ConfigurationValue& same = value;
    value = same;
    EXPECT_EQ(textOf(value), "string text");
}

class BoolArrayLength : public ::testing::TestWithParam<std::size_t> {
protected:
    static std::vector<bool> bits(std::size_t length) {
        std::vector<bool> pattern(length);
        for (std::size_t i = 0; i < length; ++i) pattern[i] = i % 3 == 0 || i % 7 == 2;
        return pattern;
    }
};

TEST_P(BoolArrayLength, IsCopiedBitByBit) {
    const ConfigurationValue original(bits(GetParam()));
    const ConfigurationValue copy(original);
    EXPECT_EQ(boost::get<std::vector<bool>>(copy), bits(GetParam()));
}

TEST_P(BoolArrayLength, IsMovedBitByBit) {
    ConfigurationValue original(bits(GetParam()));
    const ConfigurationValue moved(std::move(original));
    EXPECT_EQ(boost::get<std::vector<bool>>(moved), bits(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(Lengths, BoolArrayLength,
                         ::testing::Values(0, 1, 7, 8, 31, 32, 63, 64, 65, 1000, 4097));

}  // namespace
}  // namespace velkor::configuration
