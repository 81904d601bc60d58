#pragma once

#include <boost/variant/apply_visitor.hpp>
#include <boost/variant/static_visitor.hpp>
#include <chrono>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "settings/ByteSize.hpp"
#include "settings/Converted.hpp"
#include "settings/EnumNames.hpp"
#include "settings/detail/Numbers.hpp"
#include "settings/detail/Quantity.hpp"
#include "settings/detail/Text.hpp"
#include "settings/detail/TextList.hpp"
#include "settings/detail/TypeTraits.hpp"

namespace velkor::settings {

/// How a value of the store becomes a `T`, and back into text. Each specialisation has
///
///     static std::string typeName();  // for messages: "int", "duration in milliseconds"
///     static Converted<T> from(const configuration::ConfigurationValue& value);
///     static std::string show(const T& value);  // a text from which the same value is read
///
/// For a type of your own, specialise it in the same way, on top of others:
///
///     template <>
///     struct velkor::settings::Conversion<Colour> {
///         static std::string typeName() { return "colour as #rrggbb"; }
///         static Converted<Colour> from(const configuration::ConfigurationValue& value) {
///             return Conversion<std::string>::from(value).then(parseColour);
///         }
///         static std::string show(const Colour& colour) { return textOf(colour); }
///     };
///
/// A value that does not fit is no exception but a `Reason`. The rules:
///
/// - Every kind of single value is read through its text: `true` and `false`, the number as
///   `Conversion<double>::show` writes it, narrow text byte for byte, UTF-16 text as UTF-8. So an
///   int takes the double 3.0, not 3.5, and a text takes the int 5 as "5".
/// - The whole text or nothing; ASCII blanks at its ends do not count, except in texts. The locale
///   never matters.
/// - A single value is never read from an array. A list is read from an array element by element,
///   and from anything else as `detail::splitList` tells.
///
/// All functions may be called by several threads at once. They throw nothing but `std::bad_alloc`.
template <class T, class = void>
struct Conversion {
    static_assert(detail::never<T>,
                  "no value converts to this type: specialise velkor::settings::Conversion for it");
};

/// true/false, on/off, yes/no and 1/0, in any case.
template <>
struct Conversion<bool> {
    static std::string typeName() { return "bool"; }
    static Converted<bool> from(const configuration::ConfigurationValue& value) {
        return detail::readBool(value);
    }
    static std::string show(bool value) { return value ? "true" : "false"; }
};

/// Integers of up to 64 bits, in decimal digits with a minus where it is needed, and within their
/// range. `signed char` and `unsigned char` are integers; `char` and the other characters are not.
template <class T>
struct Conversion<T, std::enable_if_t<detail::isWholeNumber<T>>> {
    static std::string typeName() { return detail::nameOfWhole(sizeof(T), std::is_signed_v<T>); }
    static Converted<T> from(const configuration::ConfigurationValue& value) {
        return detail::readWhole(value, detail::WholeRange::of<T>())
            .then([](detail::Whole whole) -> Converted<T> { return whole.as<T>(); });
    }
    static std::string show(T value) { return std::to_string(value); }
};

/// Finite numbers, rounded to the nearest: "0.5", "-1e-9". Those that are not zero but would become
/// it are refused like those that are too large.
template <>
struct Conversion<double> {
    static std::string typeName() { return "double"; }
    static Converted<double> from(const configuration::ConfigurationValue& value) {
        return detail::readDouble(value);
    }
    static std::string show(double value) { return detail::showNumber(value); }
};

template <>
struct Conversion<float> {
    static std::string typeName() { return "float"; }
    static Converted<float> from(const configuration::ConfigurationValue& value) {
        return detail::readFloat(value);
    }
    static std::string show(float value) { return detail::showNumber(value); }
};

/// Any single value; its text is kept with the blanks at its ends. Narrow text is kept byte for
/// byte, UTF-16 text must be well-formed.
template <>
struct Conversion<std::string> {
    static std::string typeName() { return "text"; }
    static Converted<std::string> from(const configuration::ConfigurationValue& value) {
        return detail::textOf(value);
    }
    static std::string show(const std::string& value) { return value; }
};

/// Any single value; UTF-16 text is kept unit by unit, narrow text must be well-formed UTF-8. What
/// is ill-formed itself is shown with U+FFFD.
template <>
struct Conversion<std::u16string> {
    static std::string typeName() { return "text"; }
    static Converted<std::u16string> from(const configuration::ConfigurationValue& value) {
        return detail::utf16Of(value);
    }
    static std::string show(const std::u16string& value) { return detail::utf8(value); }
};

/// Enumerations, by their names in `EnumNames`. A value without a name is shown as its number,
/// which is not read.
template <class T>
struct Conversion<T, std::enable_if_t<std::is_enum_v<T>>> {
    static_assert(detail::hasNames<T>,
                  "this enumeration has no names: specialise velkor::settings::EnumNames for it");

    static std::string typeName() {
        std::string names;
        for (const auto& [value, name] : EnumNames<T>::table) {
            names += (names.empty() ? "one of: " : ", ") + std::string(name);
        }
        return names;
    }

    static Converted<T> from(const configuration::ConfigurationValue& value) {
        return detail::textOf(value).then([](const std::string& text) -> Converted<T> {
            for (const auto& [named, name] : EnumNames<T>::table) {
                if (detail::sameIgnoringCase(detail::trimmed(text), name)) return named;
            }
            return Reason{"not " + typeName()};
        });
    }

