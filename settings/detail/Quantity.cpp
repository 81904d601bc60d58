#include "settings/detail/Quantity.hpp"

#include <algorithm>
#include <array>
#include <charconv>
#include <iterator>
#include <limits>
#include <optional>
#include <system_error>
#include <variant>

#include "settings/detail/QuantityText.hpp"
#include "settings/detail/Text.hpp"
#include "settings/detail/Wide.hpp"

namespace velkor::settings::detail {

namespace {

constexpr std::uint64_t kibi = 1024;
constexpr std::uint64_t kilo = 1000;

constexpr Unit durationUnits[] = {
    {"d", {86400, 1}, "days"},
    {"h", {3600, 1}, "hours"},
    {"min", {60, 1}, "minutes"},
    {"m", {60, 1}, ""},
    {"s", {1, 1}, "seconds"},
    {"ms", {1, 1000}, "milliseconds"},
    {"us", {1, 1000000}, "microseconds"},
    {"\u00B5s", {1, 1000000}, ""},  // the micro sign
    {"\u03BCs", {1, 1000000}, ""},  // the Greek letter
    {"ns", {1, 1000000000}, "nanoseconds"},
};

constexpr Unit sizeUnits[] = {
    {"EiB", {kibi * kibi * kibi * kibi * kibi * kibi, 1}, "exbibytes"},
    {"EB", {kilo * kilo * kilo * kilo * kilo * kilo, 1}, "exabytes"},
    {"PiB", {kibi * kibi * kibi * kibi * kibi, 1}, "pebibytes"},
    {"PB", {kilo * kilo * kilo * kilo * kilo, 1}, "petabytes"},
    {"TiB", {kibi * kibi * kibi * kibi, 1}, "tebibytes"},
    {"TB", {kilo * kilo * kilo * kilo, 1}, "terabytes"},
    {"GiB", {kibi * kibi * kibi, 1}, "gibibytes"},
    {"GB", {kilo * kilo * kilo, 1}, "gigabytes"},
    {"MiB", {kibi * kibi, 1}, "mebibytes"},
    {"MB", {kilo * kilo, 1}, "megabytes"},
    {"KiB", {kibi, 1}, "kibibytes"},
    {"kB", {kilo, 1}, "kilobytes"},
    {"B", {1, 1}, "bytes"},
};

constexpr UnitTable durations{std::begin(durationUnits), std::end(durationUnits), "", true};
constexpr UnitTable sizes{std::begin(sizeUnits), std::end(sizeUnits), "B", false};

enum class Misfit { notWhole, tooLarge };
using Ticks = std::variant<Wide, Misfit>;

// The digits, those behind the point without zeros at their end, as one integer.
std::optional<Wide> mantissaOf(std::string_view whole, std::string_view fraction) {
    Wide mantissa = 0;
    for (const std::string_view digits : {whole, fraction}) {
        for (const char digit : digits) {
            const std::optional<Wide> shifted = product(mantissa, 10);
            const auto unit = static_cast<Wide>(digit - '0');
            if (!shifted || __builtin_add_overflow(*shifted, unit, &mantissa)) return std::nullopt;
        }
    }
    return mantissa;
}

Ticks ticksOf(const QuantityPart& part, Ratio tick) {
    std::string_view fraction = part.fraction;
    while (!fraction.empty() && fraction.back() == '0') fraction.remove_suffix(1);
    std::optional<Wide> mantissa = mantissaOf(part.whole, fraction);
    if (!mantissa) return fraction.empty() ? Misfit::tooLarge : Misfit::notWhole;

    auto [numerator, denominator] = WideRatio::between(part.unit, tick);
    for (std::size_t i = 0; i < fraction.size(); ++i) {
        const Wide common = greatestDivisor(numerator, 10);
        numerator /= common;
        const std::optional<Wide> larger = product(denominator, 10 / common);
        if (!larger) return Misfit::notWhole;
        denominator = *larger;
    }
    if (*mantissa % denominator != 0) return Misfit::notWhole;
    const std::optional<Wide> ticks = product(*mantissa / denominator, numerator);
    if (!ticks) return Misfit::tooLarge;
    return *ticks;
}

Converted<Whole> exactly(const QuantityText& quantity, const Measure& measure, WholeRange range) {
    const Reason missed{range.missed().text + " " + tickName(measure)};
    Wide sum = 0;
    for (const QuantityPart& part : quantity.parts) {
        const Ticks ticks = ticksOf(part, measure.tick);
        const Misfit* const misfit = std::get_if<Misfit>(&ticks);
        if (misfit && *misfit == Misfit::tooLarge) return missed;
        if (misfit) return Reason{"not a whole number of " + tickName(measure)};
        if (__builtin_add_overflow(sum, std::get<Wide>(ticks), &sum)) return missed;
    }
    if (sum > std::numeric_limits<std::uint64_t>::max()) return missed;
    const Whole whole{quantity.negative, static_cast<std::uint64_t>(sum)};
    if (!range.has(whole)) return missed;
    return whole;
}

Converted<double> rounded(const QuantityText& quantity, const Measure& measure, double highest) {
    double sum = 0;
    for (const QuantityPart& part : quantity.parts) {
        const std::string_view number = part.number();
        double count = 0;
        const auto read = std::from_chars(number.data(), number.data() + number.size(), count);
        if (read.ec != std::errc()) return Reason{"out of range"};
        const WideRatio unit = WideRatio::between(part.unit, measure.tick);
        sum += count * static_cast<double>(unit.numerator) / static_cast<double>(unit.denominator);
    }
    if (!(sum <= highest)) return Reason{"out of range"};
    return quantity.negative ? -sum : sum;
}

std::string decimal(Wide number) {
    std::string text;
    do {
        text += static_cast<char>('0' + static_cast<int>(number % 10));
        number /= 10;
    } while (number != 0);
    std::reverse(text.begin(), text.end());
    return text;
}

// `magnitude` ticks in the largest unit of which it is a whole number.
std::string inLargestUnit(std::uint64_t magnitude, const Measure& measure) {
    for (const Unit* unit = measure.units.begin; unit != measure.units.end; ++unit) {
        const auto [numerator, denominator] = WideRatio::between(unit->size, measure.tick);
        if (magnitude % numerator != 0) continue;
        const std::optional<Wide> count = product(magnitude / numerator, denominator);
        if (count) return decimal(*count) + std::string(unit->name);
    }
    return std::to_string(magnitude) + ownUnit(measure);
}

std::string plainDigits(double number) {
    // As many as the smallest number has behind its point, and the sign.
    std::array<char, 400> digits{};
    const auto written = std::to_chars(digits.data(), digits.data() + digits.size(), number,
                                       std::chars_format::fixed);
    return std::string(digits.data(), written.ptr);
}

}  // namespace

Measure durationIn(Ratio tick) {
    return {durations, tick};
}

Measure sizeInBytes() {
    return {sizes, {1, 1}};
}

std::string tickName(const Measure& measure) {
    const Unit* const unit = unitOfTick(measure);
    return unit ? std::string(unit->plural) : ownUnit(measure);
}

Converted<Whole> readExactly(const configuration::ConfigurationValue& value, const Measure& measure,
                             WholeRange range) {
    return textOf(value).then([&](const std::string& text) {
        return parseQuantity(text, measure).then([&](const QuantityText& quantity) {
            return exactly(quantity, measure, range);
        });
    });
}

Converted<double> readRounded(const configuration::ConfigurationValue& value,
                              const Measure& measure, double highest) {
    return textOf(value).then([&](const std::string& text) {
        return parseQuantity(text, measure).then([&](const QuantityText& quantity) {
            return rounded(quantity, measure, highest);
        });
    });
}

std::string showQuantity(Whole ticks, const Measure& measure) {
    const std::string_view bare = measure.units.bareUnit;
    if (ticks.magnitude == 0) return "0" + std::string(bare.empty() ? "s" : bare);
    return (ticks.negative ? "-" : "") + inLargestUnit(ticks.magnitude, measure);
}

std::string showQuantity(double ticks, const Measure& measure) {
    const Unit* const unit = unitOfTick(measure);
    return plainDigits(ticks) + (unit ? std::string(unit->name) : ownUnit(measure));
}

bool isAtMost(Whole left, Ratio leftTick, Whole right, Ratio rightTick) noexcept {
    const bool leftNegative = left.negative && left.magnitude != 0;
    const bool rightNegative = right.negative && right.magnitude != 0;
    if (leftNegative != rightNegative) return leftNegative;
    constexpr Wide highest = ~Wide{0};
    const auto [numerator, denominator] = WideRatio::between(leftTick, rightTick);
    const Wide leftSize = product(left.magnitude, numerator).value_or(highest);
    const Wide rightSize = product(right.magnitude, denominator).value_or(highest);
    return leftNegative ? leftSize >= rightSize : leftSize <= rightSize;
}

}  // namespace velkor::settings::detail
