#include "http/detail/access/OwnNames.hpp"

#include <algorithm>
#include <array>
#include <optional>

#include <arpa/inet.h>

namespace velkor::http::detail {

namespace {

constexpr std::string_view unixPrefix = "unix:";

char lower(char character) {
    return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a')
                                                : character;
}

bool isDigit(char character) {
    return character >= '0' && character <= '9';
}

// What stands before the port of "name:80" and "[::1]:80"; nothing if what follows is no port.
std::optional<std::string_view> nameIn(std::string_view host) {
    const auto bracket = host.find(']');
    const auto end = host.empty() || host.front() != '[' ? std::min(host.find(':'), host.size())
                     : bracket == std::string_view::npos ? host.size()
                                                         : bracket + 1;
    const std::string_view port = host.substr(end);
    const bool isPort =
        port.empty() || (port.front() == ':' && std::all_of(port.begin() + 1, port.end(), isDigit));
    return isPort ? std::optional(host.substr(0, end)) : std::nullopt;
}

// The only way to write the address that `name` is; empty if it is none.
std::string canonicalAddress(std::string_view name) {
    std::array<unsigned char, sizeof(in6_addr)> address{};
    std::array<char, INET6_ADDRSTRLEN> text{};
    const bool isV6 = name.size() > 2 && name.front() == '[' && name.back() == ']';
    const int family = isV6 ? AF_INET6 : AF_INET;
    const std::string digits(isV6 ? name.substr(1, name.size() - 2) : name);
    if (::inet_pton(family, digits.c_str(), address.data()) != 1) return {};
    ::inet_ntop(family, address.data(), text.data(), text.size());
    return isV6 ? "[" + std::string(text.data()) + "]" : text.data();
}

}  // namespace

bool isSameName(std::string_view left, std::string_view right) noexcept {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](char a, char b) { return lower(a) == lower(b); });
}

OwnNames::OwnNames(const ServerOptions& options) : names{"127.0.0.1", "localhost", "[::1]"} {
    names.insert(names.end(), options.names.begin(), options.names.end());
    for (const std::string_view endpoint : options.endpoints) {
        if (endpoint.substr(0, unixPrefix.size()) == unixPrefix) continue;
        const auto name = nameIn(endpoint);
        const std::string address = name ? canonicalAddress(*name) : std::string();
        if (address == "0.0.0.0" || address == "[::]") anyAddress = true;
        if (!address.empty()) names.push_back(address);
    }
}

bool OwnNames::contain(std::string_view host) const {
    const auto name = nameIn(host);
    if (!name) return false;
    const auto isOwn = [&](std::string_view called) {
        return std::any_of(names.begin(), names.end(),
                           [&](const std::string& each) { return isSameName(each, called); });
    };
    if (isOwn(*name)) return true;
    const std::string address = canonicalAddress(*name);
    return !address.empty() && (anyAddress || isOwn(address));
}

}  // namespace velkor::http::detail
