#include "host/LoginName.hpp"

#include <gtest/gtest.h>

#include <cstdio>
#include <string>

namespace velkor::host {
namespace {

// What the system's own program says.
std::string nameByTheSystem() {
    std::FILE* const answer = ::popen("id -un", "r");
    char line[256] = "";
    const bool isThere = std::fgets(line, sizeof line, answer) != nullptr;
    ::pclose(answer);
    const std::string name = line;
    return isThere ? name.substr(0, name.find('\n')) : "";
}

TEST(LoginName, IsThatOfTheUser) {
    const std::string name = nameByTheSystem();
    if (name.empty()) GTEST_SKIP() << "the system knows no name of this user";
    EXPECT_EQ(loginName(), name);
}

}  // namespace
}  // namespace velkor::host
