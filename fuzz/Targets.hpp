#pragma once

#include <string_view>
#include <vector>

namespace velkor::fuzz {

/// One piece of the system that is given any bytes, and compared with a literal model of what is
/// promised of it. Known to the program that it is linked into from before main() on:
///
///     const Target target("properties", [](std::string_view input) { ... });
class Target {
public:
    /// Looks at what the system makes of `input`, and ends the process where it is wrong, see
    /// `Finding.hpp`. Leaves nothing behind: the same input has the same outcome at any time.
    using Check = void (*)(std::string_view input);

    /// Makes the target known. `targetName` is that of its folder of seeds, and a literal.
    Target(std::string_view targetName, Check targetCheck);

    Target(const Target&) = delete;
    Target& operator=(const Target&) = delete;

    std::string_view name() const noexcept { return ownName; }
    void operator()(std::string_view input) const { check(input); }

private:
    const std::string_view ownName;
    const Check check;
};

/// The targets that are linked into this program.
std::vector<const Target*>& targets();

}  // namespace velkor::fuzz
