#include "settings/Describe.hpp"

#include <algorithm>
#include <cstddef>
#include <set>
#include <string_view>
#include <utility>

#include "settings/detail/Hub.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings {

namespace {

using configuration::ConfigurationImpl;
using detail::Declared;
using detail::Standing;

Description describe(const Declared& declared, const Standing* standing) {
    Description description;
    description.key = declared.key;
    description.type = declared.type;
    if (declared.fallback) description.defaultText = declared.shown(*declared.fallback);
    if (standing != nullptr) {
        description.value = declared.shown(standing->value);
        description.source = standing->source;
    }
    description.constraint = declared.constraint;
    description.description = declared.description;
    description.secret = declared.secret;
    description.needsRestart = declared.needsRestart;
    return description;
}

// Without the case of letters and without what separates words.
std::string skeleton(std::string_view key) {
    std::string letters;
    for (const char letter : key) {
        if (letter == '-' || letter == '_' || letter == '.') continue;
        const bool isUpper = letter >= 'A' && letter <= 'Z';
        letters += isUpper ? static_cast<char>(letter - 'A' + 'a') : letter;
    }
    return letters;
}

// The least number of insertions, omissions, replacements and exchanges of neighbours, or `limit`
// when it is not less.
std::size_t distance(std::string_view left, std::string_view right, std::size_t limit) {
    const std::size_t longer = std::max(left.size(), right.size());
    if (longer - std::min(left.size(), right.size()) >= limit) return limit;
    std::vector<std::size_t> beforeLast;
    std::vector<std::size_t> last(right.size() + 1);
    for (std::size_t j = 0; j < last.size(); ++j) last[j] = j;
    for (std::size_t i = 1; i <= left.size(); ++i) {
        std::vector<std::size_t> row(last.size());
        row[0] = i;
        for (std::size_t j = 1; j < row.size(); ++j) {
            const bool same = left[i - 1] == right[j - 1];
            row[j] = std::min({last[j] + 1, row[j - 1] + 1, last[j - 1] + (same ? 0 : 1)});
            const bool exchanged =
                i > 1 && j > 1 && left[i - 1] == right[j - 2] && left[i - 2] == right[j - 1];
            if (exchanged) row[j] = std::min(row[j], beforeLast[j - 2] + 1);
        }
        beforeLast = std::exchange(last, std::move(row));
    }
    return std::min(last.back(), limit);
}

std::optional<std::string> nearestOf(const std::string& key,
                                     const std::set<std::string>& declared) {
    const std::string bones = skeleton(key);
    std::size_t least = key.size() < 8 ? 2 : 3;  // what is no near miss any more
    std::optional<std::string> nearest;
    for (const std::string& other : declared) {
        if (skeleton(other) == bones) return other;
        const std::size_t away = distance(key, other, least);
        if (away >= least) continue;
        least = away;
        nearest = other;
    }
    return nearest;
}

}  // namespace

std::vector<Description> describe(const std::shared_ptr<ConfigurationImpl>& store) {
    std::vector<Description> all;
    const auto hub = detail::Hub::find(store);
    if (hub == nullptr) return all;
    for (const auto& state : hub->states()) {
        const auto standings = state->standings();
        for (std::size_t i = 0; i < state->keys().size(); ++i) {
            all.push_back(describe(state->keys()[i], standings.empty() ? nullptr : &standings[i]));
            all.back().error = state->lastError();
        }
    }
    std::sort(all.begin(), all.end(), [](const Description& left, const Description& right) {
        return left.key < right.key;
    });
    return all;
}

std::vector<UndeclaredKey> undeclaredKeys(const std::shared_ptr<ConfigurationImpl>& store) {
    std::set<std::string> declared;
    for (const Description& description : describe(store)) declared.insert(description.key);
    std::vector<UndeclaredKey> undeclared;
    for (const std::string& key : store->keys().get()) {
        if (declared.count(key) == 0) undeclared.push_back({key, nearestOf(key, declared)});
    }
    return undeclared;
}

}  // namespace velkor::settings
