#pragma once

#include <stdexcept>

namespace velkor::benchmarks {

/// What is simulated.
struct FleetOptions {
    int processes = 50;
    int settings = 100;  ///< Of each process; all have the same ones.
    int members = 3;
    int writers = 5;      ///< Of the processes, as many write too.
    double rate = 40;     ///< Writes a second, of all writers together.
    double quiet = 10;    ///< Seconds of writing before the first fault.
    double seconds = 60;  ///< Seconds of writing with faults.
    bool hasFaults = true;
    unsigned seed = 0;
};

/// A command line that makes no sense; the text says why.
class BadOptions : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

extern const char* const fleetUsage;

/// Whether the words ask for help only.
bool asksForHelp(int count, char** words);

/// Throws `BadOptions`.
FleetOptions readOptions(int count, char** words);

}  // namespace velkor::benchmarks
