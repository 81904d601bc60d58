#pragma once

#include <string>
#include <string_view>

#include "http/detail/Exchange.hpp"

namespace velkor::fuzz::http {

using velkor::http::detail::Request;

/// The token that may read, and the one that may write.
inline constexpr const char* readToken = "r";
inline constexpr const char* writeToken = "w";

/// The request that `line` says in few bytes: "MARKS TARGET BODY". The last of the marks is the
/// method, the others are headers, in their order:
///
///     G GET  P POST  A PATCH  H HEAD  O OPTIONS  D DELETE
///     r w u b  "Authorization" with the token that reads, that writes, an unknown one, another way
///     h f a p  "Host" is missing, foreign, an address of the machine, with a port; otherwise it is
///              "localhost"
///     o i e    "Origin" of the server itself, the same by TLS, foreign
///     s c      "Sec-Fetch-Site" of the server itself, foreign
///     t        the request came through TLS
///
/// Another method is GET, any other mark says nothing.
Request readRequest(std::string_view line);

}  // namespace velkor::fuzz::http
