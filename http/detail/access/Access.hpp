#pragma once

#include <optional>
#include <string>

#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/access/OwnNames.hpp"
#include "http/detail/access/Right.hpp"
#include "http/detail/access/Tokens.hpp"

namespace velkor::http::detail {

/// Decides who may do what. Immutable: safe for concurrent use.
class Access {
public:
    /// Reads the token file of `options`, if one is given; throws as `Tokens` does.
    explicit Access(const ServerOptions& options);

    /// Lets requests pass that call the server by one of its own names and are not sent by a page
    /// of another origin. Throws `Problem`: badRequest where a header that this is about was sent
    /// twice or "Host" is missing, otherwise forbidden.
    void requireOwnName(const Request& request) const;

    /// Lets requests pass that no page of another site makes. Throws `Problem` of the kind
    /// forbidden.
    static void requireOwnSite(const Request& request);

    /// Whether the sender of `request` may write.
    bool mayWrite(const Request& request) const;

    /// Lets requests pass whose sender has the right `needed`, and gives who that is: "token 2",
    /// or "anybody" where there are no tokens. Throws `Problem`: unauthorised without a token that
    /// is known, forbidden if it doesn't give that right, or nobody may write.
    std::string requireRight(const Request& request, Right needed) const;

private:
    std::optional<TokenHolder> holderOf(const Request& request) const;

    const bool allowWrites;
    const bool behindProxy;
    const OwnNames names;
    std::optional<Tokens> tokens;
};

}  // namespace velkor::http::detail
