#include "host/TerminalText.hpp"

#include <algorithm>
#include <array>
#include <cstddef>

namespace velkor::host {

namespace {

// The sequences of well-formed UTF-8: the range of the first byte, the range of the second one and
// the length. What follows the second byte is always any continuation byte.
struct SequenceForm {
    unsigned char firstLow, firstHigh, secondLow, secondHigh;
    std::size_t length;
};

constexpr std::array<SequenceForm, 8> sequenceForms{{
    {0xC2, 0xDF, 0x80, 0xBF, 2},
    {0xE0, 0xE0, 0xA0, 0xBF, 3},
    {0xE1, 0xEC, 0x80, 0xBF, 3},
    {0xED, 0xED, 0x80, 0x9F, 3},
    {0xEE, 0xEF, 0x80, 0xBF, 3},
    {0xF0, 0xF0, 0x90, 0xBF, 4},
    {0xF1, 0xF3, 0x80, 0xBF, 4},
    {0xF4, 0xF4, 0x80, 0x8F, 4},
}};

constexpr unsigned char byteAt(std::string_view text, std::size_t position) {
    return static_cast<unsigned char>(text[position]);
}

bool matches(const SequenceForm& form, std::string_view text) {
    if (text.size() < form.length) return false;
    const unsigned char first = byteAt(text, 0);
    const unsigned char second = byteAt(text, 1);
    return first >= form.firstLow && first <= form.firstHigh && second >= form.secondLow &&
           second <= form.secondHigh &&
           std::all_of(text.begin() + 2, text.begin() + static_cast<std::ptrdiff_t>(form.length),
                       isContinuationByte);
}

// The length of the printable character that `text` begins with; 0 when it begins with a control
// character or with a byte that is no UTF-8.
std::size_t printableLength(std::string_view text) {
    const unsigned char first = byteAt(text, 0);
    if (first < 0x80) return first >= 0x20 && first != 0x7F ? 1 : 0;
    const auto form = std::find_if(sequenceForms.begin(), sequenceForms.end(),
                                   [&](const SequenceForm& each) { return matches(each, text); });
    if (form == sequenceForms.end()) return 0;
    const bool isControl = first == 0xC2 && byteAt(text, 1) < 0xA0;
    return isControl ? 0 : form->length;
}

void appendEscaped(std::string& out, char byte) {
    constexpr const char* digits = "0123456789abcdef";
    if (byte == '\t') {
        out += "\\t";
    } else if (byte == '\r') {
        out += "\\r";
    } else if (byte == '\n') {
        out += "\\n";
    } else {
        const auto code = static_cast<unsigned char>(byte);
        out += {'\\', 'x', digits[code >> 4U], digits[code & 0xFU]};
    }
}

}  // namespace

std::string escapedForTerminal(std::string_view text, LineFeeds lineFeeds) {
    std::string out;
    out.reserve(text.size());
    while (!text.empty()) {
        std::size_t length = printableLength(text);
        if (length == 0 && text.front() == '\n' && lineFeeds == LineFeeds::kept) length = 1;
        if (length == 0) {
            appendEscaped(out, text.front());
            length = 1;
        } else {
            out.append(text, 0, length);
        }
        text.remove_prefix(length);
    }
    return out;
}

std::string abbreviated(std::string_view text, std::size_t mostBytes) {
    if (text.size() <= mostBytes) return std::string(text);
    while (mostBytes > 0 && isContinuationByte(text[mostBytes])) --mostBytes;
    return std::string(text.substr(0, mostBytes)) + "...";
}

std::size_t characterCount(std::string_view text) noexcept {
    return static_cast<std::size_t>(
        std::count_if(text.begin(), text.end(), [](char b) { return !isContinuationByte(b); }));
}

}  // namespace velkor::host
