#include "host/console/NearestNames.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

namespace velkor::host {
namespace {

using Names = std::vector<std::string>;

struct TypoCase {
    const char* name;
    std::string typed;
    Names offered;

    friend std::ostream& operator<<(std::ostream& out, const TypoCase& it) {
        return out << it.name;
    }
};

class NearestNamesTest : public ::testing::TestWithParam<TypoCase> {};

TEST_P(NearestNamesTest, OffersWhatWasProbablyMeant) {
    const Names known{"set", "get", "list", "explain", "velkor.configuration.get"};
    EXPECT_EQ(nearestNames(GetParam().typed, known), GetParam().offered);
}

INSTANTIATE_TEST_SUITE_P(
    Typos, NearestNamesTest,
    ::testing::Values(
        TypoCase{"ChangedLetter", "lizt", {"list"}}, TypoCase{"MissingLetter", "lst", {"list"}},
        TypoCase{"AdditionalLetter", "liist", {"list"}},
        TypoCase{"SwappedLetters", "epxlain", {"explain"}},
        TypoCase{"TwoErrorsInALongName", "exlpaim", {"explain"}},
        TypoCase{"Beginning", "ex", {"explain"}}, TypoCase{"SeveralNames", "et", {"set", "get"}},
        TypoCase{"LongName", "velkor.configuratoin.get", {"velkor.configuration.get"}},
        TypoCase{"NothingSimilar", "frobnicate", {}}, TypoCase{"Nothing", "", {}}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(NearestNames, OffersTheMostSimilarFirst) {
    EXPECT_EQ(nearestNames("configure", {"confound", "configura", "configured"}),
              (Names{"configura", "configured"}));
}

TEST(NearestNames, OffersThreeAtMost) {
    EXPECT_EQ(nearestNames("a", {"ab", "ac", "ad", "ae"}), (Names{"ab", "ac", "ad"}));
}

TEST(NearestNames, ComparesNoNamesOfVeryDifferentLength) {
    EXPECT_EQ(nearestNames(std::string(1'000'000, 'g'), {"get"}), Names{});
}

}  // namespace
}  // namespace velkor::host
