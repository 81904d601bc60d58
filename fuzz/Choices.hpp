#pragma once

#include <algorithm>
#include <cstddef>
#include <string_view>
#include <vector>

namespace velkor::fuzz {

/// Reads an input as a series of choices, one byte each. Any bytes mean something, and seeds can be
/// written as text: a letter chooses what is done, a digit what it is done with.
class Choices {
public:
    explicit Choices(std::string_view input) : all(input), rest(input) {}

    /// What was read and what is left.
    std::string_view input() const noexcept { return all; }

    bool empty() const noexcept { return rest.empty(); }

    /// One of `letters`: the next byte if it is one of them, else the one that its code falls to.
    char oneOf(std::string_view letters) {
        const char byte = next();
        if (letters.find(byte) != std::string_view::npos) return byte;
        return letters[static_cast<unsigned char>(byte) % letters.size()];
    }

    /// A number below `count`: that of the digit that comes next.
    std::size_t below(std::size_t count) {
        return static_cast<unsigned char>(next() - '0') % count;
    }

    template <class T>
    const T& oneOf(const std::vector<T>& values) {
        return values[below(values.size())];
    }

    bool isOdd() { return below(2) == 1; }

private:
    // At the end of the input everything is the first of what it can be. Blanks are for the eye.
    char next() {
        rest.remove_prefix(std::min(rest.find_first_not_of(' '), rest.size()));
        if (rest.empty()) return '0';
        const char byte = rest.front();
        rest.remove_prefix(1);
        return byte;
    }

    std::string_view all;
    std::string_view rest;
};

}  // namespace velkor::fuzz
