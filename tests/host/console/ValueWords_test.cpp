#include "host/console/ValueWords.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "configuration/admin/TypedText.hpp"
#include "host/console/Command.hpp"
#include "tests/support/Thrown.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::host {
namespace {

using velkor::testing::textOf;
using velkor::testing::thrownText;
using Words = std::vector<std::string>;

struct WordCase {
    const char* name;
    std::string word;
    std::string value;

    friend std::ostream& operator<<(std::ostream& out, const WordCase& it) {
        return out << it.word;
    }
};

class WordValueTest : public ::testing::TestWithParam<WordCase> {};

TEST_P(WordValueTest, IsThatOfTheWholeWord) {
    EXPECT_EQ(textOf(wordValue(GetParam().word)), GetParam().value);
}

INSTANTIATE_TEST_SUITE_P(
    Words, WordValueTest,
    ::testing::Values(
        WordCase{"True", "true", "bool true"}, WordCase{"False", "false", "bool false"},
        WordCase{"OtherCase", "True", "string True"}, WordCase{"Int", "-5", "int -5"},
        WordCase{"LowestInt", "-2147483648", "int -2147483648"},
        WordCase{"Uint", "4294967295", "uint 4294967295"},
        WordCase{"LargerInteger", "4294967296", "double 4294967296"},
        WordCase{"IntegerThatNoDoubleHolds", "9007199254740993", "string 9007199254740993"},
        WordCase{"Fraction", "0.5", "double 0.5"}, WordCase{"PointInFront", ".5", "double 0.5"},
        WordCase{"PointBehind", "1.", "double 1"}, WordCase{"Exponent", "1e3", "double 1000"},
        WordCase{"TooLarge", "1e999", "string 1e999"}, WordCase{"LeadingZero", "007", "string 007"},
        WordCase{"Plus", "+5", "string +5"}, WordCase{"Address", "10.20.0.9", "string 10.20.0.9"},
        WordCase{"Unit", "20s", "string 20s"}, WordCase{"Hexadecimal", "0x10", "string 0x10"},
        WordCase{"BlankInFront", " 5", "string  5"}, WordCase{"Infinity", "inf", "string inf"},
        WordCase{"NotANumber", "nan", "string nan"}, WordCase{"Minus", "-", "string -"},
        WordCase{"Empty", "", "string "}),
    [](const auto& tested) { return tested.param.name; });

class MeantTest : public ::testing::TestWithParam<const char*> {};

TEST_P(MeantTest, IsWhatTheCommandSetStores) {
    EXPECT_TRUE(isMeantBy(GetParam(), configuration::typedText(GetParam())));
}

INSTANTIATE_TEST_SUITE_P(Texts, MeantTest,
                         ::testing::Values("true", "5", "-7", "0.5", ".5", "1.", "1.50", "1.5e3",
                                           "abc", "", "4294967296", ".", "1.0e999"));

class NotMeantTest : public ::testing::TestWithParam<const char*> {};

TEST_P(NotMeantTest, IsWhatTheCommandSetStores) {
    EXPECT_FALSE(isMeantBy(GetParam(), configuration::typedText(GetParam())));
}

INSTANTIATE_TEST_SUITE_P(Texts, NotMeantTest,
                         ::testing::Values("10.20.0.9", "20s", "1e3", "12abc", " 42", "0x10", "007",
                                           "+5", "1.5abc"));

struct TypeCase {
    const char* type;
    Words words;
    std::string value;

    friend std::ostream& operator<<(std::ostream& out, const TypeCase& it) {
        return out << it.type;
    }
};

class TypedValueTest : public ::testing::TestWithParam<TypeCase> {};

TEST_P(TypedValueTest, IsOfThatType) {
    EXPECT_EQ(textOf(typedValue(GetParam().type, GetParam().words)), GetParam().value);
}

INSTANTIATE_TEST_SUITE_P(
    Types, TypedValueTest,
    ::testing::Values(
        TypeCase{"bool", {"yes"}, "bool true"}, TypeCase{"int", {"-2147483648"}, "int -2147483648"},
        TypeCase{"uint", {"4294967295"}, "uint 4294967295"}, TypeCase{"double", {"5"}, "double 5"},
        TypeCase{"ustring", {"é"}, "ustring \\u00E9"}, TypeCase{"string", {"5"}, "string 5"},
        TypeCase{"boolArray", {"true", "no"}, "boolArray [true, false]"},
        TypeCase{"intArray", {"1", "-2"}, "intArray [1, -2]"},
        TypeCase{"uintArray", {"1"}, "uintArray [1]"},
        TypeCase{"doubleArray", {"1", "1e3"}, "doubleArray [1, 1000]"},
        TypeCase{"stringArray", {"", "a b"}, "stringArray [, a b]"},
        TypeCase{"ustringArray", {}, "ustringArray []"}),
    [](const auto& tested) { return tested.param.type; });

TEST(TypedValue, HasATestForEveryType) {
    EXPECT_EQ(typeNames().size(), 12U);
}

struct MisfitCase {
    const char* name;
    std::string type;
    Words words;
    std::string message;

    friend std::ostream& operator<<(std::ostream& out, const MisfitCase& it) {
        return out << it.name;
    }
};

class MisfitTest : public ::testing::TestWithParam<MisfitCase> {};

TEST_P(MisfitTest, IsRefused) {
    EXPECT_EQ(thrownText<CommandError>([] { typedValue(GetParam().type, GetParam().words); }),
              GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Words, MisfitTest,
    ::testing::Values(
        MisfitCase{
            "Bool", "bool", {"2"}, "--type bool: not one of: true, false, on, off, yes, no, 1, 0"},
        MisfitCase{"IntTooLarge",
                   "int",
                   {"2147483648"},
                   "--type int: not within -2147483648 to 2147483647"},
        MisfitCase{"IntTooSmall",
                   "int",
                   {"-2147483649"},
                   "--type int: not within -2147483648 to 2147483647"},
        MisfitCase{
            "IntWithTextBehind", "int", {"5x"}, "--type int: not a whole number in plain digits"},
        MisfitCase{"UintNegative", "uint", {"-1"}, "--type uint: not within 0 to 4294967295"},
        MisfitCase{
            "UintTooLarge", "uint", {"4294967296"}, "--type uint: not within 0 to 4294967295"},
        MisfitCase{
            "DoubleTooLarge", "double", {"1e999"}, "--type double: out of the range of double"},
        MisfitCase{"DoubleInfinite", "double", {"inf"}, "--type double: not a finite number"},
        MisfitCase{"UstringThatIsNoUtf8", "ustring", {"\xff"}, "--type ustring: ill-formed UTF-8"},
        MisfitCase{"Element",
                   "intArray",
                   {"1", "x"},
                   "--type intArray: word 2: not a whole number in plain digits"},
        MisfitCase{
            "SeveralWords", "string", {"a", "b"}, "--type string: one VALUE is needed; given: 2"},
        MisfitCase{"NoWord", "int", {}, "--type int: one VALUE is needed; given: 0"},
        MisfitCase{"UnknownType",
                   "integer",
                   {"1"},
                   "--type integer: one of bool, int, uint, double, ustring, string, boolArray, "
                   "intArray, uintArray, doubleArray, stringArray, ustringArray is needed"}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace velkor::host
