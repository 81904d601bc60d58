#pragma once

#include <string>
#include <string_view>

namespace velkor::host {

/// Makes one line of an answer coloured. The line has no control characters, and gets none but
/// those that switch colours.
using Paint = std::string (*)(std::string_view line);

/// Paints the value of a line "KEY = VALUE" or "KEY = VALUE (SOURCE)" by its type, and the source.
std::string paintOption(std::string_view line);

/// How the answers of the command with that full name are painted; null when they are not.
Paint paintOf(std::string_view command);

/// Whether the terminal has colours, and the variable NO_COLOR is not set, or empty.
bool terminalHasColours();

}  // namespace velkor::host
