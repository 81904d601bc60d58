#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <ostream>
#include <set>
#include <string>
#include <typeinfo>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "tests/configuration/service/JsonForms.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::JsonForms;
using velkor::testing::textOf;
using velkor::testing::textOfObject;

using Int = std::numeric_limits<int>;
using Unsigned = std::numeric_limits<unsigned int>;
using Double = std::numeric_limits<double>;

struct Case {
    std::string name;
    ConfigurationValue value;
    std::string json;  ///< What it is written as.
};

void PrintTo(const Case& tested, std::ostream* out) {
    *out << textOf(tested.value);
}

class ValueObject : public ::testing::TestWithParam<Case> {
protected:
    JsonForms forms;
};

TEST_P(ValueObject, IsWrittenWithTagAndValue) {
    EXPECT_EQ(textOfObject(*forms.objectOf(GetParam().value)), GetParam().json);
}

TEST_P(ValueObject, IsReadBackUnchanged) {
    Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
    message->set("value", forms.objectOf(GetParam().value));
    EXPECT_TRUE(forms.fromObject<ConfigurationSet>(message)->value == GetParam().value);
}

TEST_P(ValueObject, IsReadBackUnchangedFromText) {
    EXPECT_TRUE(forms.valueFrom(GetParam().json) == GetParam().value);
}

std::string object(const std::string& tag, const std::string& value) {
    return R"({"type":")" + tag + R"(","value":)" + value + "}";
}

Case oneOf(const std::string& name, ConfigurationValue value, const std::string& json) {
    const auto tag = typeTags.at(static_cast<std::size_t>(value.which()));
    return {name, std::move(value), object(std::string(tag), json)};
}

const std::u16string wideText = u"\u00e9\u20ac\U0001d11e";
const std::string narrowText = "\u00e9\u20ac\U0001d11e";

const std::vector<Case> cases{
    oneOf("True", true, "true"),
    oneOf("False", false, "false"),
    oneOf("IntZero", 0, "0"),
    oneOf("LeastInt", Int::min(), "-2147483648"),
    oneOf("GreatestInt", Int::max(), "2147483647"),
    oneOf("UnsignedZero", 0U, "0"),
    oneOf("GreatestUnsigned", Unsigned::max(), "4294967295"),
    oneOf("DoubleZero", 0.0, "0"),
    oneOf("Tenth", 0.1, "0.1"),
    oneOf("NeedsAllDigits", 0.1 + 0.2, "0.30000000000000004"),
    oneOf("GreatestDouble", Double::max(), "1.7976931348623157e+308"),
    oneOf("LowestDouble", Double::lowest(), "-1.7976931348623157e+308"),
    oneOf("LeastDouble", Double::denorm_min(), "5e-324"),
    oneOf("WholeDouble", 1.0, "1"),
    oneOf("EmptyWideText", std::u16string(), "\"\""),
    oneOf("WideText", wideText, "\"" + narrowText + "\""),
    oneOf("WideTextWithByteOrderMark", std::u16string(u"\ufeffx"), "\"\ufeffx\""),
    oneOf("WideTextWithNul", std::u16string(u"a\0b", 3), R"("a\u0000b")"),
    oneOf("EmptyText", std::string(), "\"\""),
    oneOf("Text", narrowText, "\"" + narrowText + "\""),
    oneOf("TextWithNul", std::string("a\0b", 3), R"("a\u0000b")"),
    oneOf("TextToEscape", std::string("\"\\\n\t/"), R"("\"\\\n\t/")"),
    oneOf("TextLikeANumber", std::string("42"), "\"42\""),
    oneOf("NoBools", std::vector<bool>(), "[]"),
    oneOf("Bools", std::vector<bool>{true, false, true}, "[true,false,true]"),
    oneOf("NoInts", std::vector<int>(), "[]"),
    oneOf("Ints", std::vector<int>{Int::min(), 0, Int::max()}, "[-2147483648,0,2147483647]"),
    oneOf("NoUnsigneds", std::vector<unsigned int>(), "[]"),
    oneOf("Unsigneds", std::vector<unsigned int>{0, Unsigned::max()}, "[0,4294967295]"),
    oneOf("NoDoubles", std::vector<double>(), "[]"),
    oneOf("Doubles", std::vector<double>{0.5, -1e300, 2}, "[0.5,-1e+300,2]"),
    oneOf("NoTexts", std::vector<std::string>(), "[]"),
    oneOf("Texts", std::vector<std::string>{"", "b", "a"}, R"(["","b","a"])"),
    oneOf("NoWideTexts", std::vector<std::u16string>(), "[]"),
    oneOf("WideTexts", std::vector<std::u16string>{u"", wideText}, "[\"\",\"" + narrowText + "\"]"),
};

INSTANTIATE_TEST_SUITE_P(Kinds, ValueObject, ::testing::ValuesIn(cases),
                         [](const auto& tested) { return tested.param.name; });

TEST(ValueObjects, AreTestedOfEveryKind) {
    std::set<int> kinds;
    for (const Case& tested : cases) kinds.insert(tested.value.which());
    EXPECT_EQ(kinds.size(), typeTags.size());
}

class ValueJson : public ::testing::Test {
protected:
    template <class T>
    const T& written(ConfigurationValue value) {
        writtenObject = forms.objectOf(std::move(value));
        content = writtenObject->get("value");
        return content.extract<T>();
    }

    JsonForms forms;
    Poco::JSON::Object::Ptr writtenObject;
    Poco::Dynamic::Var content;
};

TEST_F(ValueJson, BytesOfANarrowTextAreWrittenAsTheyAre) {
    EXPECT_EQ(written<std::string>(std::string("\xff\xfe\xc3")), "\xff\xfe\xc3");
}

