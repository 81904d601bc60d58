#pragma once

#include <optional>
#include <string>

#include "http/ServerOptions.hpp"
#include "http/detail/Exchange.hpp"
#include "http/detail/access/OwnNames.hpp"
#include "http/detail/access/Right.hpp"
#include "http/detail/access/Tokens.hpp"

namespace velkor::http::detail {

/// Who sends a request.
struct Visitor {
    Right right = Right::none;
    std::string name = "nobody known";  ///< "token 2"; "anybody" where there are no tokens.
};

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

    /// Who sends `request`, and what that may do: nobody writes where writing isn't allowed at all.
    Visitor visitorOf(const Request& request) const;

    /// Lets a visitor pass who has the right `needed`. Throws `Problem`: unauthorised without any
    /// right, otherwise forbidden.
    void requireRight(const Visitor& visitor, Right needed) const;

private:
    const bool allowWrites;
    const bool behindProxy;
    const OwnNames names;
    std::optional<Tokens> tokens;
};

}  // namespace velkor::http::detail
