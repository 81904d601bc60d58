#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "layers/detail/Utf8.hpp"

namespace velkor::http::detail {

/// The bytes that `text` stands for: "%41" for "A"; a plus is a plus. Nothing if a "%" is not
/// followed by two hexadecimal digits.
std::optional<std::string> percentDecoded(std::string_view text);

/// `bytes` in such a text, for a path as for a query: all but letters, digits, "-", ".", "_" and
/// "~" as "%41".
std::string percentEncoded(std::string_view bytes);

using layers::detail::isUtf8;

/// The parameters of a request, names and values decoded, in the order in which they were sent.
using Parameters = std::vector<std::pair<std::string, std::string>>;

/// What a query, the text behind the "?", says. A parameter without "=" is empty. Throws `Problem`
/// of the kind badRequest when a part of it is not percent-encoded right.
Parameters parsedQuery(std::string_view query);

/// The value of `name`; null if it wasn't sent.
const std::string* find(const Parameters& parameters, std::string_view name) noexcept;

/// The number that `name` says: `fallback` if it wasn't sent. Throws `Problem` of the kind
/// badRequest if that is no number between 1 and `most`, in digits.
std::size_t limitOf(const Parameters& parameters, std::string_view name, std::size_t fallback,
                    std::size_t most);

}  // namespace velkor::http::detail
