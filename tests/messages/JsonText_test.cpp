#include "messages/JsonText.hpp"

#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <locale>
#include <string>
#include <vector>

namespace velkor::messages {
namespace {

using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

std::string refusalOf(const std::string& text, const JsonLimits& limits = {}) {
    try {
        parseJsonObject(text, limits);
    } catch (const NoJsonObject& error) {
        return error.what();
    }
    return "taken";
}

std::string rendered(const Var& content) {
    Object object;
    object.set("a", content);
    return renderJson(object);
}

std::string nested(std::size_t depth) {
    return "{\"a\":" + std::string(depth - 1, '[') + std::string(depth - 1, ']') + "}";
}

TEST(ParseJsonObject, GivesTheMembers) {
    const Object::Ptr object = parseJsonObject(R"({"a":"x","b":[1,2]})");
    EXPECT_EQ(object->getValue<std::string>("a"), "x");
    EXPECT_EQ(object->getArray("b")->size(), 2U);
}

TEST(ParseJsonObject, TakesBlanksAround) {
    EXPECT_EQ(refusalOf(" \t\r\n{ } \n"), "taken");
}

TEST(ParseJsonObject, LetsTheLastOfEqualNamesCount) {
    EXPECT_EQ(parseJsonObject(R"({"a":1,"a":2})")->getValue<int>("a"), 2);
}

TEST(ParseJsonObject, RefusesAnArray) {
    EXPECT_EQ(refusalOf("[]"), "JSON text is not an object");
}

TEST(ParseJsonObject, RefusesWhatIsNoJson) {
    EXPECT_EQ(refusalOf("{x}").rfind("Invalid JSON text: ", 0), 0U);
}

TEST(ParseJsonObject, TakesTheGreatestDepth) {
    EXPECT_EQ(refusalOf(nested(JsonLimits().depth)), "taken");
}

TEST(ParseJsonObject, RefusesMoreThanTheGreatestDepth) {
    EXPECT_EQ(refusalOf(nested(JsonLimits().depth + 1)),
              "JSON text is nested more than 64 levels deep");
}

TEST(ParseJsonObject, CountsOpenBracketsAndNotAllBrackets) {
    std::string text = "{\"a\":[";
    for (int i = 0; i < 1000; ++i) text += "{},[],";
    EXPECT_EQ(refusalOf(text + "1]}"), "taken");
}

TEST(ParseJsonObject, CountsNoBracketsInsideTexts) {
    EXPECT_EQ(
        refusalOf("{\"a\":\"" + std::string(1000, '[') + "\\\"" + std::string(1000, '{') + "\"}"),
        "taken");
}

TEST(ParseJsonObject, FindsTheEndOfATextThatEndsInABackslash) {
    EXPECT_EQ(refusalOf("{\"a\":\"\\\\\",\"b\":" + std::string(1000, '[')),
              "JSON text is nested more than 64 levels deep");
}

TEST(ParseJsonObject, TakesTheGreatestSize) {
    const std::string frame = "{\"a\":\"\"}";
    const std::string text =
        "{\"a\":\"" + std::string(JsonLimits().bytes - frame.size(), 'x') + "\"}";
    EXPECT_EQ(refusalOf(text), "taken");
}

TEST(ParseJsonObject, RefusesMoreThanTheGreatestSize) {
    EXPECT_EQ(refusalOf(std::string(JsonLimits().bytes + 1, ' ')),
              "JSON text exceeds 16777216 bytes");
}

TEST(JsonText, CountsObjectsAndArrays) {
    JsonLimits limits;
    limits.containers = 3;
    EXPECT_EQ(refusalOf(R"({"a":[{}],"b":"[{"})", limits), "taken");
    EXPECT_EQ(refusalOf(R"({"a":[{},{}]})", limits),
              "JSON text holds more than 3 objects and arrays");
}

TEST(RenderJson, WritesAnEmptyObject) {
    EXPECT_EQ(renderJson(Object()), "{}");
}

TEST(RenderJson, SortsMembersByName) {
    Object object;
    object.set("b", 1).set("a", true).set("c", std::string("x"));
    EXPECT_EQ(renderJson(object), R"({"a":true,"b":1,"c":"x"})");
}

TEST(RenderJson, WritesNestedArraysAndObjects) {
    Object::Ptr inner = new Object;
    inner->set("x", 1);
    Array::Ptr array = new Array;
    array->add(inner).add(Array::Ptr(new Array)).add(2);
    EXPECT_EQ(rendered(array), R"({"a":[{"x":1},[],2]})");
}

TEST(RenderJson, WritesNullForAnEmptyValue) {
    EXPECT_EQ(rendered(Var()), R"({"a":null})");
}

TEST(RenderJson, EscapesTexts) {
    EXPECT_EQ(rendered(std::string("\"\\\n\x01")), R"({"a":"\"\\\n\u0001"})");
}

TEST(RenderJson, EscapesNames) {
    Object object;
    object.set("\"\n", 1);
    EXPECT_EQ(renderJson(object), R"({"\"\n":1})");
}

TEST(RenderJson, WritesUtf8AsItIs) {
    EXPECT_EQ(rendered(std::string("\u00e9\u20ac\U0001d11e")),
              "{\"a\":\"\u00e9\u20ac\U0001d11e\"}");
}

TEST(RenderJson, ReplacesBytesThatAreNoUtf8) {
    EXPECT_EQ(rendered(std::string("a\xff"
                                   "b")),
              "{\"a\":\"a\ufffdb\"}");
}

TEST(RenderJson, ReplacesBytesOfNamesThatAreNoUtf8) {
    Object object;
    object.set("\xc3", 1);
    EXPECT_EQ(renderJson(object), "{\"\ufffd\":1}");
}

constexpr double infinity = std::numeric_limits<double>::infinity();

TEST(RenderJson, WritesNullForNumbersThatAreNotFinite) {
    for (const double number : {infinity, -infinity, std::nan("")}) {
        EXPECT_EQ(rendered(number), R"({"a":null})");
    }
}

TEST(RenderJson, WritesNullForNumbersThatAreNotFiniteAtAnyDepth) {
    Object::Ptr inner = new Object;
    inner->set("x", infinity);
    Array::Ptr array = new Array;
    array->add(std::nan("")).add(1.5).add(inner);
    EXPECT_EQ(rendered(array), R"({"a":[null,1.5,{"x":null}]})");
}

TEST(RenderJson, LeavesTheObjectAsItIs) {
    Object object;
    object.set("a", infinity).set("b", std::string("\xff"));
    renderJson(object);
    EXPECT_EQ(object.getValue<double>("a"), infinity);
    EXPECT_EQ(object.getValue<std::string>("b"), "\xff");
}

TEST(RenderJson, KeepsEveryFiniteDouble) {
    using Limits = std::numeric_limits<double>;
    for (const double number : {0.1, 0.1 + 0.2, 1e21, -1e-7, 123456789.123456789, Limits::max(),
                                Limits::lowest(), Limits::min(), Limits::denorm_min(), 0.0}) {
        EXPECT_EQ(parseJsonObject(rendered(number))->getValue<double>("a"), number);
    }
}

TEST(RenderJson, KeepsTheSignOfZero) {
    EXPECT_TRUE(std::signbit(parseJsonObject(rendered(-0.0))->getValue<double>("a")));
}

/// Writes numbers as no JSON text may hold them.
struct GroupingNumbers : std::numpunct<char> {
    char do_decimal_point() const override { return ','; }
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

TEST(RenderJson, IsTheSameInEveryLocale) {
    const std::locale previous =
        std::locale::global(std::locale(std::locale::classic(), new GroupingNumbers));
    const std::string text = rendered(1234567) + rendered(1234.5);
    std::locale::global(previous);
    EXPECT_EQ(text, R"({"a":1234567}{"a":1234.5})");
}

}  // namespace
}  // namespace velkor::messages
