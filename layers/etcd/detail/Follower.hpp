#pragma once

#include <chrono>
#include <condition_variable>
#include <memory>
#include <optional>
#include <string>

#include "framework/common/Mutex.hpp"
#include "layers/etcd/detail/Backoff.hpp"
#include "layers/etcd/detail/Core.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Gateway.hpp"
#include "layers/etcd/detail/LastKnown.hpp"

namespace velkor::layers::etcd {

/// Whether a source has its first values. Thread-safe.
class Start {
public:
    /// Waits; empty when it has them, else why it hasn't.
    std::string await() VELKOR_EXCLUDES(mutex);

    /// The first call counts.
    void finish(std::string&& problem) noexcept VELKOR_EXCLUDES(mutex);

private:
    common::Mutex mutex;
    std::condition_variable finished;
    std::optional<std::string> outcome VELKOR_GUARDED_BY(mutex);
};

/// The thread that reads: keeps the table of a source what the server has, in the order of
/// revisions.
///
/// It reads all keys once and then follows their changes. With another member it resumes where it
/// was, if that has the same history from there on: it has to know the change that was seen last.
/// Otherwise, after a compaction or on a server that was restored from an older state, all is read
/// again.
class Follower {
public:
    Follower(std::shared_ptr<Core> shared, std::shared_ptr<Start> firstValues);

    /// Until the source ends, or can't start.
    void run();

private:
    using Clock = std::chrono::steady_clock;

    void attempt();
    void follow();
    void readAll(Gateway& gateway);
    bool canResume(Gateway& gateway);
    void receive(Gateway& gateway);
    void onAnswer(WatchAnswer&& answer);
    void onRevision(std::vector<Event>& events, std::size_t begin, std::size_t end);
    void onLost(const char* reason) noexcept;
    void noteLost() noexcept;
    void pause();
    void startWithout();
    void noteChanged();
    void save() noexcept;
    std::optional<std::string> ownKey(const std::string& key) const;

    const std::shared_ptr<Core> core;
    const std::shared_ptr<Start> start;
    const Clock::time_point startDeadline;
    EndpointRound endpoints;
    Backoff backoff;
    Position position;
    bool hasValues = false;
    bool hasStarted = false;
    bool mustReadAll = false;
    bool isOtherHistory = false;
    std::string lastProblem;
    std::optional<Clock::time_point> saveDue;
    bool couldSave = true;
};

}  // namespace velkor::layers::etcd
