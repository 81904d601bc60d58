#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/sources/TextTable.hpp"

namespace velkor::configuration::detail {

/// The smallest keys of those that are added, in time that doesn't depend on their order. Holds
/// twice as many at most as it is to give, as references to groups and keys, which must live as
/// long.
class KeyPage {
public:
    /// For `mostKeys`, one at least, of the keys that are not less than `firstKey`.
    KeyPage(std::string_view firstKey, std::size_t mostKeys)
        : first{{}, firstKey}, most(mostKeys) {}

    /// Adds the key that `group` and `key` make.
    void add(std::string_view group, std::string_view key) {
        if (accepts({group, key})) insert({group, key});
    }

    /// Adds all keys of `table`, each of them once.
    void addAll(std::string_view group, const TextTable& table);

    /// The keys, sorted, each of them once. To be called once.
    std::vector<std::string> take();

private:
    /// A key in two parts.
    struct Candidate {
        std::string_view group;
        std::string_view key;
    };

    static int compare(Candidate left, Candidate right) noexcept;
    static bool isLess(const Candidate& left, const Candidate& right) noexcept {
        return compare(left, right) < 0;
    }

    bool accepts(const Candidate& candidate) const noexcept {
        return !isLess(candidate, first) && (!isFull || isLess(candidate, greatest));
    }
    void insert(const Candidate& candidate);
    void shrink();

    const Candidate first;
    const std::size_t most;
    std::vector<Candidate> candidates;
    bool isFull = false;  // so many have been found that greater ones than `greatest` don't count
    Candidate greatest{};
};

}  // namespace velkor::configuration::detail
