#include "layers/etcd/detail/Base64.hpp"

#include <array>
#include <cstddef>
#include <cstdint>

namespace velkor::layers::etcd {

namespace {

constexpr std::string_view alphabet =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
constexpr std::uint32_t none = 64;

constexpr std::array<std::uint8_t, 256> makeDigits() {
    std::array<std::uint8_t, 256> digits{};
    for (auto& digit : digits) digit = none;
    for (std::size_t i = 0; i < alphabet.size(); ++i) {
        digits[static_cast<unsigned char>(alphabet[i])] = static_cast<std::uint8_t>(i);
    }
    return digits;
}

constexpr auto digits = makeDigits();

std::uint32_t digitOf(char character) {
    return digits[static_cast<unsigned char>(character)];
}

std::uint32_t byteAt(std::string_view bytes, std::size_t index) {
    return index < bytes.size() ? static_cast<unsigned char>(bytes[index]) : 0;
}

}  // namespace

std::string toBase64(std::string_view bytes) {
    std::string text;
    text.reserve((bytes.size() + 2) / 3 * 4);
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        const std::uint32_t group =
            byteAt(bytes, i) << 16U | byteAt(bytes, i + 1) << 8U | byteAt(bytes, i + 2);
        text += alphabet[group >> 18U];
        text += alphabet[group >> 12U & 63U];
        text += i + 1 < bytes.size() ? alphabet[group >> 6U & 63U] : '=';
        text += i + 2 < bytes.size() ? alphabet[group & 63U] : '=';
    }
    return text;
}

std::optional<std::string> fromBase64(std::string_view text) {
    if (text.size() % 4 != 0) return std::nullopt;
    std::size_t padding = 0;
    while (padding < 2 && padding < text.size() && text[text.size() - 1 - padding] == '=') {
        ++padding;
    }
    const std::size_t count = text.size() - padding;
    std::string bytes;
    bytes.reserve(text.size() / 4 * 3);
    std::uint32_t group = 0;
    for (std::size_t i = 0; i < count; ++i) {
        const std::uint32_t digit = digitOf(text[i]);
        if (digit == none) return std::nullopt;
        group = (group << 6U | digit) & 0xFFFFFFU;
        if (i % 4 == 1) bytes += static_cast<char>(group >> 4U & 0xFFU);
        if (i % 4 == 2) bytes += static_cast<char>(group >> 2U & 0xFFU);
        if (i % 4 == 3) bytes += static_cast<char>(group & 0xFFU);
    }
    // What is left over of the last digit is zero, so that each text of bytes is the only one.
    const std::uint32_t leftOver = padding == 2 ? group & 0xFU : padding == 1 ? group & 0x3U : 0;
    if (leftOver != 0) return std::nullopt;
    return bytes;
}

}  // namespace velkor::layers::etcd
