#pragma once

#include <atomic>
#include <chrono>
#include <filesystem>
#include <memory>
#include <string>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/PowerCutVfs.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {

/// A state file on a simulated disk, and the clock of those who write it. Beside it stands a real
/// folder, where the lock of the one who writes is.
class SimulatedState {
public:
    using Time = std::chrono::system_clock::time_point;

    static constexpr const char* author = "somebody";

    /// Throws as `SqliteSource::open`.
    std::shared_ptr<layers::SqliteSource> open() {
        layers::SqliteOptions options;
        options.author = author;
        options.vfs = vfs.name();
        options.clock = [this] { return now(); };
        return layers::SqliteSource::open(neighbour.parent() / "state.db", options);
    }

    SimulatedDisk& disk() { return vfs.disk(); }

    Time now() const { return Time(std::chrono::seconds(secondsPassed)); }
    void advance(std::chrono::seconds time) { secondsPassed += time.count(); }

private:
    TemporaryFile neighbour{""};
    PowerCutVfs vfs{"simulated-state"};
    std::atomic<std::chrono::seconds::rep> secondsPassed{1'000'000'000};
};

}  // namespace velkor::testing
