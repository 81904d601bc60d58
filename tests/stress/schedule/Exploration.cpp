#include "tests/stress/schedule/Exploration.hpp"

#include <sched.h>

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <exception>
#include <iostream>

#include "tests/stress/schedule/Strategies.hpp"

namespace velkor::testing::schedule {

namespace {

std::size_t numberFrom(const char* variable, std::size_t otherwise) {
    const char* const text = std::getenv(variable);
    return text == nullptr ? otherwise : std::stoul(text);
}

/// Keeps the calling thread, and those that it begins, on one processor while it lives: handing
/// over to a thread of another one takes longer, above all on a busy machine.
class OneProcessor {
public:
    OneProcessor() {
        sched_getaffinity(0, sizeof(before), &before);
        cpu_set_t one;
        CPU_ZERO(&one);
        CPU_SET(static_cast<std::size_t>(sched_getcpu()), &one);
        sched_setaffinity(0, sizeof(one), &one);
    }
    ~OneProcessor() { sched_setaffinity(0, sizeof(before), &before); }

    OneProcessor(const OneProcessor&) = delete;
    OneProcessor& operator=(const OneProcessor&) = delete;

private:
    cpu_set_t before{};
};

/// Runs one scenario with one schedule after the other.
class Explorer {
public:
    explicit Explorer(const Scenario& explored) : scenario(explored) {}

    /// Whether all was well. `kind` says what kind of schedule `strategy` makes.
    bool runs(Strategy& strategy, const std::string& kind);

    /// How many points the longest schedule had.
    std::size_t longest() const noexcept { return mostPoints; }

    Findings findings{};

private:
    std::string spelled(const std::string& complaint, const std::string& kind,
                        const Scheduler& scheduler) const;

    const Scenario& scenario;
    std::size_t mostPoints = 0;
};

// What the signal handler asks: the schedule that is running.
std::function<void(const std::string&)> reportAndEnd;

void onSignal(int) {
    reportAndEnd("a signal came");
}

bool Explorer::runs(Strategy& strategy, const std::string& kind) {
    ++findings.schedules;
    Scheduler* running = nullptr;
    reportAndEnd = [&](const std::string& complaint) {
        std::cerr << (running == nullptr ? complaint : spelled(complaint, kind, *running))
                  << std::flush;
        std::_Exit(EXIT_FAILURE);
    };
    Scheduler scheduler(strategy, reportAndEnd);
    running = &scheduler;
    try {
        scenario([&](const Bodies& bodies) { scheduler.run(bodies); });
    } catch (const std::exception& wrong) {
        findings.complaint = spelled(wrong.what(), kind, scheduler);
    }
    mostPoints = std::max(mostPoints, scheduler.choices().size());
    return findings.complaint.empty();
}

std::string Explorer::spelled(const std::string& complaint, const std::string& kind,
                              const Scheduler& scheduler) const {
    return complaint + "\nin schedule " + std::to_string(findings.schedules) + ", " + kind +
           ", which VELKOR_SCHEDULE=" + scheduler.choices() + " repeats:\n" + scheduler.trace();
}

void exploreFewPreemptions(Explorer& explorer, std::size_t most) {
    FewPreemptions strategy(most);
    const std::string kind = "one of all with at most " + std::to_string(most) + " preemptions";
    while (explorer.runs(strategy, kind) && strategy.advance()) continue;
}

void exploreAll(Explorer& explorer, const Extent& extent) {
    for (std::size_t most = 0; most <= extent.preemptions; ++most) {
        exploreFewPreemptions(explorer, most);
        if (!explorer.findings.complaint.empty()) return;
    }
    for (std::size_t i = 0; i < extent.random; ++i) {
        const auto seed = static_cast<unsigned>(extent.seed + i);
        RandomRanks strategy(seed, explorer.longest());
        if (!explorer.runs(strategy, "with the seed " + std::to_string(seed))) return;
    }
}

}  // namespace

Extent Extent::orAsAsked() const {
    return {numberFrom("VELKOR_SCHEDULE_PREEMPTIONS", preemptions),
            numberFrom("VELKOR_SCHEDULES", random),
            static_cast<unsigned>(numberFrom("VELKOR_SCHEDULE_SEED", seed))};
}

Findings explore(const Scenario& scenario, const Extent& extent) {
    const auto segmentationBefore = std::signal(SIGSEGV, onSignal);
    const auto abortBefore = std::signal(SIGABRT, onSignal);
    const OneProcessor oneProcessor;
    Explorer explorer(scenario);
    if (const char* const choices = std::getenv("VELKOR_SCHEDULE")) {
        FewPreemptions undisturbed(0);
        Repetition repeated(choices);
        if (explorer.runs(undisturbed, "the first one")) explorer.runs(repeated, "as asked for");
    } else {
        exploreAll(explorer, extent);
    }
    std::signal(SIGSEGV, segmentationBefore);
    std::signal(SIGABRT, abortBefore);
    return explorer.findings;
}

}  // namespace velkor::testing::schedule
