#include "host/sources/SourceRequest.hpp"

#include <charconv>
#include <system_error>

namespace velkor::host {

std::optional<int> parseOrder(const std::string& text) {
    int order = 0;
    const char* const end = text.data() + text.size();
    const auto [parsedEnd, error] = std::from_chars(text.data(), end, order);
    if (error != std::errc() || parsedEnd != end) return std::nullopt;
    return order;
}

}  // namespace velkor::host
