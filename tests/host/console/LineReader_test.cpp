#include "host/console/LineReader.hpp"

#include <gtest/gtest.h>

#include <optional>
#include <sstream>
#include <stdexcept>
#include <streambuf>
#include <string>

#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;
using velkor::testing::thrownText;

TEST(LineReader, ReadsLinesUpToTheirLineFeeds) {
    std::istringstream in("a b\n\nc\n");
    LineReader reader(in);
    EXPECT_EQ(reader.nextLine(), "a b");
    EXPECT_EQ(reader.nextLine(), "");
    EXPECT_EQ(reader.nextLine(), "c");
    EXPECT_EQ(reader.nextLine(), std::nullopt);
}

TEST(LineReader, ReadsALastLineWithoutLineFeed) {
    std::istringstream in("a\nb");
    LineReader reader(in);
    reader.nextLine();
    EXPECT_EQ(reader.nextLine(), "b");
    EXPECT_EQ(reader.nextLine(), std::nullopt);
}

TEST(LineReader, TakesBytesAsTheyAre) {
    std::istringstream in("a\0\xff\r\n"s);
    LineReader reader(in);
    EXPECT_EQ(reader.nextLine(), "a\0\xff\r"s);
}

TEST(LineReader, AcceptsALineOfTheGreatestLength) {
    const std::string longest(LineReader::longestLine, 'x');
    std::istringstream in(longest + "\nnext\n");
    LineReader reader(in);
    EXPECT_EQ(reader.nextLine(), longest);
    EXPECT_EQ(reader.nextLine(), "next");
}

TEST(LineReader, RefusesALongerLineAndReadsOn) {
    std::istringstream in(std::string(LineReader::longestLine + 1, 'x') + "\nnext\n");
    LineReader reader(in);
    EXPECT_EQ(thrownText<LineError>([&] { reader.nextLine(); }),
              "Line too long; the limit is 1048576 bytes.");
    EXPECT_EQ(reader.nextLine(), "next");
}

TEST(LineReader, CountsLines) {
    std::istringstream in("a\nb\n");
    LineReader reader(in);
    reader.nextLine();
    EXPECT_EQ(reader.position(), "line 1: ");
    reader.nextLine();
    EXPECT_EQ(reader.position(), "line 2: ");
}

class BrokenInput : public std::streambuf {
    int_type underflow() override { throw std::runtime_error("broken"); }
};

TEST(LineReader, ReportsBrokenInputOnceAndEnds) {
    BrokenInput broken;
    std::istream in(&broken);
    LineReader reader(in);
    EXPECT_EQ(thrownText<LineError>([&] { reader.nextLine(); }), "Reading failed.");
    EXPECT_EQ(reader.nextLine(), std::nullopt);
}

}  // namespace
}  // namespace velkor::host
