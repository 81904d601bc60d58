#include "configuration/detail/KeyPage.hpp"

#include <algorithm>

namespace velkor::configuration::detail {

void KeyPage::addAll(std::string_view group, const TextTable& table) {
    const std::size_t size = table.size();
    // Each key that is smaller than all before it has to be kept for a while.
    const bool descends = size != 0 && table.key(size - 1) < table.key(0);
    for (std::size_t count = 0; count < size; ++count) {
        const std::size_t number = descends ? size - 1 - count : count;
        const Candidate candidate{group, table.key(number)};
        if (accepts(candidate) && table.counting(number) == number) insert(candidate);
    }
}

std::vector<std::string> KeyPage::take() {
    if (candidates.size() > most) shrink();
    std::sort(candidates.begin(), candidates.end(), isLess);
    std::vector<std::string> keys;
    keys.reserve(candidates.size());
    for (const Candidate& candidate : candidates) {
        std::string key(candidate.group);
        key += candidate.key;
        if (keys.empty() || keys.back() != key) keys.push_back(std::move(key));
    }
    return keys;
}

int KeyPage::compare(Candidate left, Candidate right) noexcept {
    while (!left.group.empty() || !right.group.empty()) {
        if (left.group.empty()) std::swap(left.group, left.key);
        if (right.group.empty()) std::swap(right.group, right.key);
        const std::size_t common = std::min(left.group.size(), right.group.size());
        const int order = left.group.substr(0, common).compare(right.group.substr(0, common));
        if (order != 0) return order;
        if (common == 0) break;
        left.group.remove_prefix(common);
        right.group.remove_prefix(common);
    }
    return left.group.empty() && right.group.empty() ? left.key.compare(right.key)
                                                     : (left.group.empty() ? -1 : 1);
}

void KeyPage::insert(const Candidate& candidate) {
    candidates.push_back(candidate);
    if (candidates.size() >= 2 * most) shrink();
}

void KeyPage::shrink() {
    const auto last = candidates.begin() + static_cast<std::ptrdiff_t>(most - 1);
    std::nth_element(candidates.begin(), last, candidates.end(), isLess);
    greatest = *last;
    isFull = true;
    candidates.resize(most);
}

}  // namespace velkor::configuration::detail
