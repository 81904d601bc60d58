#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "benchmarks/fleet/FleetOptions.hpp"
#include "benchmarks/fleet/Journal.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"

namespace velkor::benchmarks {

/// A member that is killed and started again, or frozen and thawed. Times are seconds from the
/// begin.
struct Fault {
    std::size_t member;
    bool isFrozen;
    double begin;
    double end;

    /// "3.2 s: m1 frozen for 1.5 s".
    std::string text() const;
};

/// Faults at random, in the order of their begins: one or two at the same time, of different
/// members. All have ended before `options.seconds`.
std::vector<Fault> planFaults(const FleetOptions& options);

/// Lets the faults happen to `cluster` and waits for as long as there are to be any; throws
/// `Interrupted`.
void injectFaults(testing::EtcdCluster& cluster, const std::vector<Fault>& faults, double seconds);

}  // namespace velkor::benchmarks
