#include "layers/sqlite/detail/Deadlines.hpp"

#include <algorithm>
#include <utility>

namespace velkor::layers::detail {

Deadlines::Deadlines(Map&& initial) : times(std::move(initial)) {
    findEarliest();
}

std::optional<Time> Deadlines::replace(const std::string& key, Map&& entry) noexcept {
    std::optional<Time> former;
    const auto found = times.find(key);
    if (found != times.end()) {
        former = found->second;
        times.erase(found);
    }
    if (!entry.empty()) earliest = std::min(earliest, entry.begin()->second);
    times.merge(entry);
    return former;
}

void Deadlines::put(const std::string& key, std::optional<Time> time) {
    Map entry;
    if (time) entry.emplace(key, *time);
    replace(key, std::move(entry));
}

std::optional<Time> Deadlines::next() const noexcept {
    if (times.empty()) return std::nullopt;
    return earliest;
}

std::vector<std::string> Deadlines::due(Time now) {
    std::vector<std::string> keys;
    for (const auto& [key, time] : times) {
        if (time <= now) keys.push_back(key);
    }
    findEarliest();
    return keys;
}

void Deadlines::findEarliest() noexcept {
    earliest = Time::max();
    for (const auto& each : times) earliest = std::min(earliest, each.second);
}

}  // namespace velkor::layers::detail
