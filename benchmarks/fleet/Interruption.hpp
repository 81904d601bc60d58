#pragma once

#include <stdexcept>

#include "benchmarks/fleet/Journal.hpp"

namespace velkor::benchmarks {

/// The program was told to end, and ends all that it has started.
class Interrupted : public std::runtime_error {
public:
    Interrupted() : std::runtime_error("interrupted") {}
};

/// What SIGINT, SIGTERM and SIGHUP do here.
class Interruption {
public:
    /// From now on they are noted, and blocking calls return.
    static void note();

    /// They do nothing: somebody else ends this process.
    static void ignore();

    /// Throws `Interrupted` if one has come.
    static void check();

    /// Waits, unless one comes: throws `Interrupted` then.
    static void sleepUntil(FleetClock::time_point end);
};

}  // namespace velkor::benchmarks
