#pragma once

#include <sys/types.h>

#include <string>

#include "http/detail/Descriptor.hpp"
#include "http/detail/transport/Endpoint.hpp"

namespace velkor::http::detail::transport {

/// A client that has come, and where it did.
struct Arrival {
    Descriptor socket;  ///< Doesn't block, and ends with an `exec`.
    Endpoint from;
    bool secure = false;  ///< TLS is to be spoken.
};

/// A socket that listens. The file of a unix socket has mode 0600; it is removed at the end, unless
/// it is another one by then.
class ListeningSocket {
public:
    /// Listens on `wanted`. A unix socket that nobody listens on any more is replaced. Throws
    /// `Refused` with the texts that `Server` says.
    explicit ListeningSocket(const Endpoint& wanted);
    ~ListeningSocket();

    ListeningSocket(const ListeningSocket&) = delete;
    ListeningSocket& operator=(const ListeningSocket&) = delete;

    /// The next client that waits, or the system's error number: EAGAIN when there is none.
    /// Doesn't block.
    int accept(Arrival& arrival) const;

    /// Where it listens, with the port that the system picked.
    const Endpoint& endpoint() const noexcept { return where; }

    int descriptor() const noexcept { return socket.get(); }

private:
    void bindTcp() const;
    void bindUnix();
    [[noreturn]] void refuse(const std::string& reason) const;
    [[noreturn]] void refuse(int error) const;

    Endpoint where;
    Descriptor socket;
    dev_t device = 0;  // of a unix socket's file
    ino_t inode = 0;
};

}  // namespace velkor::http::detail::transport
