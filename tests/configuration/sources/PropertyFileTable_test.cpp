#include <gtest/gtest.h>

#include <cstddef>
#include <random>
#include <string>
#include <string_view>

#include "tests/configuration/sources/PropertyReading.hpp"
#include "tests/support/Sanitizers.hpp"

namespace velkor::configuration {
namespace {

using testing::Properties;

// `bytes` as a file has to spell them, for a key or a value.
std::string spelled(const std::string& bytes) {
    constexpr std::string_view ordinary = "abcdefghijklmnopqrstuvwxyz0123456789.";
    std::string text;
    for (const char byte : bytes) {
        if (byte == '\n' || byte == '\r') {
            text += byte == '\n' ? "\\u000a" : "\\u000d";
            continue;
        }
        if (ordinary.find(byte) == std::string_view::npos) text += '\\';
        text += byte;
    }
    return text;
}

std::string lineOf(const std::string& key, const std::string& value) {
    return spelled(key) + "=" + spelled(value) + "\n";
}

// What a source holds of `text`, by its list of keys and the value of each.
Properties propertiesIn(const std::string& text) {
    PropertyFileSource source(PropertyText{text});
    return testing::propertiesOf(source);
}

TEST(PropertyFileTable, EmptyOneHasNothing) {
    PropertyFileSource source(PropertyText{""});
    EXPECT_FALSE(source.has(""));
    EXPECT_FALSE(source.has("a"));
    EXPECT_TRUE(source.keys().empty());
}

TEST(PropertyFileTable, KeyThatIsNotThereIsNotFoundBesideThousandsThatAre) {
    std::string text;
    for (int number = 0; number < 10'000; ++number) text += lineOf(std::to_string(number), "v");
    PropertyFileSource source{PropertyText{text}};
    for (int number = 10'000; number < 30'000; ++number) {
        ASSERT_FALSE(source.has(std::to_string(number)));
    }
}

TEST(PropertyFileTable, KeysOfEveryLengthDifferInEveryByte) {
    constexpr std::size_t longest = 40;
    Properties expected;
    for (std::size_t length = 0; length <= longest; ++length) {
        const std::string plain(length, 'k');
        expected[plain] = "plain " + std::to_string(length);
        for (std::size_t changed = 0; changed < length; ++changed) {
            for (const char byte : {'j', '\0', '\xFF'}) {
                std::string key = plain;
                key[changed] = byte;
                expected[key] = std::to_string(length) + " " + std::to_string(changed);
            }
        }
    }
    std::string text;
    for (const auto& [key, value] : expected) text += lineOf(key, value);
    EXPECT_EQ(propertiesIn(text), expected);
}

TEST(PropertyFileTable, LastOfThousandsWithOneKeyCounts) {
    std::string text;
    for (int number = 0; number < 5'000; ++number) {
        text += lineOf("same", "value " + std::to_string(number)) + lineOf("", "");
    }
    EXPECT_EQ(propertiesIn(text), (Properties{{"same", "value 4999"}, {"", ""}}));
}

TEST(PropertyFileTable, AgreesWithAMapOnRandomProperties) {
    using namespace std::string_view_literals;
    constexpr std::string_view alphabet = "abcu.u =:\\#!\n\r\t\0\xC3\xA9"sv;
    std::mt19937 random(20261121);  // NOLINT(cert-msc51-cpp): every run has the same inputs
    const auto draw = [&](std::size_t longest) {
        std::string bytes(random() % (longest + 1), '\0');
        for (char& byte : bytes) byte = alphabet[random() % alphabet.size()];
        return bytes;
    };
    for (int round = 0; round < 300; ++round) {
        Properties expected;
        std::string text;
        // Short keys, which come again and again, and long ones.
        for (std::size_t left = random() % 300; left > 0; --left) {
            const std::string key = draw(left % 3 == 0 ? 30 : 2);
            const std::string value = draw(40);
            expected[key] = value;
            text += lineOf(key, value);
        }
        ASSERT_EQ(propertiesIn(text), expected) << "round " << round;
    }
}

TEST(PropertyFileTable, HoldsAsManyKeysAsThereAre) {
    constexpr int keyCount = velkor::testing::isSanitized ? 20'000 : 500'000;
    std::string text;
    for (int number = 0; number < keyCount; ++number) {
        text += "some.group.key" + std::to_string(number) + "=" + std::to_string(number) + "\n";
    }
    PropertyFileSource source{PropertyText{text}};
    for (int number = 0; number < keyCount; ++number) {
        const std::string digits = std::to_string(number);
        ASSERT_EQ(boost::get<std::string>(source.get("some.group.key" + digits)), digits);
    }
    EXPECT_EQ(source.keys().size(), static_cast<std::size_t>(keyCount));
}

}  // namespace
}  // namespace velkor::configuration