TEST_F(ValueJson, BytesOfANarrowTextAreReadAsTheyAre) {
    Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
    message->set("value", forms.objectOf(std::string("\xff\xfe\xc3")));
    EXPECT_EQ(textOf(forms.fromObject<ConfigurationSet>(message)->value), "string \xff\xfe\xc3");
}

TEST_F(ValueJson, BytesThatAreNoUtf8AreReadAsReplacementCharactersOfAWideText) {
    Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
    message->set("value", forms.objectOf(std::u16string()));
    message->getObject("value")->set("value", std::string("a\xff"));
    EXPECT_TRUE(forms.fromObject<ConfigurationSet>(message)->value ==
                ConfigurationValue(std::u16string(u"a\ufffd")));
}

TEST_F(ValueJson, LoneSurrogateIsWrittenAsReplacementCharacter) {
    EXPECT_EQ(written<std::string>(std::u16string(1, char16_t(0xd800))), "\ufffd");
}

TEST_F(ValueJson, IntIsWrittenAsSignedInteger) {
    EXPECT_EQ(written<int>(-1), -1);
}

TEST_F(ValueJson, UnsignedIsWrittenAsUnsignedInteger) {
    EXPECT_EQ(written<unsigned int>(4294967295U), 4294967295U);
}

TEST_F(ValueJson, BoolIsWrittenAsBool) {
    EXPECT_TRUE(written<bool>(true));
}

TEST_F(ValueJson, DoubleThatIsNotFiniteIsWrittenAsItIs) {
    EXPECT_TRUE(std::isnan(written<double>(Double::quiet_NaN())));
    EXPECT_EQ(written<double>(-Double::infinity()), -Double::infinity());
}

TEST_F(ValueJson, SignOfZeroIsKept) {
    EXPECT_TRUE(std::signbit(written<double>(-0.0)));
}

TEST_F(ValueJson, ElementsOfBoolArrayAreBools) {
    const auto array = written<Poco::JSON::Array::Ptr>(std::vector<bool>{true});
    EXPECT_EQ(array->get(0).type(), typeid(bool));
}

TEST_F(ValueJson, ArrayOfManyElementsKeepsThemAll) {
    std::vector<int> numbers(100000);
    for (std::size_t i = 0; i < numbers.size(); ++i) numbers[i] = static_cast<int>(i) - 50000;
    Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
    message->set("value", forms.objectOf(numbers));
    EXPECT_TRUE(forms.fromObject<ConfigurationSet>(message)->value == ConfigurationValue(numbers));
}

TEST_F(ValueJson, BoolArrayKeepsItsExactLength) {
    for (const std::size_t size : {1U, 63U, 64U, 65U, 1000U}) {
        std::vector<bool> bits(size);
        for (std::size_t i = 0; i < size; i += 3) bits[i] = true;
        Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
        message->set("value", forms.objectOf(bits));
        EXPECT_TRUE(forms.fromObject<ConfigurationSet>(message)->value == ConfigurationValue(bits));
    }
}

TEST_F(ValueJson, ElementThatCannotBeConvertedIsNotDropped) {
    EXPECT_EQ(textOf(forms.valueFrom(object("boolArray", R"([true,"x",false])"))),
              "boolArray [true, false, false]");
}

TEST_F(ValueJson, NumberInATextConverts) {
    EXPECT_EQ(textOf(forms.valueFrom(R"({"type":"int","value":"42"})")), "int 42");
}

TEST_F(ValueJson, TextThatIsNoNumberIsZero) {
    EXPECT_EQ(textOf(forms.valueFrom(R"({"type":"int","value":"x"})")), "int 0");
}

struct NoValue {
    std::string name;
    std::string json;
};

class NoValueObject : public ::testing::TestWithParam<NoValue> {};

TEST_P(NoValueObject, IsAnEmptyText) {
    EXPECT_EQ(textOf(JsonForms().valueFrom(GetParam().json)), "string ");
}

INSTANTIATE_TEST_SUITE_P(
    Json, NoValueObject,
    ::testing::Values(NoValue{"Null", "null"}, NoValue{"Number", "1"}, NoValue{"Text", "\"int\""},
                      NoValue{"Array", R"(["int",1])"}, NoValue{"EmptyObject", "{}"},
                      NoValue{"NoType", R"({"value":1})"},
                      NoValue{"WrongCase", R"({"type":"Int","value":1})"},
                      NoValue{"UnknownType", R"({"type":"float","value":1})"},
                      NoValue{"EmptyType", R"({"type":"","value":1})"},
                      NoValue{"BlankAfterType", R"({"type":"int ","value":1})"},
                      NoValue{"TypeIsNull", R"({"type":null,"value":1})"},
                      NoValue{"TypeIsANumber", R"({"type":1,"value":1})"},
                      NoValue{"TypeIsAnArray", R"({"type":["int"],"value":1})"},
                      NoValue{"TypeIsAnObject", R"({"type":{"int":1},"value":1})"}),
    [](const auto& tested) { return tested.param.name; });

class MissingValue : public ::testing::TestWithParam<std::string> {};

TEST_P(MissingValue, IsTheDefaultOfItsKind) {
    const std::string& tag = GetParam();
    ConfigurationValue expected;
    forEachValueKind([&](const auto& kind) {
        if (kind.tag == tag) expected = typename std::decay_t<decltype(kind)>::Type();
    });
    EXPECT_TRUE(JsonForms().valueFrom(R"({"type":")" + tag + "\"}") == expected);
}

INSTANTIATE_TEST_SUITE_P(Kinds, MissingValue,
                         ::testing::ValuesIn(std::vector<std::string>(typeTags.begin(),
                                                                      typeTags.end())),
                         [](const auto& tested) { return tested.param; });

}  // namespace
}  // namespace velkor::configuration
