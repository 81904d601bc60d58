#pragma once

#include <sys/socket.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace velkor::http::detail::transport {

/// Where a server listens, or from where a client comes: an address of the system.
class Endpoint {
public:
    /// None yet.
    Endpoint() = default;

    /// Reads "PORT", "ADDRESS:PORT", "[ADDRESS]:PORT" or "unix:PATH". Throws `Refused` with the
    /// texts that `Server` says.
    explicit Endpoint(std::string_view text);

    /// What the system gave.
    Endpoint(const sockaddr_storage& given, socklen_t givenSize) noexcept
        : address(given), size(givenSize) {}

    /// The text that the constructor reads.
    std::string text() const;

    /// Of a client: the text, or "unix", since a client's socket has no name.
    std::string clientText() const;

    /// Whether this machine alone can reach it.
    bool isLocal() const noexcept;

    bool isUnix() const noexcept { return address.ss_family == AF_UNIX; }

    /// The file of a unix socket.
    std::string path() const;

    /// The port; 0 of a unix socket.
    std::uint16_t port() const noexcept;

    /// What counts as one address: an IPv4 address, all of 127.0.0.0/8, an IPv6 network of 64
    /// bits. None of a unix socket.
    using Origin = std::pair<int, std::uint64_t>;
    std::optional<Origin> origin() const noexcept;

    int family() const noexcept { return address.ss_family; }
    const sockaddr* data() const noexcept;
    socklen_t length() const noexcept { return size; }

private:
    void readPath(std::string_view path, std::string_view whole);
    bool readAddress(std::string_view text);

    sockaddr_storage address{};
    socklen_t size = 0;
};

}  // namespace velkor::http::detail::transport
