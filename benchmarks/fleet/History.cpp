#include "benchmarks/fleet/History.hpp"

namespace velkor::benchmarks {

History::History(const std::vector<Seen>& changes) {
    for (std::size_t place = 0; place < changes.size(); ++place) {
        const Seen& each = changes[place];
        if (each.key < 0) continue;
        last[each.key] = each.value;
        if (!places.emplace(each.value, Entry{each.key, place}).second) twice.push_back(each.value);
    }
}

std::optional<std::size_t> History::place(int key, int value) const {
    const auto found = places.find(value);
    if (found == places.end() || found->second.key != key) return std::nullopt;
    return found->second.place;
}

}  // namespace velkor::benchmarks
