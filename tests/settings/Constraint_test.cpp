#include "settings/Constraint.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <limits>
#include <optional>
#include <ostream>
#include <ratio>
#include <stdexcept>
#include <string>
#include <vector>

#include "settings/ByteSize.hpp"
#include "tests/settings/Spelled.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::settings::testing {
namespace {

using namespace std::chrono_literals;
using namespace literals;
using velkor::testing::thrownText;

struct Row {
    std::string description;
    std::string refusal;
    std::string expectedDescription;
    std::string expectedRefusal;
};

void PrintTo(const Row& row, std::ostream* out) {
    *out << row.expectedDescription;
}

constexpr const char* right = "";

// What `constraint` says of itself and of `value`.
template <class T>
Row row(const Constraint<T>& constraint, const T& value, std::string description,
        std::string refusal) {
    const std::optional<Reason> reason = constraint.check(value);
    return {constraint.description(), reason ? reason->text : right, std::move(description),
            std::move(refusal)};
}

bool isEven(int value) {
    return value % 2 == 0;
}

using Tiny = std::chrono::duration<std::int64_t, std::nano>;
using Huge = std::chrono::duration<std::int64_t, std::ratio<86400>>;
constexpr auto highest = std::numeric_limits<std::int64_t>::max();
constexpr auto lowest = std::numeric_limits<std::int64_t>::min();

const Row rows[] = {
    row<int>({}, 5, "", right),

    row<int>(between(1, 65535), 1, "between 1 and 65535", right),
    row<int>(between(1, 65535), 65535, "between 1 and 65535", right),
    row<int>(between(1, 65535), 0, "between 1 and 65535", "not between 1 and 65535"),
    row<int>(between(1, 65535), -1, "between 1 and 65535", "not between 1 and 65535"),
    row<int>(between(1, 65535), 65536, "between 1 and 65535", "not between 1 and 65535"),
    row<int>(between(-1, 1U), -1, "between -1 and 1", right),
    row<std::uint16_t>(between(1, 65535), 65535, "between 1 and 65535", right),
    row<std::uint8_t>(between(1, 200), 201, "between 1 and 200", "not between 1 and 200"),
    row<std::uint64_t>(between(-1, 1), ~std::uint64_t{0}, "between -1 and 1",
                       "not between -1 and 1"),
    row<unsigned int>(atLeast(-1), 0, "at least -1", right),
    row<std::int64_t>(atMost(~std::uint64_t{0}), lowest, "at most 18446744073709551615", right),
    row<double>(between(0, 1), 0.5, "between 0 and 1", right),
    row<double>(between(0, 1), 1.5, "between 0 and 1", "not between 0 and 1"),
    row<double>(between(0, 1), std::numeric_limits<double>::quiet_NaN(), "between 0 and 1",
                "not between 0 and 1"),
    row<int>(between(0.5, 1.5), 1, "between 0.5 and 1.5", right),
    row<int>(between(3, 3), 3, "between 3 and 3", right),
    row<std::string>(between("a", "c"), "b", "between a and c", right),
    row<std::string>(between("a", "c"), "d", "between a and c", "not between a and c"),
    row<Level>(atLeast(Level::info), Level::debug, "at least info", "not at least info"),
    row<Level>(atLeast(Level::info), Level::warning, "at least info", right),

    row<std::chrono::milliseconds>(between(1s, 1h), 1000ms, "between 1s and 1h", right),
    row<std::chrono::milliseconds>(between(1s, 1h), 999ms, "between 1s and 1h",
                                   "not between 1s and 1h"),
    row<std::chrono::milliseconds>(between(1s, 1h), 3600001ms, "between 1s and 1h",
                                   "not between 1s and 1h"),
    row<std::chrono::milliseconds>(between(-1s, 1s), -1000ms, "between -1s and 1s", right),
    row<std::chrono::milliseconds>(between(-1s, 1s), -1001ms, "between -1s and 1s",
                                   "not between -1s and 1s"),
    row<std::chrono::duration<double>>(atMost(1500ms), std::chrono::duration<double>(1.5),
                                       "at most 1500ms", right),
    row<std::chrono::duration<double>>(atMost(1500ms), std::chrono::duration<double>(1.6),
                                       "at most 1500ms", "not at most 1500ms"),
    row<Huge>(atLeast(1ns), Huge(highest), "at least 1ns", right),
    row<Huge>(atLeast(1ns), Huge(lowest), "at least 1ns", "not at least 1ns"),
    row<Huge>(atMost(1ns), Huge(highest), "at most 1ns", "not at most 1ns"),
    row<Tiny>(atMost(Huge(highest)), Tiny(highest), "at most 9223372036854775807d", right),
    row<Tiny>(atLeast(Huge(lowest)), Tiny(lowest), "at least -9223372036854775808d", right),
    row<std::chrono::duration<std::uint32_t>>(atLeast(-1s), std::chrono::duration<std::uint32_t>(0),
                                              "at least -1s", right),

    row<ByteSize>(between(1_KiB, 16_MiB), 1_KiB, "between 1KiB and 16MiB", right),
    row<ByteSize>(between(1_KiB, 16_MiB), 1_kB, "between 1KiB and 16MiB",
                  "not between 1KiB and 16MiB"),
    row<ByteSize>(atMost(1_GB), 1_GiB, "at most 1GB", "not at most 1GB"),

    row<int>(oneOf({1, 2, 4}), 2, "one of: 1, 2, 4", right),
    row<int>(oneOf({1, 2, 4}), 3, "one of: 1, 2, 4", "not one of: 1, 2, 4"),
    row<unsigned int>(oneOf({-1}), ~0U, "one of: -1", "not one of: -1"),
    row<bool>(oneOf({true}), false, "one of: true", "not one of: true"),
    row<std::string>(oneOf({"red", "green"}), "green", "one of: red, green", right),
    row<std::string>(oneOf({"red", "green"}), "Red", "one of: red, green",
                     "not one of: red, green"),
    row<std::u16string>(oneOf({u"a"}), u"a", "one of: a", right),
    row<std::string>(oneOf(std::vector<std::string>{"a,b"}), "a,b", "one of: \"a,b\"", right),
    row<std::chrono::milliseconds>(oneOf({1s, 2s}), 2000ms, "one of: 1s, 2s", right),
    row<std::chrono::milliseconds>(oneOf({1s, 2s}), 2001ms, "one of: 1s, 2s", "not one of: 1s, 2s"),

    row<std::string>(notEmpty(), "a", "not empty", right),
    row<std::string>(notEmpty(), "", "not empty", "empty"),
    row<std::vector<int>>(notEmpty(), {}, "not empty", "empty"),

    row<int>(matching("even", isEven), 2, "even", right),
    row<std::int64_t>(matching("even", [](auto value) { return value % 2 == 0; }), 3, "even",
                      "not even"),

    row<int>(between(1, 10) && matching("even", isEven), 2, "between 1 and 10, even", right),
    row<int>(between(1, 10) && matching("even", isEven), 3, "between 1 and 10, even", "not even"),
    row<int>(between(1, 10) && matching("even", isEven), 13, "between 1 and 10, even",
             "not between 1 and 10"),
    row<int>(atLeast(1) && atMost(9) && oneOf({3, 5}), 5, "at least 1, at most 9, one of: 3, 5",
             right),

    row<std::vector<int>>(each(atLeast(1)), {1, 2}, "each at least 1", right),
    row<std::vector<int>>(each(atLeast(1)), {1, 0, 0}, "each at least 1",
                          "element 2: not at least 1"),
    row<std::vector<bool>>(each(oneOf({true})), {true, false}, "each one of: true",
                           "element 2: not one of: true"),
    row<std::vector<std::string>>(notEmpty() && each(notEmpty()), {""}, "not empty, each not empty",
                                  "element 1: empty"),

    row<std::optional<int>>(atLeast(1), std::nullopt, "at least 1", right),
    row<std::optional<int>>(atLeast(1), 1, "at least 1", right),
    row<std::optional<int>>(atLeast(1), 0, "at least 1", "not at least 1"),
};

class ConstraintRow : public ::testing::TestWithParam<Row> {};

TEST_P(ConstraintRow, DescribesItself) {
    EXPECT_EQ(GetParam().description, GetParam().expectedDescription);
}

TEST_P(ConstraintRow, RefusesWhatIsNotRight) {
    EXPECT_EQ(GetParam().refusal, GetParam().expectedRefusal);
}

INSTANTIATE_TEST_SUITE_P(Constraint, ConstraintRow, ::testing::ValuesIn(rows));

TEST(Constraint, BetweenRefusesBoundsThatNothingIsBetween) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { between(2, 1); }),
              "No value is between the given bounds.");
}

TEST(Constraint, BetweenComparesItsBoundsByWhatTheyMean) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { between(1U, -1); }),
              "No value is between the given bounds.");
}

TEST(Constraint, PassesOnWhatAPredicateThrows) {
    const Constraint<int> constraint =
        matching("known", [](int) -> bool { throw std::runtime_error("lost"); });
    EXPECT_EQ(thrownText<std::runtime_error>([&] { constraint.check(1); }), "lost");
}

TEST(Constraint, OutlivesTheTextsThatItWasGiven) {
    Constraint<std::string> constraint;
    {
        const std::string text = "a text too long to be kept in place";
        constraint = oneOf({text.c_str()});
    }
    EXPECT_EQ(constraint.check("other")->text, "not one of: a text too long to be kept in place");
}

}  // namespace
}  // namespace velkor::settings::testing
