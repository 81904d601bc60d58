#include "http/detail/transport/Endpoint.hpp"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/un.h>

#include <array>
#include <charconv>
#include <cstddef>
#include <cstring>

#include "http/Refused.hpp"

namespace velkor::http::detail::transport {
namespace {

constexpr std::string_view unixPrefix = "unix:";

// The structure of the family, which the address holds.
template <class Address>
Address as(const sockaddr_storage& address) {
    Address result;
    std::memcpy(&result, &address, sizeof result);
    return result;
}

std::optional<std::uint16_t> portIn(std::string_view text) {
    std::uint16_t port = 0;
    const char* const end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, port);
    if (error != std::errc() || stop != end) return std::nullopt;
    return port;
}

}  // namespace

Endpoint::Endpoint(std::string_view text) {
    const bool hasNul = text.find('\0') != std::string_view::npos;
    if (!hasNul && text.substr(0, unixPrefix.size()) == unixPrefix) {
        readPath(text.substr(unixPrefix.size()), text);
    } else if (hasNul || !readAddress(text)) {
        throw Refused("'" + std::string(text) +
                      "' is no address to listen on: give [ADDRESS:]PORT, with ADDRESS in digits, "
                      "or unix:PATH");
    }
}

void Endpoint::readPath(std::string_view path, std::string_view whole) {
    sockaddr_un socket{};
    socket.sun_family = AF_UNIX;
    if (path.empty()) throw Refused("can't listen on " + std::string(whole) + ": no path is given");
    if (path.size() >= sizeof socket.sun_path) {
        throw Refused("can't listen on " + std::string(whole) + ": the path is too long");
    }
    path.copy(socket.sun_path, path.size());
    std::memcpy(&address, &socket, sizeof socket);
    size = sizeof socket;
}

bool Endpoint::readAddress(std::string_view text) {
    const std::size_t colon = text.rfind(':');
    const bool hasAddress = colon != std::string_view::npos;
    const auto port = portIn(hasAddress ? text.substr(colon + 1) : text);
    std::string host(hasAddress ? text.substr(0, colon) : std::string_view("127.0.0.1"));
    if (!port) return false;

    if (host.size() > 2 && host.front() == '[' && host.back() == ']') {
        sockaddr_in6 socket{};
        socket.sin6_family = AF_INET6;
        socket.sin6_port = htons(*port);
        host = host.substr(1, host.size() - 2);
        if (::inet_pton(AF_INET6, host.c_str(), &socket.sin6_addr) != 1) return false;
        std::memcpy(&address, &socket, sizeof socket);
        size = sizeof socket;
        return true;
    }
    sockaddr_in socket{};
    socket.sin_family = AF_INET;
    socket.sin_port = htons(*port);
    if (::inet_pton(AF_INET, host.c_str(), &socket.sin_addr) != 1) return false;
    std::memcpy(&address, &socket, sizeof socket);
    size = sizeof socket;
    return true;
}

std::string Endpoint::text() const {
    if (isUnix()) return std::string(unixPrefix) + path();
    std::array<char, INET6_ADDRSTRLEN> digits{};
    if (family() == AF_INET6) {
        const auto socket = as<sockaddr_in6>(address);
        ::inet_ntop(AF_INET6, &socket.sin6_addr, digits.data(), digits.size());
        return "[" + std::string(digits.data()) + "]:" + std::to_string(port());
    }
    const auto socket = as<sockaddr_in>(address);
    ::inet_ntop(AF_INET, &socket.sin_addr, digits.data(), digits.size());
    return std::string(digits.data()) + ":" + std::to_string(port());
}

std::string Endpoint::clientText() const {
    return isUnix() ? "unix" : text();
}

bool Endpoint::isLocal() const noexcept {
    if (isUnix()) return true;
    if (family() == AF_INET6) {
        const auto socket = as<sockaddr_in6>(address);
        return IN6_IS_ADDR_LOOPBACK(&socket.sin6_addr);
    }
    return (ntohl(as<sockaddr_in>(address).sin_addr.s_addr) >> 24U) == IN_LOOPBACKNET;
}

std::string Endpoint::path() const {
    const auto socket = as<sockaddr_un>(address);
    return {socket.sun_path, ::strnlen(socket.sun_path, sizeof socket.sun_path)};
}

std::uint16_t Endpoint::port() const noexcept {
    if (isUnix()) return 0;
    // Both families have it at the same place.
    return ntohs(as<sockaddr_in>(address).sin_port);
}

std::optional<Endpoint::Origin> Endpoint::origin() const noexcept {
    if (isUnix()) return std::nullopt;
    if (family() == AF_INET) {
        const in_addr_t own = htonl(INADDR_LOOPBACK);
        return Origin(AF_INET, isLocal() ? own : as<sockaddr_in>(address).sin_addr.s_addr);
    }
    const auto socket = as<sockaddr_in6>(address);
    std::uint64_t network = 0;
    std::memcpy(&network, &socket.sin6_addr, sizeof network);
    return Origin(AF_INET6, network);
}

const sockaddr* Endpoint::data() const noexcept {
    return static_cast<const sockaddr*>(static_cast<const void*>(&address));
}

}  // namespace velkor::http::detail::transport
