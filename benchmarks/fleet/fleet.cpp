// A fleet on one machine: processes with settings on a layer in etcd, members of which are killed
// and frozen at random. Checks what is promised, and says how long writes take to be read beside
// the engine's own `etcdctl watch`. See `bench-fleet --help`.

#include <algorithm>
#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include "benchmarks/fleet/Delays.hpp"
#include "benchmarks/fleet/Faults.hpp"
#include "benchmarks/fleet/FleetOptions.hpp"
#include "benchmarks/fleet/Interruption.hpp"
#include "benchmarks/fleet/Promises.hpp"
#include "benchmarks/fleet/Simulation.hpp"

namespace velkor::benchmarks {
namespace {

constexpr std::size_t mostExamples = 5;

void printBegin(const FleetOptions& options, const std::vector<Fault>& faults) {
    std::printf("%d processes of %d settings, %d members, %d writers, %.0f writes/s, seed %u\n",
                options.processes, options.settings, options.members, options.writers, options.rate,
                options.seed);
    for (const Fault& fault : faults) std::printf("%s\n", fault.text().c_str());
    std::fflush(stdout);
}

void printProcesses(const Simulation& simulation) {
    std::printf("\nuntil all processes had their values   %10.2f s\n", simulation.startSeconds);
    std::printf("connections of one that only reads     %10d\n", simulation.readerConnections);
    std::printf("connections of one that writes         %10d\n", simulation.writerConnections);
    std::printf("own memory of a process                %10.1f MB\n",
                simulation.processBytes / (1 << 20));
}

void printWrites(const HostProcesses& hosts) {
    std::vector<std::size_t> counts(static_cast<std::size_t>(What::readBack) + 1);
    for (const auto& host : hosts) {
        for (const Note& note : host->notes()) ++counts[static_cast<std::size_t>(note.what)];
    }
    const auto of = [&](What what) { return counts[static_cast<std::size_t>(what)]; };
    std::printf("writes acknowledged, refused, unknown  %10zu, %zu, %zu\n", of(What::taken),
                of(What::refused), of(What::unknown));
    std::printf("values shown by settings               %10zu\n", of(What::shown));
}

double milliseconds(const std::vector<double>& seconds, double part) {
    return quantile(seconds, part) * 1e3;
}

// Of what comes before the writer knows there is no ratio.
void printRatio(double ours, double engines) {
    if (engines < 0.1) return static_cast<void>(std::printf(" %6s", "-"));
    std::printf(" %6.2f", ours / engines);
}

void printDelay(const char* name, const std::vector<double>& ours,
                const std::vector<double>& engines) {
    std::printf("  %-27s", name);
    for (const auto* each : {&ours, &engines}) {
        std::printf(" %8.2f / %-8.2f", milliseconds(*each, 0.5), milliseconds(*each, 0.99));
    }
    for (const double part : {0.5, 0.99}) {
        printRatio(milliseconds(ours, part), milliseconds(engines, part));
    }
    std::printf("\n");
}

void printDelays(const char* phase, const Simulation& simulation, Simulation::Time begin,
                 Simulation::Time end) {
    const TakenWrites writes = writesBetween(simulation.processes(), begin, end);
    if (writes.empty()) return;
    const Delays ours = delaysOfSettings(simulation.processes(), writes);
    Delays engines;
    for (const auto& each : simulation.watches()) engines.add(delaysOf(each->seen(), writes));
    std::vector<double> writing;
    for (const TakenWrite& each : writes) {
        writing.push_back(std::chrono::duration<double>(each.taken - each.sent).count());
    }
    std::printf("\n%s, %zu writes; ms, median / p99\n", phase, writes.size());
    std::printf("  %-27s %-19s %-19s %s\n", "", "until a setting", "until etcdctl watch", "ratios");
    printDelay("since the write began", ours.sinceSent, engines.sinceSent);
    printDelay("since it was acknowledged", ours.sinceTaken, engines.sinceTaken);
    std::printf("  until it was acknowledged   %8.2f / %.2f\n", milliseconds(writing, 0.5),
                milliseconds(writing, 0.99));
    std::printf("  never seen                  %8zu of %-8zu %8zu of %zu\n", ours.unseen,
                ours.sinceSent.size() + ours.unseen, engines.unseen,
                engines.sinceSent.size() + engines.unseen);
}

// Gives whether it was kept.
bool print(const Promise& promise) {
    std::printf("%-8s %s\n", promise.broken.empty() ? "kept" : "BROKEN", promise.text.c_str());
    const std::size_t shown = std::min(mostExamples, promise.broken.size());
    for (std::size_t i = 0; i < shown; ++i) {
        std::printf("         %s\n", promise.broken[i].c_str());
    }
    if (promise.broken.size() > shown) {
        std::printf("         and %zu more\n", promise.broken.size() - shown);
    }
    return promise.broken.empty();
}

int simulate(const FleetOptions& options) {
    const std::vector<Fault> faults = planFaults(options);
    printBegin(options, faults);
    Simulation simulation(options);
    simulation.run(faults);
    std::vector<Promise> promises{simulation.awaitAgreement()};
    const History history = simulation.history();
    promises.push_back(simulation.end());
    for (auto& each : comparePromises(simulation.processes(), history)) promises.push_back(each);

    printProcesses(simulation);
    printWrites(simulation.processes());
    printDelays("without faults", simulation, simulation.quietBegin, simulation.quietEnd);
    printDelays(options.hasFaults ? "with faults" : "again", simulation, simulation.faultsBegin,
                simulation.faultsEnd);
    std::printf("\n");
    bool allKept = true;
    for (const Promise& each : promises) allKept = print(each) && allKept;
    return allKept ? 0 : 1;
}

}  // namespace
}  // namespace velkor::benchmarks

int main(int count, char** words) {
    using namespace velkor::benchmarks;
    if (asksForHelp(count, words)) {
        std::fputs(fleetUsage, stdout);
        return 0;
    }
    try {
        const FleetOptions options = readOptions(count, words);
        Interruption::note();
        return simulate(options);
    } catch (const BadOptions& error) {
        std::fprintf(stderr, "bench-fleet: %s\n%s", error.what(), fleetUsage);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "bench-fleet: %s\n", error.what());
    }
    return 2;
}
