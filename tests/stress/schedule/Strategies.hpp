#pragma once

#include <cstddef>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "tests/stress/schedule/Scheduler.hpp"

namespace velkor::testing::schedule {

/// One after the other all schedules in which at most so many times a thread is held up that could
/// go on.
class FewPreemptions final : public Strategy {
public:
    explicit FewPreemptions(std::size_t atMost) : most(atMost) {}

    std::size_t choose(const std::vector<std::size_t>& able, std::size_t current) override;

    /// Goes on to the next schedule; false when that was the last one.
    bool advance();

private:
    struct Decision {
        std::vector<std::size_t> options;
        std::size_t taken = 0;
    };

    const std::size_t most;
    std::vector<Decision> path;  // those that left a choice
    std::size_t depth = 0;
    std::size_t preemptions = 0;
};

/// A schedule by chance: each thread has a rank, the highest one that can go on does, and at some
/// steps the one that has come there falls behind all others.
class RandomRanks final : public Strategy {
public:
    /// With numbers by `seed` only. Schedules have about `steps` points.
    RandomRanks(unsigned seed, std::size_t steps);

    std::size_t choose(const std::vector<std::size_t>& able, std::size_t current) override;

private:
    int& rankOf(std::size_t thread);

    std::mt19937 random;
    std::vector<std::size_t> changes;  // the steps at which a rank is lost
    std::vector<int> ranks;            // of the threads that have been seen
    std::size_t step = 0;
    int lowest = 0;
};

/// The schedule with these choices, a digit for each.
class Repetition final : public Strategy {
public:
    explicit Repetition(std::string choices) : wanted(std::move(choices)) {}

    std::size_t choose(const std::vector<std::size_t>& able, std::size_t current) override;

private:
    const std::string wanted;
    std::size_t step = 0;
};

}  // namespace velkor::testing::schedule
