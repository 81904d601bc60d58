#pragma once

#include <string>
#include <string_view>

#include "http/detail/Exchange.hpp"

namespace velkor::http::detail::transport {

/// What a client is told of its connection.
enum class Staying {
    usual,  ///< It stays open, as clients of HTTP/1.1 expect.
    said,   ///< It stays open, which has to be said.
    none    ///< It is closed behind the answer.
};

/// First line and headers of `response`, with the length of its body, up to the empty line.
std::string headOf(const Response& response, Staying staying, std::string_view date);

/// The same of an event stream, which ends with its connection.
std::string streamHead(std::string_view date);

/// The text of a moment, in seconds since 1970, for the header Date.
std::string dateText(long long seconds);

}  // namespace velkor::http::detail::transport
