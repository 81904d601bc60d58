#include "fuzz/Finding.hpp"

#include <cstdlib>
#include <iostream>

namespace velkor::fuzz {

std::string spelled(std::string_view bytes) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    std::string text = "\"";
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
    std::cerr << "\nFINDING: " << what << "\n  expected: " << expected << "\n  actual:   " << actual
              << std::endl;
    std::abort();
}

}  // namespace velkor::fuzz
