#pragma once

#include <sys/types.h>

#include <cstdint>
#include <functional>
#include <string>

namespace velkor::benchmarks {

/// A server in a process of its own, so that its memory and its time are its own.
class ServerProcess {
public:
    /// Runs `serve` in the process, which tells its port by the first function that it is given
    /// and serves until the second one returns.
    using Serve = std::function<void(const std::function<void(std::uint16_t)>& tellPort,
                                     const std::function<void()>& awaitEnd)>;
    explicit ServerProcess(const Serve& serve);

    /// Ends the process.
    ~ServerProcess();

    ServerProcess(const ServerProcess&) = delete;
    ServerProcess& operator=(const ServerProcess&) = delete;

    std::uint16_t port() const noexcept { return toldPort; }

    /// Its memory that is resident, in bytes.
    double residentBytes() const;

    /// The processor time that it has used, in seconds.
    double processorSeconds() const;

private:
    pid_t process = -1;
    int lifeLine = -1;  // closed: the server ends
    std::uint16_t toldPort = 0;
};

/// Serves a small store, writes allowed.
void serveStore(const std::function<void(std::uint16_t)>& tellPort,
                const std::function<void()>& awaitEnd);

/// Answers each request with `body`, by Boost.Beast as its examples do it, on one thread.
void serveConstant(const std::string& body, const std::function<void(std::uint16_t)>& tellPort,
                   const std::function<void()>& awaitEnd);

}  // namespace velkor::benchmarks
