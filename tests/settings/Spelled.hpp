#pragma once

#include <chrono>
#include <iomanip>
#include <locale>
#include <optional>
#include <sstream>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include "settings/ByteSize.hpp"
#include "settings/Conversion.hpp"
#include "settings/EnumNames.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::settings::testing {

enum class Level { debug = 10, info = 20, warning = 30 };

}  // namespace velkor::settings::testing

template <>
struct velkor::settings::EnumNames<velkor::settings::testing::Level> {
    using Level = testing::Level;
    static constexpr std::pair<Level, std::string_view> table[] = {{Level::debug, "debug"},
                                                                   {Level::info, "info"},
                                                                   {Level::warning, "warning"},
                                                                   {Level::warning, "warn"}};
};

namespace velkor::settings::testing {

using velkor::testing::ValueSpeller;

/// Spells what was read in another way than a setting is shown: the ticks of a duration, the bytes
/// of a size, the number of an enumerator, all digits of a number.
template <class T>
std::string spelled(const T& value) {
    if constexpr (std::is_floating_point_v<T>) {
        std::ostringstream digits;
        digits.imbue(std::locale::classic());
        digits << std::setprecision(17) << value;
        return digits.str();
    } else if constexpr (std::is_enum_v<T>) {
        return std::to_string(static_cast<int>(value));
    } else if constexpr (std::is_integral_v<T> && !std::is_same_v<T, bool>) {
        return std::to_string(value);
    } else {
        return ValueSpeller()(value);
    }
}

template <class Count, class Tick>
std::string spelled(std::chrono::duration<Count, Tick> value) {
    return spelled(value.count()) + " ticks";
}

inline std::string spelled(ByteSize value) {
    return std::to_string(value.bytes) + " bytes";
}

template <class T>
std::string spelled(const std::vector<T>& list);

template <class T>
std::string spelled(const std::optional<T>& value) {
    return value ? "some " + spelled(*value) : "nothing";
}

template <class T>
std::string spelled(const std::vector<T>& list) {
    std::string text;
    for (const auto& element : list) text += (text.empty() ? "" : "|") + spelled(element);
    return "[" + text + "]";
}

/// What `value` becomes as a `T`: spelled, or "! " and the reason.
template <class T>
std::string readAs(const configuration::ConfigurationValue& value) {
    const Converted<T> read = Conversion<T>::from(value);
    return read ? spelled(read.value()) : "! " + read.reason().text;
}

}  // namespace velkor::settings::testing
