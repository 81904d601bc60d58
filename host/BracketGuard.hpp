#pragma once

#include <string>

namespace velkor::host {

// The parsing library of the command line takes a text in brackets for a list. A byte in front that
// no argument can hold keeps it from looking so.
inline constexpr char bracketGuard = '\0';

/// `argument` for the parsing library.
inline std::string guarded(const std::string& argument) {
    return !argument.empty() && argument.front() == '[' ? bracketGuard + argument : argument;
}

/// The argument that the parsing library has given as `text`.
inline std::string unguarded(const std::string& text) {
    return !text.empty() && text.front() == bracketGuard ? text.substr(1) : text;
}

}  // namespace velkor::host
