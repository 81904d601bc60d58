#pragma once

#include <cstdint>

namespace velkor::settings {

/// A size in bytes, which a setting reads with its unit: "16MiB", "2kB".
struct ByteSize {
    std::uint64_t bytes = 0;
};

constexpr bool operator==(ByteSize left, ByteSize right) noexcept {
    return left.bytes == right.bytes;
}

constexpr bool operator!=(ByteSize left, ByteSize right) noexcept {
    return left.bytes != right.bytes;
}

constexpr bool operator<(ByteSize left, ByteSize right) noexcept {
    return left.bytes < right.bytes;
}

/// Sizes in code: `16_MiB`. Use them with `using namespace velkor::settings::literals`.
namespace literals {

constexpr ByteSize operator""_B(unsigned long long count) noexcept {
    return {count};
}

constexpr ByteSize operator""_kB(unsigned long long count) noexcept {
    return {count * 1000};
}

constexpr ByteSize operator""_KiB(unsigned long long count) noexcept {
    return {count * 1024};
}

constexpr ByteSize operator""_MB(unsigned long long count) noexcept {
    return {count * 1000 * 1000};
}

constexpr ByteSize operator""_MiB(unsigned long long count) noexcept {
    return {count * 1024 * 1024};
}

constexpr ByteSize operator""_GB(unsigned long long count) noexcept {
    return {count * 1000 * 1000 * 1000};
}

constexpr ByteSize operator""_GiB(unsigned long long count) noexcept {
    return {count * 1024 * 1024 * 1024};
}

}  // namespace literals

}  // namespace velkor::settings
