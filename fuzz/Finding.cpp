#include "fuzz/Finding.hpp"

#include <cstdio>
#include <cstdlib>

namespace velkor::fuzz {

std::string spelled(std::string_view bytes) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    std::string text = "\"";
    text.reserve(bytes.size() + 2);
    for (const char byte : bytes) {
        const auto code = static_cast<unsigned char>(byte);
        if (code >= 0x20 && code < 0x7F && byte != '"' && byte != '\\') {
            text += byte;
        } else {
            text += {'\\', 'x', digits[code >> 4U], digits[code & 0xFU]};
        }
    }
    return text + '"';
}

void report(std::string_view what, std::string_view expected, std::string_view actual) {
    const auto print = [](const char* label, std::string_view text) {
        std::fprintf(stderr, "%s%.*s\n", label, static_cast<int>(text.size()), text.data());
    };
    print("\nFINDING: ", what);
    print("  expected: ", expected);
    print("  actual:   ", actual);
    std::abort();
}

}  // namespace velkor::fuzz