    static std::string show(T value) {
        for (const auto& [named, name] : EnumNames<T>::table) {
            if (named == value) return std::string(name);
        }
        return std::to_string(static_cast<std::underlying_type_t<T>>(value));
    }
};

/// Numbers with a unit (ns, us or µs, ms, s, min or m, h, d), as in "250ms", "1.5 s", "-2h" and,
/// from large to small, "1h 30min". Only 0 needs none. Where whole ticks are counted, each part
/// must be a whole number of them; nothing is rounded. Ticks as long as none of the units have one
/// of their own besides, "[1/60]s".
template <class Count, class Tick>
struct Conversion<std::chrono::duration<Count, Tick>> {
    static constexpr bool isWhole = detail::isWholeNumber<Count>;
    static_assert(isWhole || detail::isOneOf<Count, float, double>,
                  "a duration is counted in integers, float or double");
    using Duration = std::chrono::duration<Count, Tick>;

    static std::string typeName() { return "duration in " + detail::tickName(measure()); }

    static Converted<Duration> from(const configuration::ConfigurationValue& value) {
        if constexpr (isWhole) {
            return detail::readExactly(value, measure(), detail::WholeRange::of<Count>())
                .then([](detail::Whole whole) -> Converted<Duration> {
                    return Duration(whole.as<Count>());
                });
        } else {
            return detail::readRounded(value, measure(), double{std::numeric_limits<Count>::max()})
                .then([](double ticks) -> Converted<Duration> {
                    return Duration(static_cast<Count>(ticks));
                });
        }
    }

    static std::string show(Duration value) {
        if constexpr (isWhole) {
            return detail::showQuantity(detail::Whole::of(value.count()), measure());
        } else {
            return detail::showQuantity(double{value.count()}, measure());
        }
    }

private:
    static detail::Measure measure() {
        return detail::durationIn({std::uint64_t{Tick::num}, std::uint64_t{Tick::den}});
    }
};

/// Numbers with a unit: B, kB, MB, GB, TB, PB, EB in steps of 1000, KiB to EiB in steps of 1024, so
/// written. Without a unit they are bytes. A whole number of bytes; nothing is rounded.
template <>
struct Conversion<ByteSize> {
    static std::string typeName() { return "size in bytes"; }
    static Converted<ByteSize> from(const configuration::ConfigurationValue& value) {
        return detail::readExactly(value, detail::sizeInBytes(),
                                   detail::WholeRange::of<std::uint64_t>())
            .then([](detail::Whole whole) -> Converted<ByteSize> {
                return ByteSize{whole.magnitude};
            });
    }
    static std::string show(ByteSize value) {
        return detail::showQuantity(detail::Whole{false, value.bytes}, detail::sizeInBytes());
    }
};

/// Nothing from an empty text, otherwise what `T` reads. Blanks are empty as well, except where `T`
/// is a text; so the empty text itself is no value of an optional text.
template <class T>
struct Conversion<std::optional<T>> {
    static_assert(!detail::isOptional<T>, "a setting can't be optional twice");
    static constexpr bool isText = detail::isOneOf<T, std::string, std::u16string>;

    static std::string typeName() { return Conversion<T>::typeName() + ", or nothing"; }

    static Converted<std::optional<T>> from(const configuration::ConfigurationValue& value) {
        if (detail::isEmptyText(value, isText)) return std::optional<T>();
        return Conversion<T>::from(value).then([](T converted) -> Converted<std::optional<T>> {
            return std::optional<T>(std::move(converted));
        });
    }

    static std::string show(const std::optional<T>& value) {
        return value ? Conversion<T>::show(*value) : std::string();
    }
};

/// An array element by element, a text by its commas: `a, "b, c", d`. Within quotation marks `\"`
/// and `\\` stand for the second character; a blank text is a list of nothing. Any other single
/// value is a list of one.
template <class T>
struct Conversion<std::vector<T>> {
    static_assert(!detail::isList<T>, "a setting can't be a list of lists");
    using List = std::vector<T>;

    static std::string typeName() { return "list of " + Conversion<T>::typeName(); }

    static Converted<List> from(const configuration::ConfigurationValue& value) {
        return boost::apply_visitor(Reader{value}, value);
    }

    static std::string show(const List& list) {
        std::vector<std::string> elements;
        elements.reserve(list.size());
        for (const auto& element : list) elements.push_back(Conversion<T>::show(element));
        return detail::joinList(elements);
    }

private:
    template <class Element>
    static Converted<List> elementwise(const std::vector<Element>& elements) {
        List list;
        list.reserve(elements.size());
        for (const Element& element : elements) {
            Converted<T> read = Conversion<T>::from(configuration::ConfigurationValue(element));
            if (!read) return detail::ofElement(list.size(), read.reason());
            list.push_back(std::move(read).value());
        }
        return list;
    }

    struct Reader : boost::static_visitor<Converted<List>> {
        explicit Reader(const configuration::ConfigurationValue& read) : whole(read) {}

        template <class Single>
        Converted<List> operator()(const Single&) const {
            return detail::textOf(whole)
                .then([](const std::string& text) { return detail::splitList(text); })
                .then([](const std::vector<std::string>& texts) { return elementwise(texts); });
        }

        template <class Element>
        Converted<List> operator()(const std::vector<Element>& elements) const {
            return elementwise(elements);
        }

        const configuration::ConfigurationValue& whole;
    };
};

}  // namespace velkor::settings
