#include "layers/files/detail/QuietTime.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <optional>

namespace velkor::layers::detail {
namespace {

using namespace std::chrono_literals;

class QuietTimeTest : public ::testing::Test {
protected:
    // In milliseconds after the beginning, as all times here.
    static QuietTime::TimePoint at(int milliseconds) {
        return QuietTime::TimePoint(std::chrono::milliseconds(milliseconds));
    }

    QuietTime quietTime;
};

TEST_F(QuietTimeTest, NothingIsDueBeforeAChange) {
    EXPECT_EQ(quietTime.due(), std::nullopt);
}

TEST_F(QuietTimeTest, AChangeIsDueWhenItWasQuietForAWhile) {
    quietTime.changed(at(0));

    EXPECT_EQ(quietTime.due(), at(50));
}

TEST_F(QuietTimeTest, ABurstIsDueOnceAfterItsLastChange) {
    for (int time = 0; time <= 300; time += 40) quietTime.changed(at(time));

    EXPECT_EQ(quietTime.due(), at(280 + 50));
}

TEST_F(QuietTimeTest, ABurstWithoutAnEndIsDueOneSecondAfterItsBeginning) {
    for (int time = 0; time < 5000; time += 40) quietTime.changed(at(time));

    EXPECT_EQ(quietTime.due(), at(1000));
}

TEST_F(QuietTimeTest, WritingAloneMakesNothingDue) {
    quietTime.written();

    EXPECT_EQ(quietTime.due(), std::nullopt);
}

TEST_F(QuietTimeTest, WritingPutsOffWhatIsDueForOneSecondInAll) {
    quietTime.changed(at(0));
    quietTime.changed(at(40));
    quietTime.written();
    quietTime.written();

    EXPECT_EQ(quietTime.due(), at(1000));
}

TEST_F(QuietTimeTest, ClosingAfterWritingIsDueSoon) {
    quietTime.changed(at(0));
    quietTime.written();
    quietTime.changed(at(300));

    EXPECT_EQ(quietTime.due(), at(350));
}

TEST_F(QuietTimeTest, AFileThatIsMadeAnewIsNotDueUntilItIsClosed) {
    quietTime.changed(at(0));
    quietTime.begun();
    EXPECT_EQ(quietTime.due(), std::nullopt);

    quietTime.changed(at(100));
    EXPECT_EQ(quietTime.due(), at(150));
}

TEST_F(QuietTimeTest, MakingItAnewAllTheTimeDoesNotPutItOffForEver) {
    for (int time = 0; time < 5000; time += 40) {
        quietTime.begun();
        quietTime.changed(at(time));
    }

    EXPECT_EQ(quietTime.due(), at(1000));
}

TEST_F(QuietTimeTest, AfterReadingABurstBeginsAnew) {
    quietTime.changed(at(0));
    quietTime.reset();
    EXPECT_EQ(quietTime.due(), std::nullopt);

    for (int time = 980; time < 1060; time += 40) quietTime.changed(at(time));
    EXPECT_EQ(quietTime.due(), at(1020 + 50));
}

}  // namespace
}  // namespace velkor::layers::detail
