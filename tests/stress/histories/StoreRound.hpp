#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "tests/stress/histories/RecordedWatch.hpp"

namespace velkor::testing {

/// Runs a thread for each function, as close together as the machine allows, until all have ended.
void runAtOnce(const std::vector<std::function<void()>>& bodies);

/// How one history comes about.
struct RoundPlan {
    std::size_t threads = 4;
    std::size_t calls = 8;  ///< Of each thread.
    unsigned seed = 1;      ///< Which calls each thread makes: not, how they meet.

    /// All that a store can do; otherwise what single keys can, without registrations, with
    /// watchers that must be told of everything.
    bool everything = true;

    /// Whether there are watchers from the start.
    bool watched = true;

    /// What is called before there are threads, and by each of them, in the place of random calls.
    std::vector<StoreCall> first{};
    std::vector<std::vector<StoreCall>> scripts{};

    std::function<void(const std::vector<std::function<void()>>&)> together = runAtOnce;
};

/// Threads that make random calls of a store and watch it, and what they saw.
class StoreRound {
public:
    /// Runs `plan` against `subject`, which is a fresh store, to its end.
    static StoreHistory run(StoreSubject& subject, const RoundPlan& plan);

    /// As above, and what is wrong with the history, with the seed; empty when nothing is.
    static std::string complaintOf(StoreSubject& subject, const RoundPlan& plan);

private:
    using Watches = std::vector<std::shared_ptr<RecordedWatch>>;

    StoreRound(StoreSubject& called, const RoundPlan& roundPlan)
        : subject(called),
          plan(roundPlan),
          recorder(called, roundPlan.threads + 1),
          watchesOf(roundPlan.threads + 1) {}

    void run();
    void watchFromTheStart();
    void work(std::size_t thread);
    void callAtRandom(std::size_t thread);
    void takePart(std::mt19937& random, Watches& own);
    void lookAtAll();
    std::shared_ptr<RecordedWatch> watchKey(const std::string& key, std::uint64_t demand, bool asks,
                                            bool fromTheStart = false);
    std::shared_ptr<RecordedWatch> watchChanges(const std::string& prefix, std::uint64_t demand,
                                                bool fromTheStart = false);
    StoreHistory history() const;

    StoreSubject& subject;
    const RoundPlan plan;
    StoreRecorder recorder;
    std::vector<Watches> watchesOf;  // one for each thread, used by it alone
};

/// A call that `random` chooses, with values that no other call has.
StoreCall randomCall(std::mt19937& random, bool everything, int& lastValue);

}  // namespace velkor::testing
