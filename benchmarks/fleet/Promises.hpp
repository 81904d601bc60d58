#pragma once

#include <memory>
#include <string>
#include <vector>

#include "benchmarks/fleet/History.hpp"
#include "benchmarks/fleet/HostProcess.hpp"

namespace velkor::benchmarks {

using HostProcesses = std::vector<std::unique_ptr<HostProcess>>;

/// Something that a fleet may rely on, and where it could not.
struct Promise {
    std::string text;
    std::vector<std::string> broken{};
};

/// Compares what the processes, which have ended, have noted with what etcd says.
std::vector<Promise> comparePromises(const HostProcesses& hosts, const History& history);

}  // namespace velkor::benchmarks
