#include "benchmarks/fleet/Delays.hpp"

#include <algorithm>
#include <chrono>
#include <unordered_map>

#include "benchmarks/fleet/Host.hpp"

namespace velkor::benchmarks {

namespace {

double seconds(FleetClock::duration duration) {
    return std::chrono::duration<double>(duration).count();
}

}  // namespace

TakenWrites writesBetween(const HostProcesses& hosts, FleetClock::time_point begin,
                          FleetClock::time_point end) {
    TakenWrites writes;
    for (const auto& host : hosts) {
        FleetClock::time_point sent{};
        for (const Note& note : host->notes()) {
            if (note.what == What::sent) sent = note.time;
            if (note.what != What::taken || sent < begin || sent >= end) continue;
            writes.push_back({note.key, note.value, sent, note.time});
        }
    }
    return writes;
}

void Delays::add(const Delays& more) {
    sinceSent.insert(sinceSent.end(), more.sinceSent.begin(), more.sinceSent.end());
    sinceTaken.insert(sinceTaken.end(), more.sinceTaken.begin(), more.sinceTaken.end());
    unseen += more.unseen;
}

Delays delaysOf(const std::vector<Seen>& seen, const TakenWrites& writes) {
    std::unordered_map<int, FleetClock::time_point> times;
    for (const Seen& each : seen) times.emplace(each.value, each.time);
    Delays delays;
    for (const TakenWrite& write : writes) {
        const auto found = times.find(write.value);
        if (found == times.end()) {
            ++delays.unseen;
            continue;
        }
        delays.sinceSent.push_back(seconds(found->second - write.sent));
        delays.sinceTaken.push_back(seconds(found->second - write.taken));
    }
    return delays;
}

Delays delaysOfSettings(const HostProcesses& hosts, const TakenWrites& writes) {
    Delays all;
    for (const auto& host : hosts) {
        std::vector<Seen> shown;
        for (const Note& note : host->notes()) {
            if (note.what == What::shown) shown.push_back({note.time, note.key, note.value});
        }
        TakenWrites ofOthers;
        std::copy_if(
            writes.begin(), writes.end(), std::back_inserter(ofOthers),
            [&](const TakenWrite& write) { return writerOf(write.value) != host->number(); });
        all.add(delaysOf(shown, ofOthers));
    }
    return all;
}

double quantile(std::vector<double> values, double part) {
    if (values.empty()) return 0;
    std::sort(values.begin(), values.end());
    const auto place = static_cast<std::size_t>(part * static_cast<double>(values.size()));
    return values[std::min(place, values.size() - 1)];
}

}  // namespace velkor::benchmarks
