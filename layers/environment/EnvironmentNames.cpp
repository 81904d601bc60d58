#include "layers/environment/EnvironmentNames.hpp"

#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <utility>

namespace velkor::layers {

namespace {

constexpr std::string_view point = "__";

// Letters are those of ASCII, whatever the host's locale says.
constexpr bool isUpper(char byte) noexcept {
    return byte >= 'A' && byte <= 'Z';
}

constexpr bool isLower(char byte) noexcept {
    return byte >= 'a' && byte <= 'z';
}

constexpr bool isDigit(char byte) noexcept {
    return byte >= '0' && byte <= '9';
}

constexpr bool isOfNames(char byte) noexcept {
    return isUpper(byte) || isDigit(byte) || byte == '_';
}

constexpr char changedCase(char letter) noexcept {
    return static_cast<char>(letter ^ ('a' ^ 'A'));
}

// The key of a name by the rule alone, without the prefix.
std::string keyBySyntax(std::string_view name) {
    std::string key;
    for (std::size_t i = 0; i < name.size(); ++i) {
        if (name.substr(i, point.size()) == point) {
            key += '.';
            ++i;
        } else {
            key += isUpper(name[i]) ? changedCase(name[i]) : name[i];
        }
    }
    return key;
}

}  // namespace

EnvironmentNames::EnvironmentNames(std::string namePrefix,
                                   const std::vector<std::string>& spelledKeys)
    : prefix(std::move(namePrefix)) {
    for (const auto& key : spelledKeys) {
        const auto [entry, isNew] = spelled.try_emplace(nameFor(key), key);
        if (isNew || entry->second == key) continue;
        throw std::invalid_argument("Environment variable " + entry->first +
                                    " stands for two keys: " + entry->second + ", " + key);
    }
}

std::optional<std::string> EnvironmentNames::keyOf(std::string_view name) const {
    if (name.substr(0, prefix.size()) != prefix) return std::nullopt;
    const std::string_view rest = name.substr(prefix.size());
    if (rest.empty() || !std::all_of(rest.begin(), rest.end(), isOfNames)) return std::nullopt;
    const auto listed = spelled.find(name);
    return listed == spelled.end() ? keyBySyntax(rest) : listed->second;
}

std::optional<std::string> EnvironmentNames::nameOf(const std::string& key) const {
    std::string name = nameFor(key);
    if (keyOf(name) != key) return std::nullopt;
    return name;
}

// The name that stands for `key` if any does.
std::string EnvironmentNames::nameFor(const std::string& key) const {
    std::string name = prefix;
    for (const char byte : key) {
        if (byte == '.') {
            name += point;
        } else if (isLower(byte)) {
            name += changedCase(byte);
        } else {
            name += isOfNames(byte) ? byte : '_';
        }
    }
    return name;
}

}  // namespace velkor::layers
