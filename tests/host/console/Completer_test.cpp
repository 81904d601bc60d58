#include "host/console/Completer.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

std::string nothing(Words&&) {
    return "";
}

Words keys() {
    return {"server.host", "server.port", "a key", "it's"};
}

std::shared_ptr<CommandRegistry> makeRegistry() {
    auto registry = std::make_shared<CommandRegistry>();
    registry->registerCommand({"velkor.configuration.get", "", nothing, 1, 1});
    registry->registerCommand({"velkor.configuration.set", "", nothing, 2, 2});
    registry->registerCommand({"sources", "", nothing, 0, 0});
    CommandTraits traits;
    traits.suggestions = [] { return Words{"Get", "Set"}; };
    registry->add(std::make_shared<const Command>(
        administration::CommandDescriptor{"send", "", nothing, 1, 2}, traits));
    registry->add(std::make_shared<const Command>(
        administration::CommandDescriptor{"put", "", nothing, 0, 255},
        CommandTraits{"KEY [VALUE...] [--type T] [--dry-run]"}));
    return registry;
}

Words wordsOf(std::string_view name, const std::string& typed) {
    if (name == "KEY") return keys();
    if (name == "T") return {"int", "uint"};
    if (name == "VALUE" && typed.find('-') == std::string::npos) return {typed + "!"};
    return {};
}

Completion complete(const std::string& line) {
    return Completer(makeRegistry(), wordsOf).complete(line);
}

struct CompletionCase {
    const char* name;
    std::string line;
    Words words;

    friend std::ostream& operator<<(std::ostream& out, const CompletionCase& it) {
        return out << it.name << ": " << it.line;
    }
};

class CompleterTest : public ::testing::TestWithParam<CompletionCase> {};

TEST_P(CompleterTest, OffersWhatMayFollow) {
    EXPECT_EQ(complete(GetParam().line).words, GetParam().words);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, CompleterTest,
    ::testing::Values(
        CompletionCase{"ShortNames", "se", {"set", "send"}},
        CompletionCase{
            "FullNames", "vel", {"velkor.configuration.get", "velkor.configuration.set"}},
        CompletionCase{"AfterBlanks", "  so", {"sources"}},
        CompletionCase{"KeysOfAShortName", "get serv", {"server.host", "server.port"}},
        CompletionCase{"KeysOfAFullName", "velkor.configuration.get server.p", {"server.port"}},
        CompletionCase{"BlankInAKeyIsQuoted", "get a", {R"(a\ key)"}},
        CompletionCase{"GoesOnAfterAQuotedBlank", R"(get a\ )", {R"(a\ key)"}},
        CompletionCase{"GoesOnAfterABackslash", R"(get a\)", {R"(a\ key)"}},
        CompletionCase{"QuoteInAKeyIsQuoted", "get it", {R"(it\'s)"}},
        CompletionCase{"Suggestions", "send S", {"Set"}},
        CompletionCase{"NoFurtherArgument", "set server.port 8", {}},
        CompletionCase{"Options", "put a --", {"--type", "--dry-run"}},
        CompletionCase{"ValuesOfOptions", "put a --type ", {"int", "uint"}},
        CompletionCase{"ArgumentsBehindOptions",
                       "put --type int --dry-run serv",
                       {"server.host", "server.port"}},
        CompletionCase{"FurtherArguments", "put a b c", {"c!"}},
        CompletionCase{"WhatIsTypedWithoutItsQuotes", R"(put a b\ c)", {R"(b\ c!)"}},
        CompletionCase{"NoArgumentsAtAll", "sources ", {}},
        CompletionCase{"UnknownCommand", "nope serv", {}},
        CompletionCase{"InsideQuotes", "get 'serv", {}}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(Completer, OffersEveryKeyForAnArgumentNotBegun) {
    EXPECT_EQ(complete("get ").words.size(), keys().size());
}

TEST(Completer, KnowsHowMuchIsTyped) {
    EXPECT_EQ(complete("get serv").typedBytes, 4U);
    EXPECT_EQ(complete("get ").typedBytes, 0U);
}

TEST(Completion, AddsWhatAllWordsShare) {
    EXPECT_EQ((Completion{4, {"server.host", "server.hose"}}.commonAddition()), "er.hos");
}

TEST(Completion, AddsTheRestOfTheOnlyWord) {
    EXPECT_EQ((Completion{2, {"list"}}.commonAddition()), "st");
}

TEST(Completion, AddsNothingWhereWordsPart) {
    EXPECT_EQ((Completion{1, {"ab", "ac"}}.commonAddition()), "");
    EXPECT_EQ((Completion{0, {}}.commonAddition()), "");
}

TEST(Completion, AddsNoPartOfACharacter) {
    EXPECT_EQ((Completion{1, {"ax\u00e9", "ax\u00e8"}}.commonAddition()), "x");
}

}  // namespace
}  // namespace velkor::host
