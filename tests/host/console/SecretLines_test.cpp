#include "host/console/SecretLines.hpp"

#include <gtest/gtest.h>

#include <set>
#include <string>

namespace velkor::host {
namespace {

const std::set<std::string> secrets{"server.password"};

class SecretLineTest : public ::testing::TestWithParam<const char*> {};

TEST_P(SecretLineTest, MayHoldASecret) {
    EXPECT_TRUE(mayHoldSecret(GetParam(), secrets));
}

INSTANTIATE_TEST_SUITE_P(
    Lines, SecretLineTest,
    ::testing::Values("set server.password x", "sett server.password x", "set 'server.pass'word x",
                      "set server\\.password x", "set server.password 'x",
                      "set 'server.pass'word 'x",
                      R"(send ConfigurationSet {"key":"server\u002epassword"})",
                      "s''end ConfigurationSet {}"));

TEST(SecretLines, AreNoOtherLines) {
    EXPECT_FALSE(mayHoldSecret("set server.port 1", secrets));
    EXPECT_FALSE(mayHoldSecret("", secrets));
}

TEST(SecretLines, AreNoneWhereThereIsNoSecret) {
    EXPECT_FALSE(mayHoldSecret("send ConfigurationSet {} 'x", {}));
}

}  // namespace
}  // namespace velkor::host
