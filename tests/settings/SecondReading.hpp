#pragma once

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <iterator>
#include <optional>
#include <regex>
#include <string>
#include <vector>

namespace velkor::settings::testing {

/// A natural number of any size, digit by digit from the last to the first.
class Natural {
public:
    explicit Natural(const std::string& text) : digits(text.rbegin(), text.rend()) { strip(); }

    void multiplyBy(int factor) {
        int carry = 0;
        for (char& digit : digits) {
            const int product = (digit - '0') * factor + carry;
            digit = static_cast<char>('0' + product % 10);
            carry = product / 10;
        }
        for (; carry > 0; carry /= 10) digits += static_cast<char>('0' + carry % 10);
    }

    /// Whether the division leaves nothing.
    bool divideBy(int divisor) {
        int rest = 0;
        for (auto digit = digits.rbegin(); digit != digits.rend(); ++digit) {
            const int dividend = rest * 10 + (*digit - '0');
            *digit = static_cast<char>('0' + dividend / divisor);
            rest = dividend % divisor;
        }
        strip();
        return rest == 0;
    }

    void add(Natural other) {
        digits.resize(std::max(digits.size(), other.digits.size()) + 1, '0');
        other.digits.resize(digits.size(), '0');
        int carry = 0;
        for (std::size_t i = 0; i < digits.size(); ++i) {
            const int sum = digits[i] - '0' + other.digits[i] - '0' + carry;
            digits[i] = static_cast<char>('0' + sum % 10);
            carry = sum / 10;
        }
        strip();
    }

    bool isAtMost(const std::string& limit) const {
        const std::string text = toText();
        return text.size() != limit.size() ? text.size() < limit.size() : text <= limit;
    }

    std::string toText() const { return std::string(digits.rbegin(), digits.rend()); }

private:
    void strip() {
        while (digits.size() > 1 && digits.back() == '0') digits.pop_back();
    }

