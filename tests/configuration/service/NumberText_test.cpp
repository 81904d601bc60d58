#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>
#include <Poco/NumberParser.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "tests/configuration/service/JsonForms.hpp"

namespace velkor::configuration {
namespace {

using namespace std::string_literals;
using Poco::NumberParser;
using velkor::testing::JsonForms;

Poco::JSON::Object::Ptr setRequest(const std::string& tag, const Poco::Dynamic::Var& content) {
    Poco::JSON::Object::Ptr value = new Poco::JSON::Object;
    value->set("type", tag);
    value->set("value", content);
    Poco::JSON::Object::Ptr request = new Poco::JSON::Object;
    request->set("value", value);
    return request;
}

/// What the scalar kind `T` called `tag` reads from `text`.
template <class T>
T readAs(const std::string& tag, const std::string& text) {
    const auto request = JsonForms().fromObject<ConfigurationSet>(setRequest(tag, text));
    return boost::get<T>(request->value);
}

std::vector<double> readAllAsDoubles(const std::vector<std::string>& texts) {
    Poco::JSON::Array::Ptr array = new Poco::JSON::Array;
    for (const std::string& text : texts) array->add(text);
    const auto request = JsonForms().fromObject<ConfigurationSet>(setRequest("doubleArray", array));
    return boost::get<std::vector<double>>(request->value);
}

double pocoReads(const std::string& text) {
    double number = 0;
    return NumberParser::tryParseFloat(text, number) ? number : 0;
}

std::uint64_t bitsOf(double number) {
    std::uint64_t bits = 0;
    std::memcpy(&bits, &number, sizeof bits);
    return bits;
}

void expectWhatPocoReads(const std::vector<std::string>& texts) {
    const std::vector<double> numbers = readAllAsDoubles(texts);
    ASSERT_EQ(numbers.size(), texts.size());
    for (std::size_t i = 0; i < texts.size(); ++i) {
        ASSERT_EQ(bitsOf(numbers[i]), bitsOf(pocoReads(texts[i])))
            << ::testing::PrintToString(texts[i]);
    }
}

/// All texts of at most `length` characters of `alphabet`.
std::vector<std::string> allTexts(const std::string& alphabet, std::size_t length) {
    std::vector<std::string> texts{""};
    std::size_t shorter = 0;
    for (std::size_t size = 1; size <= length; ++size) {
        const std::size_t end = texts.size();
        for (; shorter < end; ++shorter) {
            for (const char last : alphabet) texts.push_back(texts[shorter] + last);
        }
    }
    return texts;
}

TEST(DoubleInAShortText, IsWhatPocoReads) {
    expectWhatPocoReads(allTexts("019.,+-eEfxni \t\0"s, 4));
}

TEST(DoubleInATextOfFewCharacters, IsWhatPocoReads) {
    expectWhatPocoReads(allTexts("1,f .e-", 6));
}

TEST(DoubleInAnyText, IsWhatPocoReads) {
    std::mt19937 random(1);
    const std::string alphabet = "0123456789.,+-eEf ,f05\0\n"s;
    std::uniform_int_distribution<std::size_t> character(0, alphabet.size() - 1);
    std::uniform_int_distribution<int> length(0, 40);
    std::vector<std::string> texts(50000);
    for (std::string& text : texts) {
        for (int left = length(random); left > 0; --left) text += alphabet[character(random)];
    }
    expectWhatPocoReads(texts);
}

// Grouped, as people write it: most of these are numbers.
TEST(DoubleInAGroupedText, IsWhatPocoReads) {
    std::mt19937 random(2);
    std::uniform_int_distribution<int> digit(0, 9);
    std::uniform_int_distribution<int> length(1, 30);
    std::vector<std::string> texts(20000);
    for (std::string& text : texts) {
        for (int left = length(random); left > 0; --left) {
            text += std::to_string(digit(random));
            if (digit(random) < 3) text += digit(random) < 5 ? "," : "f";
        }
        if (digit(random) < 5) text.insert(text.size() / 2, ".");
        if (digit(random) < 5) text += "e-" + std::to_string(length(random));
    }
    expectWhatPocoReads(texts);
}

// Every character that POCO removes used to move all that followed it: minutes for these texts.

constexpr std::size_t longText = std::size_t{4} * 1024 * 1024;

std::string repeated(const std::string& part, std::size_t size) {
    std::string text;
    while (text.size() < size) text += part;
    return text;
}

TEST(DoubleInALongText, MayHoldAnyNumberOfSeparators) {
    EXPECT_EQ(readAs<double>("double", "2.5" + repeated(",", longText)), 2.5);
    EXPECT_EQ(readAs<double>("double", repeated("0,", longText) + "2.5"), 2.5);
}

TEST(DoubleInALongText, MayHoldAnyNumberOfSuffixes) {
    EXPECT_EQ(readAs<double>("double", "2.5" + repeated("f", longText)), 2.5);
    EXPECT_EQ(readAs<double>("double", repeated("0,f", longText) + "2.5"), 2.5);
}

TEST(DoubleInALongText, IsNoneWhenTheTextIsNoNumber) {
    EXPECT_EQ(readAs<double>("double", repeated("1,x", longText)), 0);
}

TEST(DoublesInLongTexts, MayHoldAnyNumberOfSeparators) {
    const std::vector<std::string> texts(4, "2.5" + repeated(",f", longText / 4));
    EXPECT_EQ(readAllAsDoubles(texts), std::vector<double>(4, 2.5));
}

TEST(IntegerInALongText, MayHoldAnyNumberOfSeparators) {
    EXPECT_EQ(readAs<int>("int", repeated("0,", longText) + "25"), 25);
    EXPECT_EQ(readAs<unsigned int>("uint", repeated("0,", longText) + "25"), 25U);
}

TEST(BoolInALongText, MayHoldAnyNumberOfSeparators) {
    EXPECT_TRUE(readAs<bool>("bool", repeated("0,", longText) + "1"));
}

}  // namespace
}  // namespace velkor::configuration
