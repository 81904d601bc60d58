#include "settings/detail/Numbers.hpp"

#include <array>
#include <charconv>
#include <cmath>
#include <string_view>
#include <system_error>

#include "settings/detail/Text.hpp"

namespace velkor::settings::detail {

namespace {

struct Word {
    std::string_view name;
    bool meaning;
};

constexpr Word truthWords[] = {{"true", true}, {"false", false}, {"on", true}, {"off", false},
                               {"yes", true},  {"no", false},    {"1", true},  {"0", false}};

Converted<bool> truthIn(std::string_view text) {
    for (const Word& word : truthWords) {
        if (sameIgnoringCase(text, word.name)) return word.meaning;
    }
    return Reason{"not one of: true, false, on, off, yes, no, 1, 0"};
}

Converted<Whole> within(WholeRange range, Whole whole) {
    if (!range.has(whole)) return range.missed();
    return whole;
}

Converted<Whole> wholeIn(std::string_view text, WholeRange range) {
    Whole whole;
    whole.negative = !text.empty() && text.front() == '-';
    if (whole.negative) text.remove_prefix(1);
    const char* const end = text.data() + text.size();
    const auto read = std::from_chars(text.data(), end, whole.magnitude);
    if (read.ec == std::errc::invalid_argument || read.ptr != end) {
        return Reason{"not a whole number in plain digits"};
    }
    if (read.ec != std::errc()) return range.missed();
    return within(range, whole);
}

template <class T>
Converted<T> numberIn(std::string_view text, std::string_view typeName) {
    T number{};
    const char* const end = text.data() + text.size();
    const auto read = std::from_chars(text.data(), end, number);
    if (read.ec == std::errc::invalid_argument || read.ptr != end) return Reason{"not a number"};
    if (read.ec != std::errc()) return Reason{"out of the range of " + std::string(typeName)};
    if (!std::isfinite(number)) return Reason{"not a finite number"};
    return number;
}

template <class T>
std::string digitsOf(T number) {
    std::array<char, 64> digits{};
    const T size = std::abs(number);
    const bool isPlain = size == 0 || (size >= T(1e-6) && size < T(1e21));
    char* const end = digits.data() + digits.size();
    const auto written = isPlain
                             ? std::to_chars(digits.data(), end, number, std::chars_format::fixed)
                             : std::to_chars(digits.data(), end, number);
    return std::string(digits.data(), written.ptr);
}

}  // namespace

Reason WholeRange::missed() const {
    const std::string lowest = (belowZero != 0 ? "-" : "") + std::to_string(belowZero);
    return Reason{"not within " + lowest + " to " + std::to_string(highest)};
}

Converted<bool> readBool(const configuration::ConfigurationValue& value) {
    return textOf(value).then([](const std::string& text) { return truthIn(trimmed(text)); });
}

Converted<Whole> readWhole(const configuration::ConfigurationValue& value, WholeRange range) {
    // As their digits are read, without the way there and back.
    if (const int* number = boost::get<int>(&value)) return within(range, Whole::of(*number));
    if (const auto* number = boost::get<unsigned>(&value)) return within(range, Whole::of(*number));
    return textOf(value).then(
        [range](const std::string& text) { return wholeIn(trimmed(text), range); });
}

Converted<double> readDouble(const configuration::ConfigurationValue& value) {
    return textOf(value).then(
        [](const std::string& text) { return numberIn<double>(trimmed(text), "double"); });
}

Converted<float> readFloat(const configuration::ConfigurationValue& value) {
    return textOf(value).then(
        [](const std::string& text) { return numberIn<float>(trimmed(text), "float"); });
}

std::string showNumber(double number) {
    return digitsOf(number);
}

std::string showNumber(float number) {
    return digitsOf(number);
}

std::string nameOfWhole(std::size_t size, bool isSigned) {
    const std::string name = isSigned ? "int" : "uint";
    return size == sizeof(int) ? name : name + std::to_string(size * 8);
}

}  // namespace velkor::settings::detail
