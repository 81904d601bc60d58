#include "settings/detail/QuantityText.hpp"

#include <algorithm>
#include <optional>

#include "settings/detail/Text.hpp"
#include "settings/detail/Wide.hpp"

namespace velkor::settings::detail {

namespace {

constexpr std::string_view digits = "0123456789";
constexpr std::string_view unitEnds = " \t\n\v\f\r0123456789.,-+";

// Removes the longest beginning of `rest` up to `end` and returns it.
std::string_view take(std::string_view& rest, std::size_t end) {
    const std::string_view taken = rest.substr(0, end);
    rest.remove_prefix(taken.size());
    return taken;
}

std::string_view takeDigits(std::string_view& rest) {
    return take(rest, rest.find_first_not_of(digits));
}

bool isZero(const QuantityPart& part) {
    return part.whole.find_first_not_of('0') == std::string_view::npos &&
           part.fraction.find_first_not_of('0') == std::string_view::npos;
}

Reason withoutUnit(const UnitTable& units) {
    std::string names;
    for (const Unit* unit = units.begin; unit != units.end; ++unit) {
        if (unit->plural.empty()) continue;
        if (!names.empty()) names.insert(0, names.find(' ') == std::string::npos ? " or " : ", ");
        names.insert(0, unit->name);
    }
    return Reason{"not a number with a unit: " + names};
}

class Parser {
public:
    Parser(std::string_view text, const Measure& kind)
        : rest(trimmed(text)), measure(kind), own(unitOfTick(kind) ? "" : ownUnit(kind)) {}

    Converted<QuantityText> parse() {
        QuantityText quantity;
        quantity.negative = !rest.empty() && rest.front() == '-';
        if (quantity.negative) rest.remove_prefix(1);
        do {
            const std::optional<QuantityPart> part = nextPart(quantity.parts.empty());
            if (!part) return withoutUnit(measure.units);
            const bool goesOn = !quantity.parts.empty();
            if (goesOn && !measure.units.isSummed) return withoutUnit(measure.units);
            if (goesOn && !isLarger(quantity.parts.back().unit, part->unit)) {
                return Reason{"its units do not go from large to small"};
            }
            quantity.parts.push_back(*part);
        } while (!rest.empty());
        return quantity;
    }

private:
    std::optional<QuantityPart> nextPart(bool isFirst) {
        QuantityPart part{takeDigits(rest), {}, {}};
        if (part.whole.empty()) return std::nullopt;
        if (!rest.empty() && rest.front() == '.') {
            rest.remove_prefix(1);
            part.fraction = takeDigits(rest);
            if (part.fraction.empty()) return std::nullopt;
        }
        rest = trimmed(rest);
        const bool isBare = isFirst && rest.empty();
        const std::optional<Ratio> unit = isBare ? unitOfBare(part) : takeUnit();
        if (!unit) return std::nullopt;
        part.unit = *unit;
        rest = trimmed(rest);
        return part;
    }

    std::optional<Ratio> unitOfBare(const QuantityPart& part) const {
        if (!measure.units.bareUnit.empty()) return unitNamed(measure.units.bareUnit);
        if (isZero(part)) return measure.tick;
        return std::nullopt;
    }

    std::optional<Ratio> takeUnit() {
        if (!own.empty() && rest.substr(0, own.size()) == own) {
            rest.remove_prefix(own.size());
            return measure.tick;
        }
        return unitNamed(take(rest, rest.find_first_of(unitEnds)));
    }

    std::optional<Ratio> unitNamed(std::string_view name) const {
        const Unit* const found =
            std::find_if(measure.units.begin, measure.units.end,
                         [name](const Unit& unit) { return unit.name == name; });
        if (found == measure.units.end) return std::nullopt;
        return found->size;
    }

    static bool isLarger(Ratio left, Ratio right) {
        return Wide{left.numerator} * right.denominator > Wide{right.numerator} * left.denominator;
    }

    std::string_view rest;
    const Measure& measure;
    const std::string own;
};

}  // namespace

Converted<QuantityText> parseQuantity(std::string_view text, const Measure& measure) {
    return Parser(text, measure).parse();
}

const Unit* unitOfTick(const Measure& measure) {
    const Unit* const found =
        std::find_if(measure.units.begin, measure.units.end, [&measure](const Unit& unit) {
            return WideRatio::between(unit.size, measure.tick).isOne();
        });
    return found == measure.units.end ? nullptr : found;
}

std::string ownUnit(const Measure& measure) {
    const Ratio tick = measure.tick;
    const std::string below =
        tick.denominator == 1 ? std::string() : "/" + std::to_string(tick.denominator);
    return "[" + std::to_string(tick.numerator) + below + "]s";
}

}  // namespace velkor::settings::detail
