#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "settings/Converted.hpp"
#include "settings/detail/Quantity.hpp"

namespace velkor::settings::detail {

/// One part of a quantity: "1.5 h".
struct QuantityPart {
    std::string_view whole;     ///< The digits before the point, at least one.
    std::string_view fraction;  ///< Those behind it, if there are any.
    Ratio unit;                 ///< In seconds or bytes.

    /// The number as it was written.
    std::string_view number() const {
        const char* const end =
            fraction.empty() ? whole.data() + whole.size() : fraction.data() + fraction.size();
        return {whole.data(), static_cast<std::size_t>(end - whole.data())};
    }
};

/// A quantity as it was written; the parts lie in the text that was read.
struct QuantityText {
    bool negative = false;
    std::vector<QuantityPart> parts;
};

/// Takes `text` apart, in time proportional to its length:
///
///     quantity = ["-"] part {part}      several parts only where the units may be summed
///     part     = digits ["." digits] [unit]
///
/// with blanks around a part and before its unit.
Converted<QuantityText> parseQuantity(std::string_view text, const Measure& measure);

/// The unit of the table that is as large as the tick; null if none is.
const Unit* unitOfTick(const Measure& measure);

/// The tick as a unit by itself, for ticks as large as no other unit, as C++20 writes it:
/// "[1/60]s".
std::string ownUnit(const Measure& measure);

}  // namespace velkor::settings::detail
