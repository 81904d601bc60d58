#pragma once

#include <cstddef>
#include <functional>
#include <stdexcept>
#include <string>

#include "tests/stress/schedule/Scheduler.hpp"

namespace velkor::testing::schedule {

/// Runs threads until all have ended. For one call in each scenario.
using Together = std::function<void(const Bodies&)>;

/// Prepares something, has threads do something with it, and throws if that went wrong. Run again
/// and again: what it does depends on the schedule alone.
using Scenario = std::function<void(const Together& together)>;

/// Which schedules a scenario is run with.
struct Extent {
    std::size_t preemptions = 2;  ///< All in which so many threads at most are held up,
    std::size_t random = 100;     ///< and so many by chance.
    unsigned seed = 1;            ///< Of the first of these; those that follow count on.

    /// This one, or as VELKOR_SCHEDULE_PREEMPTIONS, VELKOR_SCHEDULES and VELKOR_SCHEDULE_SEED say.
    Extent orAsAsked() const;
};

struct Findings {
    std::size_t schedules = 0;  ///< That were run.
    std::string complaint{};    ///< Of the last of them; empty when all was well.
};

/// Runs `scenario` with the schedules of `extent` until one goes wrong. The complaint holds what
/// was thrown, the trace, and the choices, which VELKOR_SCHEDULE repeats. Where nobody can go on,
/// or a signal comes, it is printed and the process ends.
///
/// Begins with the schedule in which nobody is held up, so that what is made on first use is there.
Findings explore(const Scenario& scenario, const Extent& extent);

/// Throws `otherwise` unless it `holds`.
inline void require(bool holds, const std::string& otherwise) {
    if (!holds) throw std::logic_error(otherwise);
}

/// Throws unless the number called `name` is `expected`.
template <class Number, class Expected>
void requireEqual(const Number& actual, const Expected& expected, const std::string& name) {
    require(actual == expected,
            name + ": " + std::to_string(actual) + " instead of " + std::to_string(expected));
}

}  // namespace velkor::testing::schedule
