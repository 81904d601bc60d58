#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <stdexcept>
#include <string>

#include "tests/stress/histories/StoreRound.hpp"

namespace velkor::testing {
namespace {

std::size_t numberFrom(const char* variable, std::size_t otherwise) {
    const char* const text = std::getenv(variable);
    return text == nullptr ? otherwise : std::stoul(text);
}

/// Histories of the store, as many as rounds are wanted, or as fit into the seconds that are.
/// Environment variables say how many, and how large they are; see below.
class StoreHistories : public ::testing::TestWithParam<bool> {
protected:
    // The first exception makes a table of the compiler's library, by an atomic that helgrind takes
    // for a race: it is made before there are threads.
    static void SetUpTestSuite() {
        try {
            throw std::runtime_error("the first one");
        } catch (const std::runtime_error&) {
        }
    }

    static RoundPlan plan(std::size_t round) {
        RoundPlan chosen;
        chosen.threads = numberFrom("VELKOR_HISTORY_THREADS", 4);
        chosen.calls = numberFrom("VELKOR_HISTORY_CALLS", 8);
        chosen.seed = static_cast<unsigned>(numberFrom("VELKOR_HISTORY_SEED", 1) + round);
        chosen.everything = GetParam();
        return chosen;
    }
};

TEST_P(StoreHistories, AreThoseOfOneCallAfterTheOther) {
    const std::size_t rounds = numberFrom("VELKOR_HISTORY_ROUNDS", 100);
    const std::chrono::seconds patience(numberFrom("VELKOR_HISTORY_SECONDS", 0));
    const auto end = std::chrono::steady_clock::now() + patience;
    std::size_t round = 0;
    while (round < rounds || std::chrono::steady_clock::now() < end) {
        StoreSubject subject;
        ASSERT_EQ(StoreRound::complaintOf(subject, plan(round++)), "");
    }
    RecordProperty("rounds", static_cast<int>(round));
}

INSTANTIATE_TEST_SUITE_P(, StoreHistories, ::testing::Values(true, false), [](const auto& chosen) {
    return chosen.param ? "Everything" : "WritesAndTheirWatchers";
});

}  // namespace
}  // namespace velkor::testing
