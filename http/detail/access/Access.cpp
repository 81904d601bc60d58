#include "http/detail/access/Access.hpp"

#include <algorithm>
#include <array>
#include <string_view>

#include "http/detail/routes/Problem.hpp"

namespace velkor::http::detail {

namespace {

// Those that decide: of two that differ, another program on the way might have looked at the other.
constexpr std::array<std::string_view, 4> singleHeaders{"host", "origin", "authorization",
                                                        "sec-fetch-site"};

void requireSingle(const Request& request) {
    std::array<int, singleHeaders.size()> counts{};
    for (const auto& [name, value] : request.headers) {
        const auto* const found = std::find(singleHeaders.begin(), singleHeaders.end(), name);
        if (found == singleHeaders.end()) continue;
        if (++counts[static_cast<std::size_t>(found - singleHeaders.begin())] > 1) {
            throw Problem(ProblemKind::badRequest,
                          "The header \"" + std::string(name) + "\" was sent twice.");
        }
    }
}

bool isOrigin(std::string_view origin, std::string_view scheme, std::string_view host) {
    return origin.size() == scheme.size() + host.size() &&
           isSameName(origin.substr(0, scheme.size()), scheme) &&
           isSameName(origin.substr(scheme.size()), host);
}

std::string_view bearerToken(std::string_view authorization) {
    constexpr std::string_view scheme = "Bearer ";
    if (!isSameName(authorization.substr(0, scheme.size()), scheme)) return {};
    return authorization.substr(scheme.size());
}

}  // namespace

Access::Access(const ServerOptions& options)
    : allowWrites(options.allowWrites), behindProxy(options.behindProxy), names(options) {
    if (!options.tokenFile.empty()) tokens.emplace(options.tokenFile);
}

void Access::requireOwnName(const Request& request) const {
    requireSingle(request);
    const auto host = request.header("host");
    if (!host) throw Problem(ProblemKind::badRequest, "The header \"host\" is missing.");
    if (!names.contain(*host)) {
        throw Problem(ProblemKind::forbidden, "No name of this server: " + std::string(*host));
    }
    const auto origin = request.header("origin");
    if (!origin) return;
    const bool maybeSecure = request.client.secure || behindProxy;
    const bool isOwn = (maybeSecure && isOrigin(*origin, "https://", *host)) ||
                       (!request.client.secure && isOrigin(*origin, "http://", *host));
    if (!isOwn) {
        throw Problem(ProblemKind::forbidden,
                      "Pages of another origin may not come here: " + std::string(*origin));
    }
}

void Access::requireOwnSite(const Request& request) {
    const auto site = request.header("sec-fetch-site");
    if (!site || *site == "same-origin" || *site == "none") return;
    throw Problem(ProblemKind::forbidden, "Pages of another origin may not come here.");
}

Visitor Access::visitorOf(const Request& request) const {
    Visitor visitor{Right::write, "anybody"};
    if (tokens) {
        const auto authorization = request.header("authorization");
        const auto holder =
            tokens->holderOf(authorization ? bearerToken(*authorization) : std::string_view());
        if (!holder) return {};
        visitor = {holder->right, "token " + std::to_string(holder->number)};
    }
    if (!allowWrites) visitor.right = std::min(visitor.right, Right::read);
    return visitor;
}

void Access::requireRight(const Visitor& visitor, Right needed) const {
    if (needed <= visitor.right) return;
    if (visitor.right == Right::none) {
        throw Problem(ProblemKind::unauthorised, "A token that is known is needed.");
    }
    throw Problem(ProblemKind::forbidden,
                  allowWrites ? "The token may only read." : "Nobody may write here.");
}

}  // namespace velkor::http::detail
