#pragma once

#include <map>
#include <memory>
#include <vector>

#include "benchmarks/fleet/Faults.hpp"
#include "benchmarks/fleet/FleetOptions.hpp"
#include "benchmarks/fleet/Promises.hpp"
#include "benchmarks/fleet/WatchProcess.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"

namespace velkor::benchmarks {

/// A fleet and its cluster, from their begin to their end. All that it starts ends with it. Its
/// functions are called in their order, and throw `Interrupted`, or `std::runtime_error` when
/// something of it has ended by itself.
class Simulation {
public:
    using Time = FleetClock::time_point;

    /// Starts the members, the processes and, for each member, an `etcdctl watch`; each setting has
    /// been written once then, and all have seen it.
    explicit Simulation(const FleetOptions& options);

    /// Has the writers write, first without faults.
    void run(const std::vector<Fault>& faults);

    /// Waits until all settings have the values that etcd has, a minute at most, and gives what
    /// differs.
    Promise awaitAgreement();

    /// Gives what etcd was told. Needs agreement.
    History history();

    /// Has all processes end by themselves, and gives those that didn't.
    Promise end();

    // What there is to report then.

    double startSeconds = 0;    ///< Until all processes had their first values.
    int readerConnections = 0;  ///< Of one that only reads, at most.
    int writerConnections = 0;
    double processBytes = 0;  ///< Own memory of one process, at most.
    Time quietBegin{};
    Time quietEnd{};
    Time faultsBegin{};
    Time faultsEnd{};

    const HostProcesses& processes() const noexcept { return hosts; }
    const std::vector<std::unique_ptr<WatchProcess>>& watches() const noexcept { return watching; }

private:
    void startProcesses();
    void startWatches();
    void fill();
    void tellAll(char command) const;
    void countConnections();
    std::map<int, int> engineValues();

    const FleetOptions options;
    testing::EtcdCluster cluster;
    HostProcesses hosts;
    std::vector<std::unique_ptr<WatchProcess>> watching;
};

}  // namespace velkor::benchmarks
