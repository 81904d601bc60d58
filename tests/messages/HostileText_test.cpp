#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "messages/JsonText.hpp"
#include "tests/messages/RunningService.hpp"

namespace velkor::messages {
namespace {

using namespace std::string_literals;
using velkor::testing::outcomeOf;
using velkor::testing::RunningService;

/// A text that a client might send as the key to look up, or instead of it.
struct Text {
    std::string name;
    std::string json;
    bool isObject;
};

void PrintTo(const Text& text, std::ostream* out) {
    *out << text.json.substr(0, 80);
}

std::string repeated(const std::string& part, int times) {
    std::string text;
    for (int i = 0; i < times; ++i) text += part;
    return text;
}

constexpr bool object = true;
constexpr bool noObject = false;

class HostileText : public ::testing::TestWithParam<Text> {
protected:
    RunningService service;
};

TEST_P(HostileText, IsAnsweredOrRefused) {
    EXPECT_EQ(outcomeOf(service.send("ConfigurationGet", GetParam().json)),
              GetParam().isObject ? "reply velkor/configuration/ConfigurationOptionResponse {}"
                                  : "failure no JSON object");
}

// Whatever gets into the store comes out of it as a text that is JSON again.
TEST_P(HostileText, StoredAsAValueComesBackAsJson) {
    const std::string request =
        R"({"key":"k","value":{"type":"string","value":)" + GetParam().json + "}}";
    const std::string isReply = "reply velkor/configuration/ConfigurationOptionResponse ";
    const std::string outcome = outcomeOf(service.send("ConfigurationSet", request));
    if (outcome != "failure no JSON object") {
        ASSERT_EQ(outcome.substr(0, isReply.size()), isReply);
        EXPECT_NO_THROW(parseJsonObject(outcome.substr(isReply.size())));
    }
}

// Each text cut off behind each of its bytes: complete it is one, cut off it is none.
TEST(TruncatedText, IsRefused) {
    const RunningService service;
    const std::string text =
        R"({"key":"\u00e9\n","source":"s","value":{"type":"intArray","value":[1,-2.5e3,true]}})";
    for (std::size_t length = 0; length < text.size(); ++length) {
        EXPECT_EQ(outcomeOf(service.send("ConfigurationGet", text.substr(0, length))),
                  "failure no JSON object")
            << length;
    }
}

TEST(AnyByteInsteadOfAnother, IsAnsweredOrRefused) {
    const RunningService service;
    const std::string text = R"({"key":"\u00e9","value":{"type":"int","value":[1,2.5]}})";
    for (std::size_t position = 0; position < text.size(); ++position) {
        for (int byte = 0; byte < 256; ++byte) {
            std::string changed = text;
            changed[position] = static_cast<char>(byte);
            const std::string outcome = outcomeOf(service.send("ConfigurationGet", changed));
            EXPECT_TRUE(outcome == "failure no JSON object" || outcome.rfind("reply ", 0) == 0)
                << changed;
        }
    }
}

const std::vector<Text> texts{
    {"Empty", "", noObject},
    {"Blanks", " \n\t ", noObject},
    {"Null", "null", noObject},
    {"True", "true", noObject},
    {"Number", "1", noObject},
    {"JustText", "\"key\"", noObject},
    {"Array", "[1]", noObject},
    {"EmptyObject", "{}", object},
    {"BlanksAround", "\r\n {} \t", object},
    {"FormFeedAround", "\f{}", noObject},
    {"ByteOrderMark", "\xef\xbb\xbf{}", noObject},
    {"Utf16", "\xff\xfe{\0}\0"s, noObject},
    {"NulBefore", "\0{}"s, noObject},
    {"NulAfter", "{}\0"s, noObject},
    {"NulInsideAText", "{\"key\":\"a\0b\"}"s, noObject},
    {"EscapedNul", R"({"key":"a\u0000b"})", object},
    {"EscapedNulInAName", R"({"a\u0000b":1})", object},
    {"TwoObjects", "{}{}", noObject},
    {"TrailingComma", R"({"key":"a",})", noObject},
    {"TrailingBracket", "{}}", noObject},
    {"TrailingWord", "{}x", noObject},
    {"Unclosed", "{", noObject},
    {"ClosedByAnother", R"({"a":[1})", noObject},
    {"MissingColon", R"({"key" "a"})", noObject},
    {"MissingComma", R"({"a":1 "b":2})", noObject},
    {"MissingValue", R"({"key":})", noObject},
    {"MissingName", R"({:1})", noObject},
    {"NumberAsName", "{1:1}", noObject},
    {"BareName", "{key:1}", noObject},
    {"SingleQuotes", "{'key':1}", noObject},
    {"EmptyName", R"({"":1})", object},
    {"DuplicateNames", R"({"key":"a","key":"b"})", object},
    {"Comment", R"({"key":/*c*/"a"})", noObject},
    {"UnclosedText", R"({"key":"a)", noObject},
    {"BackslashAtTheEnd", R"({"key":"a\)", noObject},
    {"NewlineInsideAText", "{\"key\":\"a\nb\"}", noObject},
    {"TabInsideAText", "{\"key\":\"a\tb\"}", noObject},
    {"UnknownEscape", R"({"key":"\x41"})", noObject},
    {"ShortUnicodeEscape", R"({"key":"\u12"})", noObject},
    {"UnicodeEscapeWithoutDigits", R"({"key":"\uXYZW"})", noObject},
    {"LoneHighSurrogate", R"({"key":"\ud800"})", noObject},
    {"LoneLowSurrogate", R"({"key":"\udc00"})", noObject},
    {"SwappedSurrogates", R"({"key":"\udc00\ud800"})", noObject},
    {"HighSurrogateTwice", R"({"key":"\ud800\ud800"})", noObject},
    {"SurrogatePair", R"({"key":"\ud834\udd1e"})", object},
    {"Noncharacter", R"({"key":"\uffff"})", object},
    {"LoneContinuationByte", "{\"key\":\"\x80\"}", noObject},
    {"InvalidByte", "{\"key\":\"\xff\"}", noObject},
    {"InvalidByteInAName", "{\"\xff\":1}", noObject},
    {"TruncatedSequence", "{\"key\":\"\xe2\x82\"}", noObject},
    {"OverlongSequence", "{\"key\":\"\xc0\xaf\"}", noObject},
    {"SurrogateInUtf8", "{\"key\":\"\xed\xa0\x80\"}", noObject},
    {"BeyondUnicode", "{\"key\":\"\xf4\x90\x80\x80\"}", noObject},
    {"MinusZero", R"({"key":-0})", object},
    {"MinusZeroWithFraction", R"({"key":-0.0})", object},
    {"HugeExponent", R"({"key":1e999})", noObject},
    {"HugeNegative", R"({"key":-1e999})", noObject},
    {"TinyExponent", R"({"key":1e-999})", object},
    {"HugeExponentDigits", R"({"key":1e99999999999999999999})", noObject},
    {"HugeInteger", R"({"key":100000000000000000000})", noObject},
    {"ManyDigits", R"({"key":)" + std::string(100000, '9') + "}", noObject},
    {"ManyDigitsOfAFraction", R"({"key":0.)" + std::string(10000, '3') + "}", object},
    {"LeadingZero", R"({"key":01})", noObject},
    {"LeadingPlus", R"({"key":+1})", noObject},
    {"LeadingPoint", R"({"key":.5})", noObject},
    {"TrailingPoint", R"({"key":5.})", noObject},
    {"JustMinus", R"({"key":-})", noObject},
    {"JustExponent", R"({"key":1e})", noObject},
    {"Hexadecimal", R"({"key":0x1})", noObject},
    {"NotANumber", R"({"key":NaN})", noObject},
    {"Infinity", R"({"key":Infinity})", noObject},
    {"CapitalTrue", R"({"key":True})", noObject},
    {"HalfAWord", R"({"key":nul})", noObject},
    {"DeepArrays", std::string(100000, '['), noObject},
    {"DeepObjects", repeated(R"({"a":)", 100000), noObject},
    {"DeepMixture", repeated(R"([{"a":)", 100000), noObject},
    {"DeepInside", R"({"key":)" + std::string(100000, '[') + std::string(100000, ']') + "}",
     noObject},
    {"OnlyClosing", std::string(100000, ']'), noObject},
    {"ManyQuotes", std::string(100000, '"'), noObject},
    {"ManyBackslashes", "{\"key\":\"" + std::string(100000, '\\') + "\"}", object},
    {"LongText", "{\"key\":\"" + std::string(1000000, 'x') + "\"}", object},
    {"ManyMembers", "{" + repeated(R"("a":1,)", 100000) + R"("b":2})", object},
    {"ManyElements", R"({"key":[)" + repeated("-1,", 100000) + "0]}", object},
};

INSTANTIATE_TEST_SUITE_P(Json, HostileText, ::testing::ValuesIn(texts),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace velkor::messages
