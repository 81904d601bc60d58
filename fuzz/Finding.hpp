#pragma once

#include <string>
#include <string_view>

namespace velkor::fuzz {

/// `bytes` between quotes, with those that are no printable ASCII as \xNN.
std::string spelled(std::string_view bytes);

/// Ends the process with what is wrong: standard error has `what`, and both sides on a line each.
[[noreturn]] void report(std::string_view what, std::string_view expected, std::string_view actual);

/// As above, unless both sides are equal.
inline void expectSame(std::string_view what, std::string_view expected, std::string_view actual) {
    if (expected != actual) report(what, expected, actual);
}

/// As above, for any bytes, which are spelled when they differ.
inline void expectSameBytes(std::string_view what, std::string_view expected,
                            std::string_view actual) {
    if (expected != actual) report(what, spelled(expected), spelled(actual));
}

/// As above, for what has to be true: `what` says it as a sentence, `about` what it was asked of.
inline void expectThat(bool holds, std::string_view what, std::string_view about = "") {
    if (!holds) report(what, "true", about);
}

}  // namespace velkor::fuzz
