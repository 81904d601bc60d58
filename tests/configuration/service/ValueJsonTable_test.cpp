#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "tests/configuration/service/JsonForms.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::JsonForms;
using velkor::testing::textOf;

/// A piece of JSON, and what each kind of scalar reads from it.
struct Row {
    std::string name;
    std::string json;
    std::string asBool;
    std::string asInt;
    std::string asUnsigned;
    std::string asDouble;
    std::string asText;

    /// Tag and content of each kind of scalar.
    std::vector<std::pair<std::string, std::string>> scalars() const {
        return {{"bool", asBool},     {"int", asInt},      {"uint", asUnsigned},
                {"double", asDouble}, {"ustring", asText}, {"string", asText}};
    }
};

void PrintTo(const Row& row, std::ostream* out) {
    *out << row.json;
}

std::string valueObject(const std::string& tag, const std::string& json) {
    return R"({"type":")" + tag + R"(","value":)" + json + "}";
}

class ScalarFromJson : public ::testing::TestWithParam<Row> {
protected:
    JsonForms forms;
};

TEST_P(ScalarFromJson, ReadsAsTheTableSays) {
    for (const auto& [tag, content] : GetParam().scalars()) {
        EXPECT_EQ(textOf(forms.valueFrom(valueObject(tag, GetParam().json))), tag + " " + content);
    }
}

TEST_P(ScalarFromJson, ReadsTheSameAsAnElement) {
    for (const auto& [tag, content] : GetParam().scalars()) {
        const std::string first = tag == "bool" || tag.back() == 'g' ? "true" : "1";
        EXPECT_EQ(
            textOf(forms.valueFrom(valueObject(tag + "Array", "[true," + GetParam().json + "]"))),
            tag + "Array [" + first + ", " + content + "]");
    }
}

class NoArrayFromJson : public ScalarFromJson {};

TEST_P(NoArrayFromJson, IsAnEmptyArray) {
    for (const auto& scalar : GetParam().scalars()) {
        const std::string array = scalar.first + "Array";
        EXPECT_EQ(textOf(forms.valueFrom(valueObject(array, GetParam().json))), array + " []");
    }
}

