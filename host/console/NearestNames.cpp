#include "host/console/NearestNames.hpp"

#include <algorithm>
#include <cstddef>
#include <numeric>
#include <utility>

namespace velkor::host {

namespace {

constexpr std::size_t mostOffered = 3;

// The number of edits between two texts, by the table of the distances of all their beginnings, of
// which three rows are needed at a time.
std::size_t editDistance(const std::string& from, const std::string& to) {
    std::vector<std::size_t> beforeLast(to.size() + 1);
    std::vector<std::size_t> last(to.size() + 1);
    std::vector<std::size_t> row(to.size() + 1);
    std::iota(last.begin(), last.end(), std::size_t{0});
    for (std::size_t i = 1; i <= from.size(); ++i) {
        row[0] = i;
        for (std::size_t j = 1; j <= to.size(); ++j) {
            const std::size_t changed = last[j - 1] + (from[i - 1] == to[j - 1] ? 0 : 1);
            row[j] = std::min({last[j] + 1, row[j - 1] + 1, changed});
            const bool swapped =
                i > 1 && j > 1 && from[i - 1] == to[j - 2] && from[i - 2] == to[j - 1];
            if (swapped) row[j] = std::min(row[j], beforeLast[j - 2] + 1);
        }
        beforeLast.swap(last);
        last.swap(row);
    }
    return last[to.size()];
}

// How far `candidate` is from `name`; more than `limit` when too far. Most texts are too different
// in length to be looked at.
std::size_t distance(const std::string& name, const std::string& candidate, std::size_t limit) {
    if (!name.empty() && candidate.compare(0, name.size(), name) == 0) return 1;
    const auto [shorter, longer] = std::minmax({name.size(), candidate.size()});
    return longer - shorter > limit ? limit + 1 : editDistance(name, candidate);
}

}  // namespace

std::vector<std::string> nearestNames(const std::string& name,
                                      const std::vector<std::string>& known) {
    const std::size_t limit = 1 + name.size() / 4;
    std::vector<std::pair<std::size_t, std::string>> near;
    for (const auto& candidate : known) {
        const std::size_t edits = distance(name, candidate, limit);
        if (edits <= limit) near.emplace_back(edits, candidate);
    }
    std::stable_sort(near.begin(), near.end(),
                     [](const auto& left, const auto& right) { return left.first < right.first; });
    near.resize(std::min(near.size(), mostOffered));
    std::vector<std::string> names;
    names.reserve(near.size());
    for (auto& entry : near) names.push_back(std::move(entry.second));
    return names;
}

std::string joinedNames(const std::vector<std::string>& names) {
    std::string text;
    for (const auto& name : names) text += (text.empty() ? "" : ", ") + name;
    return text;
}

}  // namespace velkor::host
