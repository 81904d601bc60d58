#pragma once

#include <array>
#include <clocale>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>

#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {

/// Sets a C locale with a decimal comma for the whole process while it lives. The locale is
/// generated, since which ones are installed differs from machine to machine.
class ScopedCommaCLocale {
public:
    ScopedCommaCLocale() : file(compiled(), "LC_NUMERIC") {
        ::setenv("LOCPATH", file.parent().parent_path().c_str(), 1);
        const std::string name = file.parent().filename().string();
        const bool isSet = std::setlocale(LC_NUMERIC, name.c_str()) != nullptr;
        ::unsetenv("LOCPATH");
        if (!isSet) throw std::runtime_error("the C library refuses the generated locale");
    }

    ~ScopedCommaCLocale() { std::setlocale(LC_NUMERIC, "C"); }

    ScopedCommaCLocale(const ScopedCommaCLocale&) = delete;
    ScopedCommaCLocale& operator=(const ScopedCommaCLocale&) = delete;

private:
    // A category of numbers as the C library keeps it compiled: a magic number, the count of the
    // items, where each begins, and the items, wide characters as aligned words.
    static std::string compiled() {
        struct Image {
            std::uint32_t magic = 0x20031114;
            std::uint32_t count = 6;
            std::array<std::uint32_t, 6> offsets{40, 42, 44, 32, 36, 47};
            std::uint32_t wideDecimalPoint = ',';
            std::uint32_t wideThousandsSeparator = '.';
            std::array<char, 16> texts{',', '\0', '.', '\0', '\3', '\3', '\0',
                                       'U', 'T',  'F', '-',  '8',  '\0'};
        };
        static_assert(sizeof(Image) == 56);
        const Image image;
        std::string bytes(sizeof image, '\0');
        std::memcpy(bytes.data(), &image, sizeof image);
        return bytes;
    }

    TemporaryFile file;
};

}  // namespace velkor::testing
