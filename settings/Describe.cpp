#include "settings/Describe.hpp"

#include <algorithm>
#include <cstddef>
#include <numeric>
#include <set>
#include <string_view>
#include <unordered_map>
#include <utility>

#include "settings/Secrets.hpp"
#include "settings/detail/Hub.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings {

namespace {

using configuration::ConfigurationImpl;
using detail::Declared;
using detail::SettingState;
using detail::Standing;
using Keys = std::set<std::string>;

Description describe(const Declared& declared, const Standing* standing, bool isSecret) {
    Description description;
    description.key = declared.key;
    description.type = declared.type;
    if (declared.fallback) description.defaultText = masked(isSecret, *declared.fallback);
    if (standing != nullptr) {
        description.value = masked(isSecret, standing->value);
        description.source = standing->source;
    }
    description.constraint = declared.constraint;
    description.description = declared.description;
    description.secret = isSecret;
    description.needsRestart = declared.needsRestart;
    return description;
}

// A setting that does not know that its key is secret repeats the value in its errors.
bool mayRepeatSecrets(const SettingState& state, const Keys& secrets) {
    const auto& keys = state.keys();
    return std::any_of(keys.begin(), keys.end(), [&](const Declared& declared) {
        return !declared.secret && secrets.count(declared.key) != 0;
    });
}

void describe(const SettingState& state, const Keys& secrets, std::vector<Description>& all) {
    auto error = state.lastError();
    if (error) error = masked(mayRepeatSecrets(state, secrets), *std::move(error));
    const auto standings = state.standings();
    for (std::size_t i = 0; i < state.keys().size(); ++i) {
        const Declared& declared = state.keys()[i];
        all.push_back(describe(declared, standings.empty() ? nullptr : &standings[i],
                               declared.secret || secrets.count(declared.key) != 0));
        all.back().error = error;
    }
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

/// Tells keys that nobody has declared from those that somebody has.
class Recogniser {
public:
    explicit Recogniser(const std::vector<Description>& descriptions) {
        for (const Description& description : descriptions) {
            if (!declared.insert(description.key).second) continue;
            bySkeleton.emplace(skeleton(description.key), description.key);
        }
    }

    bool isDeclared(const std::string& key) const { return declared.count(key) != 0; }

    /// The declared key that `key` is a near miss of, if any.
    std::optional<std::string> nearestTo(const std::string& key) {
        const auto same = bySkeleton.find(skeleton(key));
        if (same != bySkeleton.end()) return same->second;
        std::size_t least = key.size() < 8 ? 2 : 3;  // what is no near miss any more
        const std::string* nearest = nullptr;
        for (const std::string& other : declared) {
            const std::size_t away = distance(key, other, least);
            if (away >= least) continue;
            least = away;
            nearest = &other;
        }
        return nearest == nullptr ? std::nullopt : std::optional<std::string>(*nearest);
    }

private:
    using Row = std::vector<std::size_t>;

    static std::size_t leastOf(const Row& counts) {
        return *std::min_element(counts.begin(), counts.end());
    }

    // The least number of insertions, omissions, replacements and exchanges of neighbours, or
    // `limit` when it is not less. Most keys are given up after a few letters, and lengths that
    // differ by the limit are never looked at.
    std::size_t distance(std::string_view left, std::string_view right, std::size_t limit) {
        const std::size_t longer = std::max(left.size(), right.size());
        if (longer - std::min(left.size(), right.size()) >= limit) return limit;
        last.resize(right.size() + 1);
        std::iota(last.begin(), last.end(), std::size_t{0});
        for (std::size_t i = 1; i <= left.size(); ++i) {
            row.assign(last.size(), limit);
            row[0] = i;
            const std::size_t begin = i < limit ? 1 : i - limit + 1;
            const std::size_t end = std::min(row.size(), i + limit);
            for (std::size_t j = begin; j < end; ++j) {
                const bool same = left[i - 1] == right[j - 1];
                row[j] = std::min({last[j] + 1, row[j - 1] + 1, last[j - 1] + (same ? 0 : 1)});
                const bool exchanged =
                    i > 1 && j > 1 && left[i - 1] == right[j - 2] && left[i - 2] == right[j - 1];
                if (exchanged) row[j] = std::min(row[j], beforeLast[j - 2] + 1);
            }
            if (leastOf(last) >= limit && leastOf(row) >= limit) return limit;
            beforeLast.swap(last);
            last.swap(row);
        }
        return std::min(last.back(), limit);
    }

    Keys declared;
    std::unordered_map<std::string, std::string> bySkeleton;
    Row beforeLast;  // The three newest rows of a comparison.
    Row last;
    Row row;
};

}  // namespace

std::vector<Description> describe(const std::shared_ptr<ConfigurationImpl>& store) {
    std::vector<Description> all;
    const auto hub = detail::Hub::find(store);
    if (hub == nullptr) return all;
    const auto states = hub->states();
    const Keys secrets = secretKeys(store);
    for (const auto& state : states) describe(*state, secrets, all);
    std::sort(all.begin(), all.end(), [](const Description& left, const Description& right) {
        return left.key < right.key;
    });
    return all;
}

std::vector<Description> describe(const std::shared_ptr<ConfigurationImpl>& store,
                                  const std::string& key) {
    std::vector<Description> all;
    const auto hub = detail::Hub::find(store);
    if (hub == nullptr) return all;
    const auto states = hub->statesOf(key);
    Keys secrets;
    for (const auto& state : states) {
        for (const Declared& declared : state->keys()) {
            if (isSecret(store, declared.key)) secrets.insert(declared.key);
        }
    }
    for (const auto& state : states) describe(*state, secrets, all);
    all.erase(std::remove_if(all.begin(), all.end(),
                             [&](const Description& each) { return each.key != key; }),
              all.end());
    return all;
}

std::vector<UndeclaredKey> undeclaredKeys(const std::shared_ptr<ConfigurationImpl>& store) {
    Recogniser recogniser(describe(store));
    std::vector<UndeclaredKey> undeclared;
    for (const std::string& key : store->keys().get()) {
        if (!recogniser.isDeclared(key)) undeclared.push_back({key, recogniser.nearestTo(key)});
    }
    return undeclared;
}

}  // namespace velkor::settings
