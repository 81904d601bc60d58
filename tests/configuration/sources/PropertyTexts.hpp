#pragma once

#include <cstddef>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace velkor::testing {

// Texts that are unlike each other in what property files are made of. Every run has the same.

/// Every text of up to five bytes that mean something.
inline std::vector<std::string> everyShortText() {
    constexpr std::string_view alphabet = "k=\\u \t\n#";
    constexpr std::size_t longest = 5;
    std::vector<std::string> texts;
    std::size_t count = 1;
    for (std::size_t length = 0; length <= longest; ++length, count *= alphabet.size()) {
        for (std::size_t number = 0; number < count; ++number) {
            std::string text;
            for (std::size_t rest = number; text.size() < length; rest /= alphabet.size()) {
                text += alphabet[rest % alphabet.size()];
            }
            texts.push_back(text);
        }
    }
    return texts;
}

/// Random bytes that mean something, or nothing, or are no UTF-8.
inline std::vector<std::string> randomTexts() {
    using namespace std::string_view_literals;
    constexpr std::string_view alphabet =
        "kk==:: \t\n\n\r\\\\\\uuuu#!.0014189aAfFdDxX-+z\0\v\f\xC3\xA9\xA0\xFF"sv;
    std::mt19937 random(20240607);  // NOLINT(cert-msc51-cpp)
    std::vector<std::string> texts(20000);
    for (std::string& text : texts) {
        text.resize(random() % 41);
        for (char& byte : text) byte = alphabet[random() % alphabet.size()];
    }
    return texts;
}

/// Random digits, and what is none, behind `\u`.
inline std::vector<std::string> randomEscapes() {
    constexpr std::string_view alphabet = "0123456789abcdefABCDEFxX+- \tgz";
    std::mt19937 random(7);  // NOLINT(cert-msc51-cpp)
    std::vector<std::string> texts(3000);
    for (std::string& text : texts) {
        text = "k=";
        for (int escape = 0; escape < 4; ++escape) {
            text += "\\u";
            const std::size_t digits = random() % 6;
            for (std::size_t i = 0; i < digits; ++i) text += alphabet[random() % alphabet.size()];
        }
    }
    return texts;
}

}  // namespace velkor::testing
