#include "layers/environment/EnvironmentSource.hpp"

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/support/Thrown.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::layers {
namespace {

using velkor::testing::textOf;
using velkor::testing::thrownText;

EnvironmentSource sourceOf(std::vector<const char*> variables) {
    variables.push_back(nullptr);
    return EnvironmentSource(EnvironmentNames("VELKOR_", {"log-level"}), variables.data());
}

TEST(EnvironmentSource, HoldsTheVariablesThatStandForKeys) {
    auto source = sourceOf({"HOME=/root", "VELKOR_SERVER__PORT=80", "VELKOR_A=b", "VELKOR_x=c",
                            "VELKOR_LOG_LEVEL=debug"});
    EXPECT_EQ(source.keys(), (std::set<std::string>{"a", "log-level", "server.port"}));
    EXPECT_EQ(textOf(source.get("server.port")), "string 80");
    EXPECT_EQ(textOf(source.get("log-level")), "string debug");
    EXPECT_TRUE(source.has("a"));
    EXPECT_FALSE(source.has("x"));
}

struct Variable {
    const char* test;
    const char* variable;
    std::string value;
};

class EnvironmentValueTest : public ::testing::TestWithParam<Variable> {};

TEST_P(EnvironmentValueTest, IsWhatFollowsTheFirstEqualsSign) {
    EXPECT_EQ(textOf(sourceOf({GetParam().variable}).get("a")), "string " + GetParam().value);
}

INSTANTIATE_TEST_SUITE_P(Values, EnvironmentValueTest,
                         ::testing::Values(Variable{"Number", "VELKOR_A=1", "1"},
                                           Variable{"Truth", "VELKOR_A=true", "true"},
                                           Variable{"Nothing", "VELKOR_A=", ""},
                                           Variable{"EqualsSign", "VELKOR_A==b=", "=b="},
                                           Variable{"Blanks", "VELKOR_A= \t\n", " \t\n"},
                                           Variable{"AnyBytes", "VELKOR_A=\xff\x01", "\xff\x01"}),
                         [](const auto& tested) { return tested.param.test; });

TEST(EnvironmentSource, LeavesOutWhatIsNoVariable) {
    EXPECT_TRUE(sourceOf({"VELKOR_A", "=VELKOR_A", ""}).keys().empty());
}

TEST(EnvironmentSource, TakesTheFirstOfTwoVariablesOfOneName) {
    EXPECT_EQ(textOf(sourceOf({"VELKOR_A=first", "VELKOR_A=second"}).get("a")), "string first");
}

TEST(EnvironmentSource, IsEmptyWithoutAnEnvironment) {
    EXPECT_TRUE(EnvironmentSource(EnvironmentNames(""), nullptr).keys().empty());
}

TEST(EnvironmentSource, ReadsTheEnvironmentOfTheProcessOnce) {
    ::setenv("VELKOR_TEST_A", "before", 1);
    EnvironmentSource source(EnvironmentNames("VELKOR_TEST_"));
    ::setenv("VELKOR_TEST_A", "after", 1);
    EXPECT_EQ(textOf(source.get("a")), "string before");
    ::unsetenv("VELKOR_TEST_A");
}

TEST(EnvironmentSource, RefusesWrites) {
    auto source = sourceOf({"VELKOR_A=1"});
    EXPECT_EQ(thrownText<std::runtime_error>([&] { source.set("a", 2); }),
              "EnvironmentSource does not support writing");
    EXPECT_EQ(textOf(source.get("a")), "string 1");
}

TEST(EnvironmentSource, IsALayerOfAStoreWithItsGroup) {
    const char* const variables[] = {"VELKOR_PORT=80", nullptr};
    const auto store = std::make_shared<configuration::ConfigurationImpl>();
    store->addSource("environment", "server", 200, true,
                     std::make_shared<EnvironmentSource>(EnvironmentNames("VELKOR_"), variables));
    EXPECT_EQ(store->getOption("server.port").get().source, "environment");
}

}  // namespace
}  // namespace velkor::layers
