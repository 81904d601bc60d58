#include "host/console/GivenLines.hpp"

#include <gtest/gtest.h>

#include <optional>

namespace velkor::host {
namespace {

TEST(GivenLines, AreHandedOutInTurn) {
    GivenLines lines({"a", "", "b"});
    EXPECT_EQ(lines.nextLine(), "a");
    EXPECT_EQ(lines.nextLine(), "");
    EXPECT_EQ(lines.nextLine(), "b");
    EXPECT_EQ(lines.nextLine(), std::nullopt);
}

TEST(GivenLines, HaveNoPositionToSpeakOf) {
    EXPECT_EQ(GivenLines({"a"}).position(), "");
}

}  // namespace
}  // namespace velkor::host
