#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace velkor::http {

/// What a server offers, to whom, and within which limits. The defaults are safe: one port of this
/// machine only, and nobody writes.
struct ServerOptions {
    /// Where to listen: "ADDRESS:PORT", "[ADDRESS]:PORT" for IPv6, "PORT" alone for 127.0.0.1, or
    /// "unix:PATH". Addresses are digits, no names; port 0 lets the system pick one. An address
    /// that other machines can reach needs TLS or `behindProxy`, and a token file besides.
    std::vector<std::string> endpoints{"127.0.0.1:0"};

    /// Threads that read, write and answer; each client stays on one of them. 1 to 64.
    unsigned threads = 1;

    /// Whether the store may be changed at all: otherwise whatever would is forbidden.
    bool allowWrites = false;

    /// A file with the tokens of those who may come; empty: whoever reaches the server may.
    std::string tokenFile;

    /// Certificate chain and private key, in PEM, for TLS on all but unix sockets; empty: no TLS.
    std::string tlsCertificate;
    std::string tlsKey;

    /// Says that TLS ends at a proxy in front of the server.
    bool behindProxy = false;

    /// Names that clients may call the server by, beside its addresses and "localhost".
    std::vector<std::string> names;

    /// The folder below which property files may be added as layers; empty: none may.
    std::string propertyRoot;

    /// Bytes of such a file: larger ones are not taken.
    std::uintmax_t maxPropertyFileBytes = std::uintmax_t{256} << 20U;

    /// Bytes of a request's first line and headers together: more are answered with 431.
    std::size_t maxHeaderBytes = std::size_t{16} << 10U;

    /// Bytes of a request's body: more are answered with 413.
    std::size_t maxBodyBytes = std::size_t{1} << 20U;

    /// Bytes that the large bodies, answers and events (above 16 KiB each) of all clients may take
    /// together until they are read or written: for more, requests are answered with 503, and
    /// events wait. One alone may be larger.
    std::size_t maxBufferedBytes = std::size_t{64} << 20U;

    /// How deep objects and arrays of a body may be nested, and how many there may be of them.
    std::size_t maxJsonDepth = 64;
    std::size_t maxJsonContainers = 65536;

    /// From the first byte of a request to its last, and for the start of TLS: longer is answered
    /// with 408.
    std::chrono::milliseconds requestTimeout{10'000};

    /// For a whole answer to be taken by the client, and for some of an event: otherwise the
    /// connection is closed.
    std::chrono::milliseconds writeTimeout{30'000};

    /// Between two requests of a connection, which is closed then.
    std::chrono::milliseconds idleTimeout{60'000};

    /// The longest that an event stream is silent: a comment is sent then. Also how often it is
    /// looked whether an answer that is waited for has been lost.
    std::chrono::milliseconds commentInterval{15'000};

    /// Open connections in all, and from one address (an IPv6 network of 64 bits counts as one,
    /// as does 127.0.0.0/8; unix sockets do not count): more are answered with 503.
    std::size_t maxConnections = 2'000;
    std::size_t maxConnectionsPerAddress = 1'100;

    /// Open event streams in all: more are answered with 503.
    std::size_t maxStreams = 1'500;
};

}  // namespace velkor::http
