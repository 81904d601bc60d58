#include "host/Severities.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <stdexcept>
#include <string>

#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;

struct MaskCase {
    const char* name;
    std::string text;
    unsigned mask;

    friend std::ostream& operator<<(std::ostream& out, const MaskCase& it) {
        return out << it.name;
    }
};

class SeveritiesTest : public ::testing::TestWithParam<MaskCase> {};

TEST_P(SeveritiesTest, AreReadFromNamesAndNumbers) {
    EXPECT_EQ(parseSeverities(GetParam().text), GetParam().mask);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, SeveritiesTest,
    ::testing::Values(MaskCase{"Fatal", "fatal", 1}, MaskCase{"Error", "error", 2},
                      MaskCase{"Warning", "warning", 4}, MaskCase{"Debug", "debug", 8},
                      MaskCase{"Trace", "trace", 16}, MaskCase{"Names", "debug,trace", 24},
                      MaskCase{"Number", "24", 24}, MaskCase{"Both", "1,debug,8", 9},
                      MaskCase{"None", "0", 0}, MaskCase{"All", "31", 31}),
    [](const auto& tested) { return std::string(tested.param.name); });

class BadSeveritiesTest : public ::testing::TestWithParam<const char*> {};

TEST_P(BadSeveritiesTest, AreRefused) {
    EXPECT_THROW(parseSeverities(GetParam()), std::invalid_argument);
}

INSTANTIATE_TEST_SUITE_P(Texts, BadSeveritiesTest,
                         ::testing::Values("", "loud", "Debug", "32", "-1", "8x", "debug,", ",8",
                                           "debug, trace", "99999999999999999999"));

TEST(Severities, ErrorNamesThePartThatIsUnknown) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { parseSeverities("debug,loud"); }),
              "Unknown severity: loud");
}

TEST(Severities, EachHasAName) {
    EXPECT_EQ(severityName(common::fatal), "fatal");
    EXPECT_EQ(severityName(common::trace), "trace");
    EXPECT_EQ(severityName(static_cast<common::Severity>(3)), "unknown");
}

}  // namespace
}  // namespace velkor::host
