#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <string>
#include <vector>

#include "framework/common/Mutex.hpp"
#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/transport/Endpoint.hpp"

namespace velkor::http::detail::transport {

class Loop;
struct Shared;

/// Listens, and serves the clients that come with the answers of a handler.
class Listener {
public:
    /// Begins at once. Throws what `Server` says of endpoints, TLS and threads.
    Listener(const ServerOptions& options, std::shared_ptr<Handler> handler,
             std::shared_ptr<TransportCounts> counts);

    /// Stops. Not on a thread of its own.
    ~Listener();

    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    /// As `Server` says.
    const std::vector<Endpoint>& endpoints() const noexcept { return bound; }

    /// Takes no more clients, ends the event streams, waits up to half a second for the answers
    /// that are under way, closes all connections and waits for its threads; on one of these it
    /// doesn't wait, and says so by false. From any thread, also several times.
    bool stop() noexcept;

private:
    Loop& nextLoop() noexcept;

    const std::shared_ptr<Shared> shared;
    std::vector<Endpoint> bound;
    std::list<Loop> loops;
    std::list<Loop>::iterator turn;  // used on the thread of the first loop
    common::Mutex joining;           // held by who waits for the threads; none of them takes it
};

}  // namespace velkor::http::detail::transport
