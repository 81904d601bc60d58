#pragma once

#include <sys/types.h>

#include <mutex>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "benchmarks/fleet/Journal.hpp"

namespace velkor::benchmarks {

/// A value of a key in etcd, and when it was seen.
struct Seen {
    FleetClock::time_point time;
    int key;  ///< -1: not one of a setting.
    int value;
};

/// The number of a setting, of its key in etcd; -1 when it is none.
int settingOf(std::string_view engineKey);

/// The number in a value as etcd has it; 0 when it is none.
int numberIn(std::string_view engineValue);

/// The engine's own `etcdctl watch` of all keys of the fleet, from its first revision on. Ends with
/// this, and with the process that made it.
class WatchProcess {
public:
    explicit WatchProcess(const std::vector<std::string>& endpoints);
    ~WatchProcess();

    WatchProcess(const WatchProcess&) = delete;
    WatchProcess& operator=(const WatchProcess&) = delete;

    /// What it has printed by now, in the order of revisions.
    std::vector<Seen> seen() const;

private:
    void start(const std::vector<std::string>& endpoints, int output);
    void read();
    void onLine(std::string_view line);

    pid_t process = 0;
    int input = -1;
    int place = 0;  // of a line among the three of a change
    int key = -1;
    mutable std::mutex mutex;
    std::vector<Seen> changes;  // guarded by mutex
    std::thread thread;         // the last member: it uses the others
};

}  // namespace velkor::benchmarks
