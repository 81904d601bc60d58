#include "tests/stress/histories/StoreRound.hpp"

#include <gtest/gtest.h>

#include <random>
#include <thread>
#include <utility>

#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {

namespace {

using configuration::ConfigurationValue;
using configuration::OptionChange;
using Kind = StoreCall::Kind;

constexpr std::size_t watchersOfAKey = 2;
constexpr int valuesOfAThread = 1'000'000;

std::vector<std::string> keysOf(const RoundPlan& plan) {
    if (plan.everything) return {"a", "b", "g.a", "g.b"};
    return {"a", "b"};
}

}  // namespace

void runAtOnce(const std::vector<std::function<void()>>& bodies) {
    Latch start(bodies.size());
    std::vector<std::thread> threads;
    for (const auto& body : bodies) {
        threads.emplace_back([&] {
            EXPECT_TRUE(start.arriveAndWait());
            body();
        });
    }
    for (auto& thread : threads) thread.join();
}

StoreHistory StoreRound::run(StoreSubject& subject, const RoundPlan& plan) {
    StoreRound round(subject, plan);
    round.run();
    return round.history();
}

std::string StoreRound::complaintOf(StoreSubject& subject, const RoundPlan& plan) {
    const std::string complaint = testing::complaintOf(run(subject, plan));
    if (complaint.empty()) return "";
    return "with the seed " + std::to_string(plan.seed) + ", " + std::to_string(plan.threads) +
           " threads and " + std::to_string(plan.calls) + " calls each: " + complaint;
}

void StoreRound::run() {
    StoreRecorder::beThread(0);
    if (plan.watched) watchFromTheStart();
    for (const StoreCall& call : plan.first) recorder.perform(call);
    std::vector<std::function<void()>> bodies;
    for (std::size_t thread = 1; thread <= plan.threads; ++thread) {
        bodies.emplace_back([this, thread] { work(thread); });
    }
    plan.together(bodies);
    lookAtAll();
    subject.end();
}

void StoreRound::watchFromTheStart() {
    for (const std::string& key : keysOf(plan)) {
        for (std::size_t i = 0; i < watchersOfAKey; ++i) {
            watchesOf[0].push_back(watchKey(key, RecordedWatch::allThereWillBe, i == 0, true));
        }
    }
    for (const char* const prefix : {"", "g."}) {
        watchesOf[0].push_back(watchChanges(prefix, RecordedWatch::allThereWillBe, true));
    }
}

void StoreRound::work(std::size_t thread) {
    StoreRecorder::beThread(thread);
    if (plan.scripts.empty()) return callAtRandom(thread);
    for (const StoreCall& call : plan.scripts[thread - 1]) recorder.perform(call);
}

void StoreRound::callAtRandom(std::size_t thread) {
    std::mt19937 random(plan.seed * 1000 + static_cast<unsigned>(thread));
    int lastValue = static_cast<int>(thread) * valuesOfAThread;
    for (std::size_t i = 0; i < plan.calls; ++i) {
        if (plan.everything && random() % 8 == 0) takePart(random, watchesOf[thread]);
        recorder.perform(randomCall(random, plan.everything, lastValue));
        stumble();
    }
}

// Begins a watch, or does something about one that this thread has begun.
void StoreRound::takePart(std::mt19937& random, Watches& own) {
    if (own.empty() || random() % 3 == 0) {
        const auto keys = keysOf(plan);
        const std::string& key = keys[random() % keys.size()];
        const std::uint64_t demand = random() % 2 == 0 ? RecordedWatch::allThereWillBe : 2;
        own.push_back(random() % 3 == 0 ? watchChanges(key, demand)
                                        : watchKey(key, demand, random() % 2 == 0));
        return;
    }
    RecordedWatch& watch = *own[random() % own.size()];
    if (random() % 2 == 0) {
        watch.cancel();
    } else {
        watch.request(1);
    }
}

void StoreRound::lookAtAll() {
    if (plan.everything) {
        recorder.perform({Kind::describe});
        StoreCall read{Kind::read};
        read.keys = keysOf(plan);
        recorder.perform(std::move(read));
    }
    for (const std::string& key : keysOf(plan)) {
        recorder.perform({Kind::explain, key});
        recorder.perform({Kind::getOption, key});
    }
}

// A watcher that asks finds what it is told of, or what is newer.
std::shared_ptr<RecordedWatch> StoreRound::watchKey(const std::string& key, std::uint64_t demand,
                                                    bool asks, bool fromTheStart) {
    const auto whenTold = [this, asks](const std::string& told) {
        stumble();
        if (asks) recorder.perform({Kind::get, told});
    };
    WatchLog log{WatchLog::Kind::values, key, recorder.tick(), fromTheStart};
    auto watcher = std::make_shared<RecordingWatcher<ConfigurationValue>>(recorder, std::move(log),
                                                                          demand, whenTold);
    subject.watchOption(key)->subscribe(watcher);
    return watcher;
}

std::shared_ptr<RecordedWatch> StoreRound::watchChanges(const std::string& prefix,
                                                        std::uint64_t demand, bool fromTheStart) {
    WatchLog log{WatchLog::Kind::changes, prefix, recorder.tick(), fromTheStart};
    auto watcher = std::make_shared<RecordingWatcher<OptionChange>>(
        recorder, std::move(log), demand, [](const std::string&) { stumble(); });
    subject.watchChanges(prefix)->subscribe(watcher);
    return watcher;
}

StoreHistory StoreRound::history() const {
    StoreHistory all;
    all.calls = recorder.calls();
    for (const Watches& watches : watchesOf) {
        for (const auto& watch : watches) all.watches.push_back(watch->watchLog());
    }
    if (!plan.everything) all.watchersOfAKey = watchersOfAKey;
    return all;
}

}  // namespace velkor::testing
