#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace velkor::benchmarks {

using Clock = std::chrono::steady_clock;

/// A socket that is connected to a port of this machine and doesn't block.
int connectTo(std::uint16_t port);

/// Sends the same request over several connections again and again, each time that the answer has
/// come, which has to be of one length. Everything on one thread, with epoll.
class LoadClient {
public:
    LoadClient(std::uint16_t port, std::size_t connections, std::string request);
    ~LoadClient();

    LoadClient(const LoadClient&) = delete;
    LoadClient& operator=(const LoadClient&) = delete;

    struct Result {
        double seconds = 0;
        std::vector<double> latencies;  ///< Of each request, in seconds.
        std::size_t failures = 0;       ///< Connections that ended.
    };

    /// Has `count` requests answered, and calls `meanwhile` now and then. Ends early at `limit`.
    Result run(std::size_t count, std::chrono::seconds limit,
               const std::function<void()>& meanwhile = {});

private:
    struct Connection {
        int socket = -1;
        std::size_t awaited = 0;  // bytes of the answer
        Clock::time_point sent;
    };

    void send(Connection& connection);
    bool receive(Connection& connection);

    const std::string request;
    std::size_t answerLength = 0;
    int poller;
    std::vector<Connection> connections;
};

/// The value below which `share` of them are.
double quantile(std::vector<double> values, double share);

}  // namespace velkor::benchmarks
