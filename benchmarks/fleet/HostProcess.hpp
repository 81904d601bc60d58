#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

#include "benchmarks/fleet/FleetOptions.hpp"
#include "benchmarks/fleet/Journal.hpp"

namespace velkor::benchmarks {

/// A process of the fleet, and what it has noted. Ends with this, and with the process that made
/// it. For a process of one thread: it forks.
///
/// What is asked of it throws `std::runtime_error` when it has ended.
class HostProcess {
public:
    HostProcess(int number, const FleetOptions& options, const std::vector<std::string>& endpoints);
    ~HostProcess();

    HostProcess(const HostProcess&) = delete;
    HostProcess& operator=(const HostProcess&) = delete;

    /// Waits until it has its first values.
    void awaitReady() const;

    /// Has it do something, of `commands`. Several may do it at once: `awaitDone` waits for each.
    void tell(char command) const;
    void awaitDone(char command) const;

    /// The values of all settings.
    std::vector<int> values() const;

    /// Its connections now.
    int connections() const;

    /// Its resident memory, in bytes, without that which is shared.
    double ownBytes() const;

    /// Has it end by itself, and gives whether it did so well.
    bool end();

    const Journal& notes() const noexcept { return journal; }
    int number() const noexcept { return ownNumber; }

private:
    [[noreturn]] void run(const FleetOptions& options, const std::vector<std::string>& endpoints);
    void receive(void* target, std::size_t size) const;
    int await();

    const int ownNumber;
    const std::size_t settings;
    Journal journal;
    int socket = -1;
    int otherSocket = -1;
    pid_t process = 0;
};

}  // namespace velkor::benchmarks
