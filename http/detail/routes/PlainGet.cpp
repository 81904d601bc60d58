#include "http/detail/routes/PlainGet.hpp"

#include <algorithm>

namespace velkor::http::detail {

namespace {

bool take(std::string_view& json, std::string_view token) noexcept {
    const auto begin = json.find_first_not_of(" \t\r\n");
    if (begin == std::string_view::npos || json.substr(begin, token.size()) != token) return false;
    json.remove_prefix(begin + token.size());
    return true;
}

bool isPlain(char character) noexcept {
    return character >= ' ' && character <= '~' && character != '"' && character != '\\';
}

}  // namespace

std::optional<std::string_view> keyOfPlainGet(std::string_view json) noexcept {
    if (!take(json, "{") || !take(json, "\"key\"") || !take(json, ":") || !take(json, "\"")) {
        return std::nullopt;
    }
    const auto* const end = std::find_if_not(json.begin(), json.end(), isPlain);
    const std::string_view key = json.substr(0, static_cast<std::size_t>(end - json.begin()));
    json.remove_prefix(key.size());
    if (json.empty() || json.front() != '"') return std::nullopt;
    json.remove_prefix(1);
    if (!take(json, "}") || json.find_first_not_of(" \t\r\n") != std::string_view::npos) {
        return std::nullopt;
    }
    return key;
}

}  // namespace velkor::http::detail
