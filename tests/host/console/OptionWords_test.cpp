#include "host/console/OptionWords.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/console/Command.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

constexpr const char* usage = "KEY [VALUE] [--type T] [--dry-run]";

OptionWords read(const Words& typed) {
    return {"run", usage, 1, typed};
}

std::string refusal(const Words& typed) {
    return thrownText<CommandError>([&] { read(typed); });
}

TEST(OptionWords, OptionsMayStandAnywhere) {
    const auto given = read({"--dry-run", "a", "--type", "int", "b"});
    EXPECT_EQ(given.texts(), (Words{"a", "b"}));
    EXPECT_TRUE(given.has("--dry-run"));
    EXPECT_EQ(given.value("--type"), "int");
}

TEST(OptionWords, WhatIsNotGivenIsNotThere) {
    const auto given = read({"a"});
    EXPECT_FALSE(given.has("--dry-run"));
    EXPECT_EQ(given.value("--type"), std::nullopt);
}

TEST(OptionWords, OfSeveralValuesTheLastOneCounts) {
    EXPECT_EQ(read({"a", "--type", "int", "--type", "bool"}).value("--type"), "bool");
}

TEST(OptionWords, AQuotedWordIsNoOption) {
    EXPECT_EQ(read({"'--type'", "\\--dry-run"}).texts(), (Words{"--type", "--dry-run"}));
}

TEST(OptionWords, BehindTwoDashesNoWordIsAnOption) {
    EXPECT_EQ(read({"--", "--type", "--"}).texts(), (Words{"--type", "--"}));
}

TEST(OptionWords, TellWhatIsQuoted) {
    const auto given = read({"a", "'a'"});
    EXPECT_FALSE(given.words()[0].isQuoted);
    EXPECT_TRUE(given.words()[1].isQuoted);
}

TEST(OptionWords, AnUnknownOptionIsRefused) {
    EXPECT_EQ(refusal({"a", "--x"}),
              "run knows no option --x; quote it where it is an ordinary word.");
}

TEST(OptionWords, AnOptionWithoutItsValueIsRefused) {
    EXPECT_EQ(refusal({"a", "--type"}), "run: --type needs T.");
}

TEST(OptionWords, TooFewAndTooManyWordsAreRefused) {
    const std::string text = std::string("run takes ") + usage;
    EXPECT_EQ(refusal({}), text);
    EXPECT_EQ(refusal({"a", "b", "c"}), text);
}

}  // namespace
}  // namespace velkor::host
