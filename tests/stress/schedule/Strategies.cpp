#include "tests/stress/schedule/Strategies.hpp"

#include <algorithm>

namespace velkor::testing::schedule {

namespace {

// Most faults need two or three of them.
constexpr unsigned mostChanges = 4;

bool isAmong(const std::vector<std::size_t>& threads, std::size_t thread) {
    return std::find(threads.begin(), threads.end(), thread) != threads.end();
}

}  // namespace

std::size_t FewPreemptions::choose(const std::vector<std::size_t>& able, std::size_t current) {
    const bool goesOn = isAmong(able, current);
    if (able.size() == 1) return able.front();
    if (goesOn && preemptions == most) return current;
    if (depth == path.size()) {
        Decision decision{able};
        if (goesOn) {
            const auto self = std::find(decision.options.begin(), decision.options.end(), current);
            std::rotate(decision.options.begin(), self, self + 1);
        }
        path.push_back(std::move(decision));
    }
    const Decision& decision = path[depth++];
    const std::size_t chosen = decision.options[decision.taken];
    if (goesOn && chosen != current) ++preemptions;
    return chosen;
}

bool FewPreemptions::advance() {
    depth = 0;
    preemptions = 0;
    while (!path.empty() && ++path.back().taken == path.back().options.size()) path.pop_back();
    return !path.empty();
}

RandomRanks::RandomRanks(unsigned seed, std::size_t steps) : random(seed) {
    const auto count = random() % (mostChanges + 1);
    for (std::size_t i = 0; i < count; ++i) changes.push_back(random() % (steps + 1));
}

std::size_t RandomRanks::choose(const std::vector<std::size_t>& able, std::size_t current) {
    const bool falls = std::count(changes.begin(), changes.end(), step++) > 0;
    if (falls && isAmong(able, current)) rankOf(current) = --lowest;
    return *std::max_element(able.begin(), able.end(), [this](std::size_t left, std::size_t right) {
        return rankOf(left) < rankOf(right);
    });
}

int& RandomRanks::rankOf(std::size_t thread) {
    while (ranks.size() <= thread) ranks.push_back(static_cast<int>(random() % 1'000'000));
    return ranks[thread];
}

std::size_t Repetition::choose(const std::vector<std::size_t>& able, std::size_t current) {
    if (step < wanted.size()) {
        const auto chosen = static_cast<std::size_t>(wanted[step++] - '0');
        if (isAmong(able, chosen)) return chosen;
    }
    return isAmong(able, current) ? current : able.front();
}

}  // namespace velkor::testing::schedule
