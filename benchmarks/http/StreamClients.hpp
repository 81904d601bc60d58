#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "benchmarks/http/LoadClient.hpp"

namespace velkor::benchmarks {

/// Many clients that each follow the same event stream. Everything on one thread, with epoll.
class StreamClients {
public:
    /// Opens `count` streams at `target` and reads the first event of each.
    StreamClients(std::uint16_t port, std::size_t count, const std::string& target);
    ~StreamClients();

    StreamClients(const StreamClients&) = delete;
    StreamClients& operator=(const StreamClients&) = delete;

    /// Reads until the newest event of each stream holds `text`, no longer than `limit`. Gives
    /// the seconds from `begin` on that it took each stream that got so far.
    std::vector<double> awaitText(const std::string& text, Clock::time_point begin,
                                  std::chrono::seconds limit);

private:
    struct Stream {
        int socket = -1;
        std::string tail;  // what came since the last event that is complete, and this
    };

    int poller;
    std::vector<Stream> streams;
};

}  // namespace velkor::benchmarks
