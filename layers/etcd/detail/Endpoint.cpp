#include "layers/etcd/detail/Endpoint.hpp"

#include <algorithm>
#include <optional>
#include <stdexcept>
#include <string_view>

#include "layers/etcd/EtcdErrors.hpp"

namespace velkor::layers::etcd {

namespace {

constexpr std::string_view usualPort = "2379";

bool takePrefix(std::string_view& rest, std::string_view prefix) {
    if (rest.substr(0, prefix.size()) != prefix) return false;
    rest.remove_prefix(prefix.size());
    return true;
}

bool isPort(std::string_view text) {
    return !text.empty() && text.size() <= 5 &&
           std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; }) &&
           std::stoi(std::string(text)) <= 65535;
}

bool isHost(std::string_view text, bool isBracketed) {
    const auto belongs = [&](char c) {
        const bool isAlphanumeric =
            (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
        return isAlphanumeric || c == '.' || c == '-' || c == '_' || (isBracketed && c == ':');
    };
    return !text.empty() && std::all_of(text.begin(), text.end(), belongs);
}

std::optional<Endpoint> toEndpoint(std::string_view text) {
    Endpoint endpoint;
    if (!text.empty() && text.back() == '/') text.remove_suffix(1);
    endpoint.text = text;
    endpoint.isSecure = takePrefix(text, "https://");
    if (!endpoint.isSecure && !takePrefix(text, "http://")) return std::nullopt;
    const bool isBracketed = takePrefix(text, "[");
    const std::size_t end = std::min(text.size(), text.find(isBracketed ? ']' : ':'));
    endpoint.host = text.substr(0, end);
    text.remove_prefix(end);
    if (isBracketed && !takePrefix(text, "]")) return std::nullopt;
    const bool hasPort = takePrefix(text, ":");
    if (!hasPort && !text.empty()) return std::nullopt;
    endpoint.port = hasPort ? text : usualPort;
    if (!isHost(endpoint.host, isBracketed) || !isPort(endpoint.port)) return std::nullopt;
    return endpoint;
}

}  // namespace

std::vector<Endpoint> toEndpoints(const std::vector<std::string>& texts) {
    if (texts.empty()) throw std::invalid_argument(etcd_errors::noEndpoint);
    std::vector<Endpoint> endpoints;
    endpoints.reserve(texts.size());
    for (const auto& text : texts) {
        auto endpoint = toEndpoint(text);
        // What stands in front of "@" may be a password.
        const std::size_t at = text.rfind('@');
        const auto shown = at == std::string::npos ? text : text.substr(at + 1);
        if (!endpoint) throw std::invalid_argument(etcd_errors::badEndpoint + shown);
        endpoints.push_back(std::move(*endpoint));
    }
    return endpoints;
}

}  // namespace velkor::layers::etcd
