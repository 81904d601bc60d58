#include "host/sources/SourceStates.hpp"

#include <gtest/gtest.h>

#include <chrono>

#include "configuration/sources/InMemorySource.hpp"

namespace velkor::host {
namespace {

using configuration::SourceState;

const SourceState::Time then{std::chrono::seconds(1'000'000'000)};
const SourceState::Time later = then + std::chrono::seconds(1);

TEST(SourceStates, OfASourceThatSaysNothingIsNone) {
    EXPECT_EQ(stateOf(configuration::InMemorySource(configuration::ValueMap())), std::nullopt);
}

TEST(SourceStates, OfAWellSourceHasNoProblem) {
    EXPECT_EQ(problemText({true, then, later, "over", {{"revision", "7"}}}), "");
}

TEST(SourceStates, SaySinceWhenThereIsAProblem) {
    EXPECT_EQ(problemText({false, then, later, "no answer"}),
              "since 2001-09-09T01:46:40Z: no answer");
    EXPECT_EQ(problemText({false, std::nullopt, later, "no answer"}), "no answer");
}

TEST(SourceStates, WithoutDetailsAreNotShown) {
    EXPECT_EQ(standingText({true, then, later, "over"}), "");
}

TEST(SourceStates, ShowDetailsAndHowOldTheValuesMayBe) {
    EXPECT_EQ(standingText({true, then, later, "", {{"endpoint", "http://a"}, {"revision", "7"}}}),
              "since 2001-09-09T01:46:40Z, endpoint http://a, revision 7, "
              "as of 2001-09-09T01:46:41Z");
    EXPECT_EQ(standingText({true, std::nullopt, std::nullopt, "", {{"revision", "7"}}}),
              "revision 7");
}

TEST(SourceStates, OfAWellSourceShowAnErrorThatIsOver) {
    EXPECT_EQ(standingText({true, std::nullopt, std::nullopt, "no answer", {{"revision", "7"}}}),
              "revision 7, last error: no answer");
}

TEST(SourceStates, OfAnIllSourceLeaveToTheProblemWhatIsThere) {
    EXPECT_EQ(standingText({false, then, later, "no answer", {{"revision", "7"}}}),
              "revision 7, as of 2001-09-09T01:46:41Z");
}

}  // namespace
}  // namespace velkor::host
