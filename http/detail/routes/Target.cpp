#include "http/detail/routes/Target.hpp"

#include <algorithm>
#include <charconv>

#include "http/detail/routes/Problem.hpp"

namespace velkor::http::detail {

namespace {

constexpr std::string_view hexDigits = "0123456789ABCDEF";

int digitOf(char character) {
    if (character >= 'a' && character <= 'f') return character - 'a' + 10;
    const auto position = hexDigits.find(character);
    return position == std::string_view::npos ? -1 : static_cast<int>(position);
}

bool isUnreserved(char character) {
    return (character >= 'a' && character <= 'z') || (character >= 'A' && character <= 'Z') ||
           (character >= '0' && character <= '9') ||
           std::string_view("-._~").find(character) != std::string_view::npos;
}

std::string decodedOrThrow(std::string_view text) {
    auto decoded = percentDecoded(text);
    if (!decoded) {
        throw Problem(ProblemKind::badRequest, "The query is not percent-encoded right.");
    }
    return *std::move(decoded);
}

}  // namespace

std::optional<std::string> percentDecoded(std::string_view text) {
    std::string bytes;
    bytes.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '%') {
            bytes += text[i];
            continue;
        }
        if (text.size() - i < 3) return std::nullopt;
        const int high = digitOf(text[i + 1]);
        const int low = digitOf(text[i + 2]);
        if (high < 0 || low < 0) return std::nullopt;
        bytes += static_cast<char>(high * 16 + low);
        i += 2;
    }
    return bytes;
}

std::string percentEncoded(std::string_view bytes) {
    std::string text;
    text.reserve(bytes.size());
    for (const char byte : bytes) {
        if (isUnreserved(byte)) {
            text += byte;
        } else {
            const auto code = static_cast<unsigned char>(byte);
            text += {'%', hexDigits[code >> 4U], hexDigits[code & 0xFU]};
        }
    }
    return text;
}

Parameters parsedQuery(std::string_view query) {
    Parameters parameters;
    while (!query.empty()) {
        const std::string_view part = query.substr(0, query.find('&'));
        query.remove_prefix(std::min(query.size(), part.size() + 1));
        if (part.empty()) continue;
        const auto nameEnd = std::min(part.find('='), part.size());
        parameters.emplace_back(decodedOrThrow(part.substr(0, nameEnd)),
                                decodedOrThrow(part.substr(std::min(part.size(), nameEnd + 1))));
    }
    return parameters;
}

const std::string* find(const Parameters& parameters, std::string_view name) noexcept {
    const auto found = std::find_if(parameters.begin(), parameters.end(),
                                    [&](const auto& each) { return each.first == name; });
    return found == parameters.end() ? nullptr : &found->second;
}

std::size_t limitOf(const Parameters& parameters, std::string_view name, std::size_t fallback,
                    std::size_t most) {
    const std::string* const text = find(parameters, name);
    if (text == nullptr) return fallback;
    std::size_t number = 0;
    const char* const end = text->data() + text->size();
    const auto [rest, error] = std::from_chars(text->data(), end, number);
    if (error != std::errc() || rest != end || number < 1 || number > most) {
        throw Problem(ProblemKind::badRequest, "\"" + std::string(name) +
                                                   "\" must be a number from 1 to " +
                                                   std::to_string(most) + ".");
    }
    return number;
}

}  // namespace velkor::http::detail
