#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace velkor::layers::etcd {

/// Where a member listens.
struct Endpoint {
    std::string host{};  ///< A name, or an address without brackets.
    std::string port{};
    bool isSecure = false;

    /// As it was given, but for a "/" at its end. Holds no password: none is accepted there.
    std::string text{};
};

/// The endpoints of "http://HOST:PORT" or "https://HOST:PORT" each; without a port it is 2379, an
/// IPv6 address stands in brackets. Throws `std::invalid_argument` `etcd_errors::noEndpoint`, or
/// `badEndpoint` with the text that is wrong.
std::vector<Endpoint> toEndpoints(const std::vector<std::string>& texts);

/// Gives the endpoints one after the other, again and again.
class EndpointRound {
public:
    explicit EndpointRound(std::vector<Endpoint> given, std::size_t first)
        : endpoints(std::move(given)), position(first % endpoints.size()) {}

    const Endpoint& current() const { return endpoints[position]; }
    void next() { position = (position + 1) % endpoints.size(); }
    std::size_t count() const { return endpoints.size(); }

private:
    std::vector<Endpoint> endpoints;
    std::size_t position;
};

}  // namespace velkor::layers::etcd
