#include "host/console/ValueWords.hpp"

#include <charconv>
#include <cstddef>
#include <iterator>
#include <optional>
#include <string_view>
#include <system_error>
#include <type_traits>
#include <utility>

#include "host/console/Command.hpp"
#include "host/console/NearestNames.hpp"
#include "settings/Conversion.hpp"

namespace velkor::host {

using configuration::ConfigurationValue;

namespace {

using Words = std::vector<std::string>;

constexpr std::string_view numberBytes = "0123456789.eE+-";
constexpr std::string_view fractionMarks = ".eE";

bool isTruthValue(const std::string& word) {
    return word == "true" || word == "false";
}

template <class Number>
std::optional<Number> numberOf(const std::string& word) {
    Number number{};
    const char* const end = word.data() + word.size();
    const auto [parsedEnd, error] = std::from_chars(word.data(), end, number);
    if (error != std::errc() || parsedEnd != end) return std::nullopt;
    return number;
}

// The number, if it is written as `word`.
template <class Integer>
std::optional<Integer> integerWrittenAs(const std::string& word) {
    const auto number = numberOf<Integer>(word);
    return number && std::to_string(*number) == word ? number : std::nullopt;
}

std::optional<double> doubleWrittenAs(const std::string& word) {
    if (word.find_first_not_of(numberBytes) != std::string::npos) return std::nullopt;
    const auto number = numberOf<double>(word);
    const bool mayBeRounded = word.find_first_of(fractionMarks) != std::string::npos;
    // All digits of a double fit: the largest has 309 of them.
    char digits[400];
    if (!number || mayBeRounded) return number;
    const auto written =
        std::to_chars(std::begin(digits), std::end(digits), *number, std::chars_format::fixed);
    return std::string_view(digits, static_cast<std::size_t>(written.ptr - digits)) == word
               ? number
               : std::nullopt;
}

std::optional<double> asDouble(const ConfigurationValue& value) {
    if (const auto* number = boost::get<int>(&value)) return *number;
    if (const auto* number = boost::get<unsigned int>(&value)) return *number;
    if (const auto* number = boost::get<double>(&value)) return *number;
    return std::nullopt;
}

template <class T>
T fitting(const std::string& type, const std::string& place, const std::string& word) {
    auto converted = settings::Conversion<T>::from(ConfigurationValue(word));
    if (!converted) {
        throw CommandError("--type " + type + ": " + place + converted.reason().text);
    }
    return std::move(converted).value();
}

/// Makes a `T` of words.
template <class T>
struct Reading {
    static T read(const std::string& type, const Words& words) {
        if (words.size() == 1) return fitting<T>(type, "", words.front());
        throw CommandError("--type " + type +
                           ": one VALUE is needed; given: " + std::to_string(words.size()));
    }
};

template <class Element>
struct Reading<std::vector<Element>> {
    static std::vector<Element> read(const std::string& type, const Words& words) {
        std::vector<Element> elements;
        for (const auto& word : words) {
            const std::string place = "word " + std::to_string(elements.size() + 1) + ": ";
            elements.push_back(fitting<Element>(type, place, word));
        }
        return elements;
    }
};

}  // namespace

ConfigurationValue wordValue(const std::string& word) {
    if (isTruthValue(word)) return word == "true";
    if (const auto number = integerWrittenAs<int>(word)) return *number;
    if (const auto number = integerWrittenAs<unsigned int>(word)) return *number;
    if (const auto number = doubleWrittenAs(word)) return *number;
    return word;
}

bool isMeantBy(const std::string& text, const ConfigurationValue& stored) {
    if (stored == ConfigurationValue(text)) return true;
    const ConfigurationValue meant = wordValue(text);
    const auto number = asDouble(meant);
    return stored == meant || (number && number == asDouble(stored));
}

ConfigurationValue typedValue(const std::string& type, const Words& words) {
    std::optional<ConfigurationValue> value;
    configuration::forEachValueKind([&](const auto& kind) {
        using Kind = typename std::decay_t<decltype(kind)>::Type;
        if (kind.tag == type) value = Reading<Kind>::read(type, words);
    });
    if (value) return *std::move(value);
    throw CommandError("--type " + type + ": one of " + joinedNames(typeNames()) + " is needed");
}

std::vector<std::string> typeNames() {
    return {configuration::typeTags.begin(), configuration::typeTags.end()};
}

}  // namespace velkor::host
