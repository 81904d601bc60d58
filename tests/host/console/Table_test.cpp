#include "host/console/Table.hpp"

#include <gtest/gtest.h>

namespace velkor::host {
namespace {

TEST(Table, AlignsColumnsTwoBlanksApart) {
    EXPECT_EQ(formatTable({{"NAME", "ORDER"}, {"a", "10"}, {"longer", "2"}}),
              "NAME    ORDER\n"
              "a       10\n"
              "longer  2\n");
}

TEST(Table, MeasuresCharactersNotBytes) {
    EXPECT_EQ(formatTable({{"\u00e9\u00e9", "x"}, {"ab", "y"}}), "\u00e9\u00e9  x\nab  y\n");
}

TEST(Table, EndsNoLineInBlanks) {
    EXPECT_EQ(formatTable({{"a", "b"}, {"a", ""}}), "a  b\na\n");
}

TEST(Table, KeepsThePlaceOfAnEmptyCell) {
    EXPECT_EQ(formatTable({{"ab", "c", "d"}, {"a", "", "d"}}), "ab  c  d\na      d\n");
}

TEST(Table, OfNothingIsEmpty) {
    EXPECT_EQ(formatTable({}), "");
}

}  // namespace
}  // namespace velkor::host
