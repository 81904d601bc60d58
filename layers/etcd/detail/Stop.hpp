#pragma once

#include <chrono>

namespace velkor::layers::etcd {

/// Tells threads that wait for sockets, or pause, that the source ends. Thread-safe.
class Stop {
public:
    using Time = std::chrono::steady_clock::time_point;

    /// Throws `std::system_error` when the system has no descriptor left.
    Stop();
    ~Stop();

    Stop(const Stop&) = delete;
    Stop& operator=(const Stop&) = delete;

    /// From now on everything below throws `Stopped`.
    void request() noexcept;

    void check() const;

    /// Waits until `end`.
    void sleepUntil(Time end) const;

    /// Waits until `descriptor` is ready for `events`, as poll() names them; false at `end`.
    bool await(int socket, short events, Time end) const;

private:
    const int descriptor;
};

}  // namespace velkor::layers::etcd
