#include "benchmarks/fleet/Faults.hpp"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <functional>
#include <map>
#include <random>

#include "benchmarks/fleet/Interruption.hpp"

namespace velkor::benchmarks {

namespace {

constexpr double shortest = 0.3;
constexpr double longest = 4;
constexpr double longestPause = 3;
constexpr std::ptrdiff_t mostAtOnce = 2;

FleetClock::duration toDuration(double seconds) {
    return std::chrono::duration_cast<FleetClock::duration>(std::chrono::duration<double>(seconds));
}

}  // namespace

std::string Fault::text() const {
    char line[80];
    std::snprintf(line, sizeof line, "%6.1f s: m%zu %s for %.1f s", begin, member,
                  isFrozen ? "frozen" : "killed", end - begin);
    return line;
}

std::vector<Fault> planFaults(const FleetOptions& options) {
    std::vector<Fault> faults;
    if (!options.hasFaults) return faults;
    std::minstd_rand random(options.seed);
    const auto between = [&](double least, double most) {
        return std::uniform_real_distribution<double>(least, most)(random);
    };
    const auto members = static_cast<std::size_t>(options.members);
    double time = between(0, longestPause);
    while (time + shortest < options.seconds) {
        const double end = std::min(time + between(shortest, longest), options.seconds);
        const Fault next{random() % members, random() % 2 == 0, time, end};
        const auto lasts = [&](const Fault& each) { return each.end >= next.begin; };
        const bool isDown = std::any_of(faults.begin(), faults.end(), [&](const Fault& each) {
            return each.member == next.member && lasts(each);
        });
        const bool isTooMuch = std::count_if(faults.begin(), faults.end(), lasts) >= mostAtOnce;
        if (!isDown && !isTooMuch) faults.push_back(next);
        time += between(shortest, longestPause);
    }
    return faults;
}

void injectFaults(testing::EtcdCluster& cluster, const std::vector<Fault>& faults, double seconds) {
    std::multimap<double, std::function<void()>> actions;
    for (const Fault& fault : faults) {
        auto& member = cluster[fault.member];
        if (fault.isFrozen) {
            actions.emplace(fault.begin, [&member] { member.freeze(); });
            actions.emplace(fault.end, [&member] { member.thaw(); });
        } else {
            actions.emplace(fault.begin, [&member] { member.kill(); });
            actions.emplace(fault.end, [&member] { member.start(); });
        }
    }
    const auto began = FleetClock::now();
    for (const auto& [time, action] : actions) {
        Interruption::sleepUntil(began + toDuration(time));
        action();
    }
    Interruption::sleepUntil(began + toDuration(seconds));
}

}  // namespace velkor::benchmarks
