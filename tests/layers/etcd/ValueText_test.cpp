// How values stand in etcd.

#include "layers/etcd/detail/ValueText.hpp"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "layers/detail/ValueCodec.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::layers::etcd {
namespace {

using configuration::ConfigurationValue;
using testing::textOf;

// NaNs are the same when their bits are.
std::string exactly(const ConfigurationValue& value) {
    return layers::detail::encoded(value);
}

struct Form {
    ConfigurationValue value;
    std::string text;
};

std::vector<Form> forms() {
    using std::string;
    using std::u16string;
    using std::vector;
    return {
        {true, R"({"type":"bool","value":true})"},
        {-5, R"({"type":"int","value":-5})"},
        {5U, R"({"type":"uint","value":5})"},
        {0.1, R"({"type":"double","value":0.1})"},
        {-0.0, R"({"type":"double","value":-0.0})"},
        {u16string(u"h\u00e9"), "{\"type\":\"ustring\",\"value\":\"h\xC3\xA9\"}"},
        {string("a\"b\n\x01"), R"({"type":"string","value":"a\"b\n\u0001"})"},
        {string(), R"({"type":"string","value":""})"},
        {vector<bool>{true, false}, R"({"type":"boolArray","value":[true,false]})"},
        {vector<int>{}, R"({"type":"intArray","value":[]})"},
        {vector<unsigned>{1, 2}, R"({"type":"uintArray","value":[1,2]})"},
        {vector<double>{0.5}, R"({"type":"doubleArray","value":[0.5]})"},
        {vector<string>{"a", ""}, R"({"type":"stringArray","value":["a",""]})"},
        {vector<u16string>{u"a"}, R"({"type":"ustringArray","value":["a"]})"},
    };
}

TEST(EtcdValueText, IsThatOfMessages) {
    for (const Form& form : forms()) EXPECT_EQ(toValueText(form.value), form.text);
}

TEST(EtcdValueText, GivesTheValueBack) {
    for (const Form& form : forms()) {
        EXPECT_EQ(exactly(fromValueText(form.text)), exactly(form.value)) << form.text;
    }
}

TEST(EtcdValueText, CanBeReadAsAMessage) {
    const auto registry = std::make_shared<messages::JsonSerializerImpl>();
    const configuration::ConfigurationJsonSerialization registered(registry);
    for (const Form& form : forms()) {
        const auto message =
            registry->decode({"velkor/configuration/ConfigurationSet",
                              R"({"key":"k","source":"","value":)" + form.text + "}"});
        const auto& set = dynamic_cast<const configuration::ConfigurationSet&>(*message);
        EXPECT_EQ(exactly(set.value), exactly(form.value)) << form.text;
    }
}

TEST(EtcdValueText, IsExactWhereJsonIsNot) {
    using Limits = std::numeric_limits<double>;
    const std::vector<ConfigurationValue> values{
        std::nan("7"),
        Limits::quiet_NaN(),
        -Limits::infinity(),
        Limits::denorm_min(),
        Limits::max(),
        std::string("\xFF\xFE"),
        std::string("a\0b", 3),
        std::u16string(1, u'\xD800'),
        std::u16string(u"a\xDC00z"),
        std::vector<double>{1, Limits::infinity()},
        std::vector<std::string>{"ok", "\x80"},
        std::vector<std::u16string>{std::u16string(1, u'\xDFFF')},
        std::string(R"({"type":"int","value":5})"),
    };
    for (const auto& value : values) {
        const std::string text = toValueText(value);
        EXPECT_EQ(exactly(fromValueText(text)), exactly(value)) << text;
    }
}

TEST(EtcdValueText, MarksOnlyWhatJsonCannotSay) {
    EXPECT_EQ(toValueText(std::string("\xFF")),
              "{\"type\":\"string\",\"value\":\"\xEF\xBF\xBD\",\"exact\":\"c3RyaW5nOv8=\"}");
}

TEST(EtcdValueText, IsReadWhateverTheOrderAndTheBlanks) {
    EXPECT_EQ(textOf(fromValueText("{ \"value\" : [ 1 , 2 ],\n\"type\":\"intArray\" }")),
              "intArray [1, 2]");
}

TEST(EtcdValueText, ReadsEveryEscape) {
    const auto value =
        fromValueText(R"({"type":"ustring","value":"\"\\\/\b\f\n\r\t\u0041\ud83d\ude00"})");
    EXPECT_TRUE(value == ConfigurationValue(std::u16string(u"\"\\/\b\f\n\r\tA\U0001F600")));
}

TEST(EtcdValueText, IsPlainTextWhenItIsNoValue) {
    const std::vector<std::string> texts{
        "",
        "8080",
        "true",
        "\xFF\x01 any bytes",
        "{",
        "{}",
        "null",
        "[1]",
        R"("a")",
        R"({"type":"int"})",
        R"({"value":1})",
        R"({"type":"int","value":"1"})",
        R"({"type":"int","value":1.0})",
        R"({"type":"int","value":2147483648})",
        R"({"type":"uint","value":-1})",
        R"({"type":"bool","value":1})",
        R"({"type":"double","value":null})",
        R"({"type":"double","value":1e999})",
        R"({"type":"double","value":.5})",
        R"({"type":"double","value":01})",
        R"({"type":"string","value":1})",
        R"({"type":"string","value":"\x"})",
        R"({"type":"string","value":"a)",
        "{\"type\":\"string\",\"value\":\"a\nb\"}",
        "{\"type\":\"string\",\"value\":\"no UTF-8: \xDA\"}",
        R"({"type":"intArray","value":[1,]})",
        R"({"type":"intArray","value":[1,"2"]})",
        R"({"type":"long","value":1})",
        R"({"type":"int","value":1,"more":2})",
        R"({"type":"int","type":"int","value":1})",
        R"({"type":"int","value":1} )"
        "x",
        R"({"type":"int","value":1,"exact":"!"})",
        R"({"type":"int","value":1,"exact":"c3RyaW5nOv8="})",
        "{\"type\":\"int\",\"value\":" + std::string(100'000, '[') + "}",
    };
    for (const auto& text : texts) EXPECT_EQ(textOf(fromValueText(text)), "string " + text);
}

}  // namespace
}  // namespace velkor::layers::etcd
