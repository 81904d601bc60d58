#include "benchmarks/fleet/Simulation.hpp"

#include <algorithm>
#include <chrono>
#include <sstream>
#include <stdexcept>
#include <string>
#include <utility>

#include "benchmarks/fleet/Commands.hpp"
#include "benchmarks/fleet/Host.hpp"
#include "benchmarks/fleet/Interruption.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::chrono::seconds patience{60};
constexpr std::chrono::milliseconds lookPause{100};

// Looks again and again until it is so, a minute at most; gives whether it is.
template <class Condition>
bool comesAbout(Condition condition) {
    const auto end = FleetClock::now() + patience;
    while (!condition()) {
        if (FleetClock::now() > end) return false;
        Interruption::sleepUntil(FleetClock::now() + lookPause);
    }
    return true;
}

void require(bool isSo, const char* otherwise) {
    if (!isSo) throw std::runtime_error(otherwise);
}

// The settings whose values are others.
std::vector<std::string> differences(const HostProcess& host, const std::map<int, int>& expected) {
    std::vector<std::string> all;
    const std::vector<int> values = host.values();
    for (const auto& [key, value] : expected) {
        const int shown = values[static_cast<std::size_t>(key)];
        if (shown == value) continue;
        all.push_back("process " + std::to_string(host.number()) + ": " + settingName(key) + " = " +
                      std::to_string(shown) + ", in etcd " + std::to_string(value));
    }
    return all;
}

}  // namespace

Simulation::Simulation(const FleetOptions& how) : options(how), cluster(how.members) {
    Interruption::check();
    startProcesses();
    startWatches();
    fill();
}

void Simulation::startProcesses() {
    const auto began = FleetClock::now();
    for (int i = 0; i < options.processes; ++i) {
        hosts.push_back(std::make_unique<HostProcess>(i, options, cluster.urls()));
    }
    for (const auto& host : hosts) host->awaitReady();
    startSeconds = std::chrono::duration<double>(FleetClock::now() - began).count();
}

// Each prefers another member.
void Simulation::startWatches() {
    auto urls = cluster.urls();
    for (std::size_t i = 0; i < cluster.size(); ++i) {
        watching.push_back(std::make_unique<WatchProcess>(urls));
        std::rotate(urls.begin(), urls.begin() + 1, urls.end());
    }
}

void Simulation::fill() {
    hosts.front()->tell(commands::fill);
    hosts.front()->awaitDone(commands::fill);
    require(awaitAgreement().broken.empty(), "the processes do not see the first values");
    const auto count = static_cast<std::size_t>(options.settings);
    for (const auto& each : watching) {
        require(comesAbout([&] { return each->seen().size() >= count; }),
                "etcdctl watch does not see the first values");
    }
}

void Simulation::tellAll(char command) const {
    for (const auto& host : hosts) host->tell(command);
    for (const auto& host : hosts) host->awaitDone(command);
}

void Simulation::run(const std::vector<Fault>& faults) {
    quietBegin = FleetClock::now();
    tellAll(commands::beginWriting);
    injectFaults(cluster, {}, options.quiet);
    quietEnd = FleetClock::now();
    countConnections();
    faultsBegin = FleetClock::now();
    injectFaults(cluster, faults, options.seconds);
    faultsEnd = FleetClock::now();
    tellAll(commands::endWriting);
}

void Simulation::countConnections() {
    for (const auto& host : hosts) {
        int& most = host->number() < options.writers ? writerConnections : readerConnections;
        most = std::max(most, host->connections());
        processBytes = std::max(processBytes, host->ownBytes());
    }
}

// A read that the majority confirms. Keys and values, a line each.
std::map<int, int> Simulation::engineValues() {
    std::istringstream lines(cluster[0].ctl(std::string("get --prefix ") + fleetPrefix));
    std::map<int, int> values;
    std::string key;
    std::string value;
    while (std::getline(lines, key) && std::getline(lines, value)) {
        if (settingOf(key) >= 0) values[settingOf(key)] = numberIn(value);
    }
    return values;
}

Promise Simulation::awaitAgreement() {
    Promise promise{"all settings have the values of etcd in the end"};
    require(comesAbout([&] { return cluster[0].answers(); }), "etcd does not answer");
    const bool agrees = comesAbout([&] {
        promise.broken.clear();
        const auto expected = engineValues();
        if (expected.size() != static_cast<std::size_t>(options.settings)) {
            promise.broken.push_back("etcd has " + std::to_string(expected.size()) + " settings");
        }
        for (const auto& host : hosts) {
            for (auto& each : differences(*host, expected)) promise.broken.push_back(each);
        }
        return promise.broken.empty();
    });
    if (agrees) promise.broken.clear();
    return promise;
}

// The last change is one that was put behind all others.
History Simulation::history() {
    cluster[0].ctl(std::string("put ") + fleetPrefix + "end 0");
    const WatchProcess all(cluster.urls());
    const auto isComplete = [&] {
        const auto seen = all.seen();
        return !seen.empty() && seen.back().key < 0;
    };
    require(comesAbout(isComplete), "etcdctl watch does not tell the history");
    return History(all.seen());
}

Promise Simulation::end() {
    Promise promise{"all processes ended well"};
    for (const auto& host : hosts) {
        if (host->end()) continue;
        promise.broken.push_back("process " + std::to_string(host->number()));
    }
    return promise;
}

}  // namespace velkor::benchmarks
