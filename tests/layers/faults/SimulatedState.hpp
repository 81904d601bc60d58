#pragma once

#include <cstddef>
#include <memory>
#include <string>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/PowerCutVfs.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::testing {

/// A state file on a simulated disk, and the clock of those who write it. Beside it stands a real
/// folder, where the lock of the one who writes is.
class SimulatedState {
public:
    static constexpr const char* author = "somebody";

    /// Throws as `SqliteSource::open`.
    std::shared_ptr<layers::SqliteSource> open(std::size_t keepCount = 10'000) {
        SqliteOptions options;
        options.keepCount = keepCount;
        options.author = author;
        options.vfs = vfs.name();
        options.clock = clock.function();
        return layers::SqliteSource::open(folder.file(), options);
    }

    HandClock clock;

    SimulatedDisk& disk() { return vfs.disk(); }

private:
    StateFolder folder;
    PowerCutVfs vfs{"simulated-state"};
};

}  // namespace velkor::testing
