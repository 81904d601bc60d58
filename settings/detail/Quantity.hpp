#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"
#include "settings/Converted.hpp"
#include "settings/detail/Numbers.hpp"

namespace velkor::settings::detail {

/// A positive ratio.
struct Ratio {
    std::uint64_t numerator;
    std::uint64_t denominator;
};

/// What a number may be followed by, in seconds or bytes. Without a `plural` it is another name of
/// the unit before it.
struct Unit {
    std::string_view name;
    Ratio size;
    std::string_view plural;
};

/// The units of one kind of quantity, from large to small.
struct UnitTable {
    const Unit* begin;
    const Unit* end;
    std::string_view bareUnit;  ///< The unit of a number without one; none if only 0 needs none.
    bool isSummed;              ///< Whether several parts may follow each other: "1h 30min".
};

/// How a type counts a quantity: in `tick`s of seconds or bytes.
struct Measure {
    const UnitTable& units;
    Ratio tick;
};

VELKOR_EXPORT Measure durationIn(Ratio tick);
VELKOR_EXPORT Measure sizeInBytes();

/// What is counted: "milliseconds"; "[1/60]s" if the tick is not one of the units.
VELKOR_EXPORT std::string tickName(const Measure& measure);

/// The number of ticks that a text like "250ms" says, exactly. A part of it has at most 38 digits.
/// Refused with
/// - "not a number with a unit: ns, us, ms, s, min, h or d"
/// - "its units do not go from large to small"
/// - "not a whole number of milliseconds", each part by itself
/// - "not within 0 to 255 milliseconds"
VELKOR_EXPORT Converted<Whole> readExactly(const configuration::ConfigurationValue& value,
                                           const Measure& measure, WholeRange range);

/// The same rounded, where only what the type can't hold is refused: "out of range".
VELKOR_EXPORT Converted<double> readRounded(const configuration::ConfigurationValue& value,
                                            const Measure& measure, double highest);

/// `ticks` in the largest unit of which it is a whole number.
VELKOR_EXPORT std::string showQuantity(Whole ticks, const Measure& measure);

/// `ticks` in the measure's own tick.
VELKOR_EXPORT std::string showQuantity(double ticks, const Measure& measure);

/// Whether `left` is at most `right`, each counted in its own tick. Exact, whatever the ticks.
VELKOR_EXPORT bool isAtMost(Whole left, Ratio leftTick, Whole right, Ratio rightTick) noexcept;

}  // namespace velkor::settings::detail
