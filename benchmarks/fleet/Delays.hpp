#pragma once

#include <cstddef>
#include <vector>

#include "benchmarks/fleet/Promises.hpp"
#include "benchmarks/fleet/WatchProcess.hpp"

namespace velkor::benchmarks {

/// A write that was acknowledged.
struct TakenWrite {
    int key;
    int value;
    FleetClock::time_point sent;
    FleetClock::time_point taken;
};

using TakenWrites = std::vector<TakenWrite>;

/// The writes of all `hosts` that begin in between.
TakenWrites writesBetween(const HostProcesses& hosts, FleetClock::time_point begin,
                          FleetClock::time_point end);

/// How long writes took to be seen, in seconds.
struct Delays {
    std::vector<double> sinceSent{};
    std::vector<double> sinceTaken{};  ///< Less than 0: seen before the writer knew.
    std::size_t unseen = 0;            ///< By a setting: replaced by a later one before.

    void add(const Delays& more);
};

/// What the settings of all processes showed, each those of others.
Delays delaysOfSettings(const HostProcesses& hosts, const TakenWrites& writes);

Delays delaysOf(const std::vector<Seen>& seen, const TakenWrites& writes);

/// The value below which as large a part of them lies; 0 of none.
double quantile(std::vector<double> values, double part);

}  // namespace velkor::benchmarks
