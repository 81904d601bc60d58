#pragma once

#include <gtest/gtest.h>

#include "tests/stress/schedule/Exploration.hpp"

namespace velkor::testing::schedule {

/// Tests that something holds however threads meet.
class Schedules : public ::testing::Test {
protected:
    /// Expects `scenario` to go well with every schedule of `extent`, of the usual one unless
    /// given.
    static void expectAlways(const Scenario& scenario, const Extent& extent = {}) {
        const Findings findings = explore(scenario, extent.orAsAsked());
        EXPECT_EQ(findings.complaint, "");
        RecordProperty("schedules", static_cast<int>(findings.schedules));
    }
};

}  // namespace velkor::testing::schedule
