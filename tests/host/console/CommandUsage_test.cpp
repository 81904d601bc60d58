#include "host/console/CommandUsage.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

TEST(CommandUsage, OfNothingIsEmpty) {
    const CommandUsage usage("");
    EXPECT_EQ(usage.arguments, Words{});
    EXPECT_TRUE(usage.options.empty());
    EXPECT_EQ(usage.argumentName(0), "");
}

TEST(CommandUsage, NamesArgumentsInOrder) {
    const CommandUsage usage("KEY [JSON]");
    EXPECT_EQ(usage.arguments, (Words{"KEY", "JSON"}));
    EXPECT_EQ(usage.argumentName(1), "JSON");
    EXPECT_EQ(usage.argumentName(2), "");
}

TEST(CommandUsage, KnowsOptionsWithAndWithoutValues) {
    const CommandUsage usage("[--all] [KEY] [--type T]");
    EXPECT_EQ(usage.arguments, Words{"KEY"});
    EXPECT_EQ(usage.find("--all")->valueName, "");
    EXPECT_EQ(usage.find("--type")->valueName, "T");
    EXPECT_EQ(usage.find("--none"), nullptr);
}

TEST(CommandUsage, KnowsThatTheLastArgumentMayRepeat) {
    const CommandUsage usage("KEY [VALUE...] [--dry-run]");
    EXPECT_TRUE(usage.lastRepeats);
    EXPECT_EQ(usage.argumentName(7), "VALUE");
}

TEST(CommandUsage, KeepsAlternatives) {
    EXPECT_EQ(CommandUsage("[--format a|b]").find("--format")->valueName, "a|b");
}

TEST(CommandUsage, TakesArgumentsThatComeTogether) {
    EXPECT_EQ(CommandUsage("[A B]").arguments, (Words{"A", "B"}));
    EXPECT_EQ(CommandUsage("[[A] B]").arguments, (Words{"A", "B"}));
}

}  // namespace
}  // namespace velkor::host
