#include "http/detail/routes/JsonWriter.hpp"

#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <limits>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "messages/MessageService.hpp"

namespace velkor::http::detail {
namespace {

using configuration::ConfigurationValue;

std::string written(const ConfigurationValue& value) {
    JsonWriter json;
    json.value(value);
    return json.take();
}

/// What the messages make of values.
class Rendered {
public:
    std::string operator()(const ConfigurationValue& value) {
        store->set("k", value).get();
        const auto result =
            dispatcher->dispatch({"velkor/configuration/ConfigurationGet", R"({"key":"k"})"});
        const std::string json = std::get<messages::JsonMessage>(result).json;
        const std::string begin = R"({"key":"k","source":"override","value":)";
        return json.substr(begin.size(), json.size() - begin.size() - 1);
    }

private:
    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    messages::MessageService service{store};
    std::shared_ptr<const messages::MessageDispatcher> dispatcher =
        service.dispatcherFor(messages::allRequestTypes());
};

TEST(JsonWriter, SeparatesMembersAndElements) {
    JsonWriter json;
    json.beginObject().name("a").beginArray().number(1).boolean(true).beginArray().endArray();
    json.beginObject().endObject().endArray().member("b", "{[:").member("c", false).endObject();
    EXPECT_EQ(json.take(), R"({"a":[1,true,[],{}],"b":"{[:","c":false})");
}

TEST(JsonWriter, EscapesNamesThatOthersGive) {
    JsonWriter json;
    json.beginObject().anyName("a\"b").text("c").anyName("d").text("e").endObject();
    EXPECT_EQ(json.take(), R"({"a\"b":"c","d":"e"})");
}

TEST(JsonWriter, MasksSecretsAndKeepsTheirTypes) {
    JsonWriter json;
    json.value(ConfigurationValue(std::vector<int>{1, 2}), true);
    EXPECT_EQ(json.take(), R"({"type":"intArray","value":"•••"})");
}

TEST(JsonWriter, WritesEachKindOfValueAsMessagesDo) {
    Rendered rendered;
    const double infinity = std::numeric_limits<double>::infinity();
    const std::vector<ConfigurationValue> values{true,
                                                 false,
                                                 0,
                                                 -1,
                                                 std::numeric_limits<int>::min(),
                                                 4'000'000'000U,
                                                 0.1,
                                                 -0.0,
                                                 0.0,
                                                 1.0,
                                                 1e300,
                                                 5e-324,
                                                 123456789.123,
                                                 1e21,
                                                 -1e-7,
                                                 infinity,
                                                 -infinity,
                                                 std::numeric_limits<double>::quiet_NaN(),
                                                 std::u16string(),
                                                 std::u16string(u"a\u00e4\u2022"),
                                                 std::u16string(1, char16_t{0xD800}),
                                                 std::string(),
                                                 std::string("text"),
                                                 std::vector<bool>{},
                                                 std::vector<bool>{true, false},
                                                 std::vector<int>{1, -2},
                                                 std::vector<unsigned>{1U},
                                                 std::vector<double>{0.5, infinity, 3},
                                                 std::vector<std::string>{"a", "", "\xFF"},
                                                 std::vector<std::u16string>{u"a", u"\u20ac"}};
    for (const auto& value : values) EXPECT_EQ(written(value), rendered(value));
}

TEST(JsonWriter, WritesEachByteAsMessagesDo) {
    Rendered rendered;
    for (int byte = 0; byte < 256; ++byte) {
        const std::string text = "a" + std::string(1, static_cast<char>(byte)) + "b";
        EXPECT_EQ(written(text), rendered(text)) << byte;
        EXPECT_EQ(written(text.substr(1)), rendered(text.substr(1))) << byte;
    }
}

TEST(JsonWriter, WritesAnyTextAsMessagesDo) {
    Rendered rendered;
    std::mt19937 random(7);
    const std::vector<std::string> pieces{
        "a",       "\"",           "\\",           "/",
        "\xC3",    "\xC3\xA4",     "\xE2\x80\xA2", "\xF0\x9F\x98\x80",
        "\x80",    "\xED\xA0\x80", "\n",           "\x7F",
        "\xE2\x80"};
    for (int i = 0; i < 2000; ++i) {
        std::string text;
        for (auto length = random() % 8; length > 0; --length) {
            text += pieces[random() % pieces.size()];
        }
        ASSERT_EQ(written(text), rendered(text)) << i;
    }
}

TEST(JsonWriter, WritesAnyDoubleAsMessagesDo) {
    Rendered rendered;
    std::mt19937_64 random(7);
    for (int i = 0; i < 2000; ++i) {
        const std::uint64_t bits = random();
        double number = 0;
        static_assert(sizeof(number) == sizeof(bits));
        std::memcpy(&number, &bits, sizeof(number));
        ASSERT_EQ(written(number), rendered(number));
    }
}

}  // namespace
}  // namespace velkor::http::detail