const std::vector<Row> noArrays{
    {"True", "true", "true", "1", "1", "1", "true"},
    {"False", "false", "false", "0", "0", "0", "false"},
    {"Null", "null", "false", "0", "0", "0", ""},
    {"Zero", "0", "false", "0", "0", "0", "0"},
    {"One", "1", "true", "1", "1", "1", "1"},
    {"MinusOne", "-1", "true", "-1", "0", "-1", "-1"},
    {"FortyTwo", "42", "true", "42", "42", "42", "42"},
    {"GreatestInt", "2147483647", "true", "2147483647", "2147483647", "2147483647", "2147483647"},
    {"BeyondGreatestInt", "2147483648", "true", "0", "2147483648", "2147483648", "2147483648"},
    {"LeastInt", "-2147483648", "true", "-2147483648", "0", "-2147483648", "-2147483648"},
    {"BelowLeastInt", "-2147483649", "true", "0", "0", "-2147483649", "-2147483649"},
    {"GreatestUnsigned", "4294967295", "true", "0", "4294967295", "4294967295", "4294967295"},
    {"BeyondGreatestUnsigned", "4294967296", "true", "0", "0", "4294967296", "4294967296"},
    {"GreatestInt64", "9223372036854775807", "true", "0", "0", "9.2233720368547758e+18",
     "9223372036854775807"},
    {"GreatestUnsigned64", "18446744073709551615", "true", "0", "0", "1.8446744073709552e+19",
     "18446744073709551615"},
    {"Fraction", "1.5", "true", "1", "1", "1.5", "1.5"},
    {"NegativeFraction", "-1.5", "true", "-1", "0", "-1.5", "-1.5"},
    {"Half", "0.5", "true", "0", "0", "0.5", "0.5"},
    {"MinusHalf", "-0.5", "true", "0", "0", "-0.5", "-0.5"},
    {"MinusOneWithFraction", "-1.0", "true", "-1", "0", "-1", "-1"},
    {"JustBelowMinusHalf", "-0.75", "true", "0", "0", "-0.75", "-0.75"},
    {"LowestUnsignedNegated", "-4294967295.0", "true", "0", "0", "-4294967295", "-4294967295"},
    {"ZeroWithFraction", "0.0", "false", "0", "0", "0", "0"},
    {"MinusZero", "-0.0", "false", "0", "0", "-0", "0"},
    {"WithExponent", "1e3", "true", "1000", "1000", "1000", "1000"},
    {"LargeExponent", "1e300", "true", "0", "0", "1.0000000000000001e+300", "1e+300"},
    {"LeastDouble", "5e-324", "false", "0", "0", "4.9406564584124654e-324", "5e-324"},
    {"JustBeyondGreatestInt", "2147483647.5", "true", "0", "2147483647", "2147483647.5",
     "2147483647.5"},
    {"LeastIntWithFraction", "-2147483648.0", "true", "0", "0", "-2147483648", "-2147483648"},
    {"JustBeyondGreatestUnsigned", "4294967295.5", "true", "0", "0", "4294967295.5",
     "4294967295.5"},
    {"EmptyText", R"("")", "false", "0", "0", "0", ""},
    {"AnyText", R"("x")", "false", "0", "0", "0", "x"},
    {"NumberInText", R"("42")", "true", "42", "42", "42", "42"},
    {"NegativeNumberInText", R"("-7")", "true", "-7", "0", "-7", "-7"},
    {"ZeroInText", R"("0")", "false", "0", "0", "0", "0"},
    {"FractionInText", R"("1.5")", "false", "0", "0", "1.5", "1.5"},
    {"ExponentInText", R"("1e3")", "false", "0", "0", "1000", "1e3"},
    {"BlankBeforeNumber", R"(" 42")", "true", "42", "42", "42", " 42"},
    {"BlankAfterNumber", R"("42 ")", "false", "0", "0", "42", "42 "},
    {"GroupedDigits", R"("1,000")", "true", "1000", "1000", "1000", "1,000"},
    {"BeyondIntInText", R"("2147483648")", "false", "0", "2147483648", "2147483648", "2147483648"},
    {"BeyondDoubleInText", R"("1e999")", "false", "0", "0", "0", "1e999"},
    {"NaNInText", R"("nan")", "false", "0", "0", "0", "nan"},
    {"HexadecimalInText", R"("0x10")", "false", "0", "0", "0", "0x10"},
    {"TrueInText", R"("true")", "true", "0", "0", "0", "true"},
    {"TrueInCapitals", R"("TRUE")", "true", "0", "0", "0", "TRUE"},
    {"YesInText", R"("yes")", "true", "0", "0", "0", "yes"},
    {"OnInText", R"("on")", "true", "0", "0", "0", "on"},
    {"FalseInText", R"("false")", "false", "0", "0", "0", "false"},
    {"NoInText", R"("no")", "false", "0", "0", "0", "no"},
    {"OffInText", R"("off")", "false", "0", "0", "0", "off"},
    {"EmptyObject", "{}", "false", "0", "0", "0", "{\n}"},
    {"Object", R"({"a":1})", "true", "0", "0", "0", "{\n  \"a\": 1\n}"},
};

const std::vector<Row> arrays{
    {"EmptyArray", "[]", "false", "0", "0", "0", "[\n\n]"},
    {"Array", "[7]", "true", "0", "0", "0", "[\n  7\n]"},
};

const auto nameOfRow = [](const auto& tested) { return tested.param.name; };

INSTANTIATE_TEST_SUITE_P(Json, NoArrayFromJson, ::testing::ValuesIn(noArrays), nameOfRow);
INSTANTIATE_TEST_SUITE_P(Json, ScalarFromJson, ::testing::ValuesIn(noArrays), nameOfRow);
INSTANTIATE_TEST_SUITE_P(Arrays, ScalarFromJson, ::testing::ValuesIn(arrays), nameOfRow);

}  // namespace
}  // namespace velkor::configuration
