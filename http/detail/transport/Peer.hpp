#pragma once

#include <chrono>

namespace velkor::http::detail::transport {

/// A connection as its loop sees it. Used on the loop's thread only.
class Peer {
public:
    using Clock = std::chrono::steady_clock;

    virtual ~Peer() = default;

    /// Starts; called once.
    virtual void begin() noexcept = 0;

    /// Called some time after `dueTime`, by which something was to have happened.
    virtual void expire() noexcept = 0;

    /// The server stops: ends at once, or behind the answer that is under way.
    virtual void stop() noexcept = 0;

    /// Ends at once, whatever is under way.
    virtual void end() noexcept = 0;

    Clock::time_point dueTime() const noexcept { return due; }

protected:
    void expireAfter(std::chrono::milliseconds time) noexcept { due = Clock::now() + time; }

private:
    Clock::time_point due = Clock::time_point::max();
};

}  // namespace velkor::http::detail::transport
