#include "host/MisplacedCommands.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/Options.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

std::string refusal(const std::vector<SourceRequest>& requests, const Words& commands) {
    return velkor::testing::thrownText<UsageError>(
        [&] { refuseMisplacedCommands(requests, commands); });
}

constexpr const char* nothingThrown = "<nothing thrown>";

TEST(MisplacedCommands, AreRefusedWithTheirArguments) {
    EXPECT_EQ(
        refusal({{std::nullopt, "a.properties"}, {std::nullopt, "get"}, {std::nullopt, "k"}},
                {"get"}),
        "get is a command and no file; say: velkor-config [OPTIONS] [FILE...] -- get k, or -c "
        "\"get k\"");
}

TEST(MisplacedCommands, AreNotFilesThatAreNotThere) {
    EXPECT_EQ(refusal({{std::nullopt, "gett"}}, {"get"}), nothingThrown);
}

TEST(MisplacedCommands, AreNotFilesThatAreThere) {
    const velkor::testing::TemporaryFile file("");
    EXPECT_EQ(refusal({{std::nullopt, file.path().string()}}, {file.path().string()}),
              nothingThrown);
}

TEST(MisplacedCommands, AreNotSourcesOfAnotherForm) {
    SourceRequest environment{std::nullopt, "get"};
    environment.kind = "environment";
    EXPECT_EQ(refusal({{"name", "get"}, environment}, {"get"}), nothingThrown);
}

}  // namespace
}  // namespace velkor::host
