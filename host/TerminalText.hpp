#pragma once

#include <string>
#include <string_view>

namespace velkor::host {

/// Whether line feeds are kept as they are or escaped like every other control character.
enum class LineFeeds { kept, escaped };

/// `text` made safe for a terminal: control characters (U+0000 to U+001F, U+007F to U+009F) and
/// bytes that are not UTF-8 become \t, \r, \n or \xHH, one for each byte; the rest stays.
std::string escapedForTerminal(std::string_view text, LineFeeds lineFeeds);

/// `text` if it has at most `mostBytes` bytes, else its beginning, cut between two characters, and
/// "...".
std::string abbreviated(std::string_view text, std::size_t mostBytes);

/// The number of characters (code points) of the UTF-8 `text`; a stray byte counts as part of the
/// character before it.
std::size_t characterCount(std::string_view text) noexcept;

/// Whether `byte` continues a UTF-8 sequence, that is, no character begins there.
constexpr bool isContinuationByte(char byte) noexcept {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U;
}

}  // namespace velkor::host
