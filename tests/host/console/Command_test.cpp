#include "host/console/Command.hpp"

#include <gtest/gtest.h>

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

std::string joined(Words&& arguments) {
    std::string text;
    for (const auto& argument : arguments) text += '<' + argument + '>';
    return text;
}

Command makeCommand(std::uint8_t least, std::uint8_t most, CommandTraits traits = {}) {
    return Command({"host.run", "Runs.", joined, least, most}, std::move(traits));
}

Words argumentsOf(const Command& command, const std::string& text) {
    CommandLine line(text);
    line.nextWord();
    return command.readArguments(line);
}

struct LimitCase {
    const char* name;
    std::uint8_t least;
    std::uint8_t most;
    Words arguments;
    std::string message;

    friend std::ostream& operator<<(std::ostream& out, const LimitCase& it) {
        return out << it.name;
    }
};

class CommandLimitsTest : public ::testing::TestWithParam<LimitCase> {};

TEST_P(CommandLimitsTest, AreNamedWhenTheyAreMissed) {
    const Command command = makeCommand(GetParam().least, GetParam().most);
    EXPECT_EQ(thrownText<CommandError>([&] { command.run(Words(GetParam().arguments)); }),
              GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Limits, CommandLimitsTest,
    ::testing::Values(
        LimitCase{"NoneAllowed", 0, 0, {"a"}, "host.run takes no arguments; given: 1"},
        LimitCase{"ExactlyOne", 1, 1, {}, "host.run takes 1 argument; given: 0"},
        LimitCase{"ExactlyTwo", 2, 2, {"a"}, "host.run takes 2 arguments; given: 1"},
        LimitCase{"TooManyOfTwo", 2, 2, {"a", "b", "c"}, "host.run takes 2 arguments; given: 3"},
        LimitCase{"AtMostOne", 0, 1, {"a", "b"}, "host.run takes at most 1 argument; given: 2"},
        LimitCase{"Range", 1, 3, {}, "host.run takes 1 to 3 arguments; given: 0"},
        LimitCase{"AtLeastTwo", 2, 255, {"a"}, "host.run takes at least 2 arguments; given: 1"}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(Command, HandsItsArgumentsToTheHandler) {
    EXPECT_EQ(makeCommand(1, 2).run({"a", "b c"}), "<a><b c>");
}

TEST(Command, AMaximumOf255IsNoLimit) {
    EXPECT_EQ(makeCommand(0, 255).run(Words(300, "")).size(), 600U);
}

TEST(Command, AMaximumOf254IsALimit) {
    EXPECT_THROW(makeCommand(0, 254).run(Words(255, "")), CommandError);
}

TEST(Command, PassesOnWhatItsHandlerThrows) {
    const Command command(
        {"x", "", [](Words&&) -> std::string { throw std::out_of_range("gone"); }, 0, 0}, {});
    EXPECT_EQ(thrownText<std::out_of_range>([&] { command.run({}); }), "gone");
}

TEST(Command, ShortNameIsTheLastWordOfTheName) {
    EXPECT_EQ(Command({"velkor.configuration.set", "", joined, 0, 0}, {}).shortName(), "set");
    EXPECT_EQ(Command({"quit", "", joined, 0, 0}, {}).shortName(), "quit");
}

TEST(Command, ShowsTheNamesOfItsArgumentsWhenItKnowsThem) {
    EXPECT_EQ(makeCommand(1, 2, {"KEY [VALUE]"}).argumentText(), "KEY [VALUE]");
    EXPECT_EQ(makeCommand(1, 2).argumentText(), "1 to 2 arguments");
    EXPECT_EQ(makeCommand(0, 255).argumentText(), "any number of arguments");
}

TEST(Command, ReadsAllWordsAsArguments) {
    EXPECT_EQ(argumentsOf(makeCommand(1, 1), "run 'a b' c"), (Words{"a b", "c"}));
}

TEST(Command, TakesTheRawRestAsLastArgumentWhereWanted) {
    const Command command = makeCommand(1, 2, {"", true});
    EXPECT_EQ(argumentsOf(command, R"(run Get {"key": "it's  me"} )"),
              (Words{"Get", R"({"key": "it's  me"})"}));
}

TEST(Command, TakesWordsAsTypedWhereWanted) {
    CommandTraits traits;
    traits.takesWordsAsTyped = true;
    const Command command = makeCommand(0, 9, traits);
    EXPECT_EQ(argumentsOf(command, R"(run 'a' b\ c)"), (Words{"'a'", "b\\ c"}));
    EXPECT_EQ(command.givenArguments({"5", "b c"}), (Words{"5", "b\\ c"}));
}

TEST(Command, TakesGivenWordsAsTheyAre) {
    EXPECT_EQ(makeCommand(0, 9).givenArguments({"b c"}), (Words{"b c"}));
}

TEST(Command, HasNoLastArgumentWhenTheRestIsEmpty) {
    EXPECT_EQ(argumentsOf(makeCommand(1, 2, {"", true}), "run Get  "), (Words{"Get"}));
}

}  // namespace
}  // namespace velkor::host
