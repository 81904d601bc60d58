#pragma once

#include <netdb.h>

#include <chrono>

#include "layers/etcd/detail/Stop.hpp"

namespace velkor::layers::etcd {

/// A socket that is connected to the first of `addresses`, a chain of at least one, that takes the
/// connection. One is tried after the other; one that doesn't answer takes its share of the time
/// until `deadline` only. The caller closes the socket.
///
/// Throws `Unreachable` with the reason of the last address, and `Stopped`.
int connectToOne(const addrinfo& addresses, const Stop& stop,
                 std::chrono::steady_clock::time_point deadline);

}  // namespace velkor::layers::etcd