    std::string digits;
};

/// What is between the least and the greatest integer of a type, as they are written.
struct Limits {
    std::string belowZero;
    std::string highest;
};

inline std::string secondSigned(bool negative, const Natural& size, const Limits& limits) {
    if (!size.isAtMost(negative ? limits.belowZero : limits.highest)) return "!";
    return (negative && size.toText() != "0" ? "-" : "") + size.toText();
}

/// An integer, spelled, or "!".
inline std::string secondWhole(const std::string& text, const Limits& limits) {
    static const std::regex form("[ \t\n\v\f\r]*(-?)([0-9]+)[ \t\n\v\f\r]*");
    std::smatch parts;
    if (!std::regex_match(text, parts, form)) return "!";
    return secondSigned(parts.length(1) == 1, Natural(parts.str(2)), limits);
}

inline std::string secondTruth(const std::string& text) {
    static const std::regex yes("[ \t\n\v\f\r]*(true|on|yes|1)[ \t\n\v\f\r]*",
                                std::regex::ECMAScript | std::regex::icase);
    static const std::regex no("[ \t\n\v\f\r]*(false|off|no|0)[ \t\n\v\f\r]*",
                               std::regex::ECMAScript | std::regex::icase);
    if (std::regex_match(text, yes)) return "true";
    return std::regex_match(text, no) ? "false" : "!";
}

/// A number by the C library, whose locale must be "C".
inline std::optional<double> secondNumber(const std::string& text) {
    static const std::regex form(
        "[ \t\n\v\f\r]*(-?(?:([0-9]+)\\.?([0-9]*)|\\.([0-9]+))(?:[eE][-+]?[0-9]+)?)"
        "[ \t\n\v\f\r]*");
    std::smatch parts;
    if (!std::regex_match(text, parts, form)) return std::nullopt;
    const double number = std::strtod(parts.str(1).c_str(), nullptr);
    const std::string digits = parts.str(2) + parts.str(3) + parts.str(4);
    const bool vanished = number == 0 && digits.find_first_not_of('0') != std::string::npos;
    if (vanished || !std::isfinite(number)) return std::nullopt;
    return number;
}

/// A unit by the factors that lead from it to the ticks of a type.
struct SecondUnit {
    std::string name;
    std::vector<int> multiply;
    std::vector<int> divide;
};

struct SecondUnits {
    std::vector<SecondUnit> units;  ///< From small to large; those of one size behind each other.
    std::string bare;               ///< The unit of numbers without one.
    bool isSummed;
    Limits limits;
};

inline bool haveSameSize(const SecondUnit& left, const SecondUnit& right) {
    return left.multiply == right.multiply && left.divide == right.divide;
}

/// The ticks of a quantity, spelled, or "!".
inline std::string secondQuantity(const std::string& text, const SecondUnits& kind) {
    static const std::regex whole(
        "[ \t\n\v\f\r]*(-?)("
        "(?:[0-9]+(?:\\.[0-9]+)?[ \t\n\v\f\r]*[^-+0-9., \t\n\v\f\r]+[ \t\n\v\f\r]*)*"
        "(?:[0-9]+(?:\\.[0-9]+)?[ \t\n\v\f\r]*)?)");
    static const std::regex each(
        "([0-9]+)(?:\\.([0-9]+))?[ \t\n\v\f\r]*([^-+0-9., \t\n\v\f\r]*)[ \t\n\v\f\r]*");
    std::smatch outer;
    if (!std::regex_match(text, outer, whole)) return "!";
    const std::string body = outer.str(2);
    Natural sum("0");
    std::size_t smallest = kind.units.size();
    const auto begin = std::sregex_iterator(body.begin(), body.end(), each);
    const auto count = std::distance(begin, std::sregex_iterator());
    if (count == 0) return "!";
    if (count > 1 && !kind.isSummed) return "!";
    for (auto part = begin; part != std::sregex_iterator(); ++part) {
        std::string name = (*part)[3];
        std::string fraction = (*part)[2];
        const std::string digits = (*part)[1].str() + fraction;
        const bool isZero = digits.find_first_not_of('0') == std::string::npos;
        if (name.empty() && count == 1) name = isZero ? kind.units[0].name : kind.bare;
        std::size_t index = 0;
        while (index < kind.units.size() && kind.units[index].name != name) ++index;
        if (index == kind.units.size() || index >= smallest) return "!";
        const SecondUnit& unit = kind.units[index];
        if (smallest < kind.units.size() && haveSameSize(unit, kind.units[smallest])) return "!";
        smallest = index;
        Natural ticks(digits);
        for (const int factor : unit.multiply) ticks.multiplyBy(factor);
        for (const int divisor : unit.divide) {
            if (!ticks.divideBy(divisor)) return "!";
        }
        for (std::size_t i = 0; i < fraction.size(); ++i) {
            if (!ticks.divideBy(10)) return "!";
        }
        sum.add(ticks);
    }
    return secondSigned(outer.length(1) == 1, sum, kind.limits);
}

/// The elements of a list, one character after the other.
inline std::optional<std::vector<std::string>> secondList(const std::string& text) {
    enum class At { start, plain, quoted, escape, behind } at = At::start;
    const std::string blanks = " \t\n\v\f\r";
    if (text.find_first_not_of(blanks) == std::string::npos) return std::vector<std::string>();
    std::vector<std::string> elements(1);
    for (const char c : text + ",") {
        const bool isBlank = blanks.find(c) != std::string::npos;
        std::string& element = elements.back();
        if (at == At::escape) {
            if (c != '"' && c != '\\') return std::nullopt;
            element += c;
            at = At::quoted;
        } else if (at == At::quoted) {
            if (c == '\\') at = At::escape;
            if (c == '"') at = At::behind;
            if (at == At::quoted) element += c;
        } else if (c == ',') {
            if (at == At::start) return std::nullopt;
            const auto last = element.find_last_not_of(blanks);
            if (at == At::plain) element.resize(last + 1);
            elements.emplace_back();
            at = At::start;
        } else if (at == At::start && !isBlank) {
            at = c == '"' ? At::quoted : At::plain;
            if (at == At::plain) element += c;
        } else if (at == At::plain) {
            element += c;
        } else if (at == At::behind && !isBlank) {
            return std::nullopt;
        }
    }
    if (at != At::start) return std::nullopt;
    elements.pop_back();
    return elements;
}

/// Whether `text` is UTF-8: each character in the shortest form, none a surrogate or above
/// U+10FFFF.
inline bool isUtf8(const std::string& text) {
    const unsigned least[] = {0, 0, 0x80, 0x800, 0x10000};
    for (auto next = text.begin(); next != text.end();) {
        const unsigned lead = static_cast<unsigned char>(*next++);
        const unsigned ones = lead < 0x80   ? 0
                              : lead < 0xC0 ? 1
                              : lead < 0xE0 ? 2
                              : lead < 0xF0 ? 3
                              : lead < 0xF8 ? 4
                                            : 5;
        if (ones == 1 || ones == 5) return false;
        unsigned character = lead & (0xFFU >> (ones + 1));
        for (unsigned rest = 1; rest < ones; ++rest) {
            if (next == text.end() || (static_cast<unsigned char>(*next) & 0xC0) != 0x80) {
                return false;
            }
            character = character << 6 | (static_cast<unsigned char>(*next++) & 0x3F);
        }
        const bool isSurrogate = character >= 0xD800 && character < 0xE000;
        if (character < least[ones] || character > 0x10FFFF || isSurrogate) return false;
    }
    return true;
}

}  // namespace velkor::settings::testing
