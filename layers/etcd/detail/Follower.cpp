#include "layers/etcd/detail/Follower.hpp"

#include <algorithm>
#include <exception>
#include <random>
#include <utility>

#include "layers/etcd/EtcdErrors.hpp"
#include "layers/etcd/detail/Answers.hpp"
#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/Requests.hpp"
#include "layers/etcd/detail/ValueText.hpp"

namespace velkor::layers::etcd {

using common::MutexLock;
using configuration::ValueMap;
using configuration::ValueTable;

namespace {

constexpr const char* rangePath = "/v3/kv/range";
constexpr std::chrono::seconds longestRange{60};
constexpr std::chrono::seconds saveDelay{1};

/// The changes that come next are not kept any more.
struct Compacted {};

}  // namespace

std::string Start::await() {
    MutexLock lock(mutex);
    while (!outcome) lock.wait(finished);
    return *outcome;
}

void Start::finish(std::string&& problem) noexcept {
    const MutexLock lock(mutex);
    if (!outcome) outcome = std::move(problem);
    finished.notify_all();
}

Follower::Follower(std::shared_ptr<Core> shared, std::shared_ptr<Start> firstValues)
    : core(std::move(shared)),
      start(std::move(firstValues)),
      startDeadline(Clock::now() + core->options.startWithin),
      endpoints(core->endpoints, std::random_device()()),
      backoff(core->options.shortestPause, core->options.longestPause) {}

void Follower::run() {
    try {
        for (;;) {
            if (!hasStarted && Clock::now() >= startDeadline) startWithout();
            attempt();
            pause();
        }
    } catch (const std::exception&) {
        if (saveDue) save();
        // Nobody ends a source that has not started: without a problem there was no memory for one.
        if (lastProblem.empty()) lastProblem = "out of memory";
        start->finish(std::move(lastProblem));
    }
}

// Until the source ends there is always a next one.
void Follower::attempt() {
    try {
        follow();
    } catch (const Compacted&) {
        report(common::warning, "etcd keeps the next changes no more: all keys are read");
        mustReadAll = true;
    } catch (const Stopped&) {
        throw;
    } catch (const std::exception& error) {
        onLost(error.what());
        endpoints.next();
    }
}

void Follower::follow() {
    const auto silence = core->options.silence;
    auto deadline = Clock::now() + silence;
    if (!hasStarted) deadline = std::min(deadline, startDeadline);
    Gateway gateway(endpoints.current(), core->options, core->stop, deadline);
    const bool resumes = hasValues && !mustReadAll && canResume(gateway);
    if (!resumes) readAll(gateway);
    receive(gateway);
}

// A change that was seen is a change of this history, and of no other one. What is out of range has
// been compacted, or is still to come: the revision shows that when all is read.
bool Follower::canResume(Gateway& gateway) {
    try {
        const auto deadline = Clock::now() + core->options.silence;
        const RangeAnswer past = readRange(
            gateway.ask(rangePath, pastRequest(position.witness, position.revision), deadline));
        const std::int64_t modified = past.entries.empty() ? 0 : past.entries.front().modified;
        isOtherHistory =
            past.header.cluster != position.cluster || modified != position.witnessModified;
        return !isOtherHistory;
    } catch (const Refused& refused) {
        if (!refused.isOutOfRange()) throw;
        return false;
    }
}

void Follower::readAll(Gateway& gateway) {
    const bool before = hasStarted;
    const auto deadline = before ? Clock::now() + longestRange : startDeadline;
    RangeAnswer answer = readRange(
        gateway.ask(rangePath, rangeRequest(core->prefix), deadline, core->options.silence));
    Position read{answer.header.cluster, answer.header.revision,
                  core->prefix.empty() ? std::string(1, '\0') : core->prefix, 0};
    ValueMap values;
    values.reserve(answer.entries.size());
    for (KeyValue& entry : answer.entries) {
        auto key = ownKey(entry.key);
        if (!key || entry.modified > read.revision) throw Unreachable("the answer makes no sense");
        values.emplace(std::move(*key), fromValueText(entry.value));
        if (entry.modified < read.witnessModified) continue;
        read.witness = std::move(entry.key);
        read.witnessModified = entry.modified;
    }
    answer.entries.clear();
    const bool beginsAnew = hasValues && (isOtherHistory || read.cluster != position.cluster ||
                                          read.revision < position.revision);
    if (beginsAnew) {
        report(common::warning, "etcd has another history: revision ", position.revision,
               " is followed by ", read.revision);
    }
    core->change([&](ValueTable& table) {
        return core->replica.replaceAll(table, std::move(values), read.revision, beginsAnew);
    });
    position = std::move(read);
    hasValues = true;
    mustReadAll = isOtherHistory = false;
    noteChanged();
}

void Follower::receive(Gateway& gateway) {
    const auto silence = core->options.silence;
    const auto began = Clock::now();
    WatchStream stream(gateway, core->prefix, position.revision + 1, began + silence);
    if (core->standing.noteConnected(endpoints.current().text)) {
        report(lastProblem.empty() ? common::debug : common::warning, "etcd is followed at ",
               endpoints.current().text, " from revision ", position.revision);
    }
    lastProblem.clear();
    hasStarted = true;
    start->finish("");
    auto heard = Clock::now();
    auto askNext = heard + silence / 3;
    auto asked = std::chrono::system_clock::now();
    for (;;) {
        auto until = std::min(askNext, heard + silence);
        if (saveDue) until = std::min(until, *saveDue);
        const bool hasHeard =
            stream.receive(until, [this](WatchAnswer&& answer) { onAnswer(std::move(answer)); });
        const auto now = Clock::now();
        if (hasHeard) {
            heard = now;
            core->standing.noteUpdated(asked);
        }
        if (now >= heard + silence) throw Unreachable("it is silent");
        if (now >= began + silence) backoff.reset();
        if (saveDue && now >= *saveDue) save();
        if (now < askNext) continue;
        stream.askForProgress();
        asked = std::chrono::system_clock::now();
        askNext = now + silence / 3;
    }
}

void Follower::onAnswer(WatchAnswer&& answer) {
    if (answer.compacted != 0) throw Compacted();
    if (answer.canceled) throw Unreachable("the changes have ended: " + answer.reason);
    if (answer.header.cluster != position.cluster) throw Unreachable("another cluster answers");
    auto& events = answer.events;
    std::size_t begin = 0;
    while (begin < events.size()) {
        std::size_t end = begin + 1;
        while (end < events.size() && events[end].entry.modified == events[begin].entry.modified) {
            ++end;
        }
        onRevision(events, begin, end);
        begin = end;
    }
}

// What was seen already comes again from nobody but a confused server.
void Follower::onRevision(std::vector<Event>& events, std::size_t begin, std::size_t end) {
    const std::int64_t revision = events[begin].entry.modified;
    if (revision <= position.revision) return;
    std::vector<KeyUpdate> updates;
    updates.reserve(end - begin);
    for (std::size_t i = begin; i < end; ++i) {
        auto key = ownKey(events[i].entry.key);
        if (!key) throw Unreachable("the answer makes no sense");
        KeyUpdate update{std::move(*key)};
        if (!events[i].isRemoval) update.value = fromValueText(events[i].entry.value);
        updates.push_back(std::move(update));
    }
    Event& last = events[end - 1];
    core->change([&](ValueTable& table) {
        return core->replica.update(table, std::move(updates), revision);
    });
    position.revision = revision;
    position.witness = std::move(last.entry.key);
    position.witnessModified = last.isRemoval ? 0 : revision;
    noteChanged();
}

std::optional<std::string> Follower::ownKey(const std::string& key) const {
    const std::string& prefix = core->prefix;
    if (key.compare(0, prefix.size(), prefix) != 0) return std::nullopt;
    return key.substr(prefix.size());
}

// The attempt that the end of the time to start ends says less than the one before. Short of memory
// nobody is told.
void Follower::onLost(const char* reason) noexcept {
    const bool isOutOfTime = !hasStarted && Clock::now() >= startDeadline;
    if (isOutOfTime && !lastProblem.empty()) return;
    try {
        lastProblem = endpoints.current().text + ": " + reason;
    } catch (const std::bad_alloc&) {
        lastProblem = "out of memory";  // short enough to need none
    }
    noteLost();
}

void Follower::noteLost() noexcept {
    try {
        if (!core->standing.noteLost(lastProblem)) return;
    } catch (const std::bad_alloc&) {
        return;
    }
    report(common::warning, "etcd is lost: ", lastProblem);
}

void Follower::pause() {
    auto end = Clock::now() + backoff.next();
    if (!hasStarted) end = std::min(end, startDeadline);
    core->stop.sleepUntil(end);
}

// No member has answered by now.
void Follower::startWithout() {
    const auto& options = core->options;
    if (lastProblem.empty()) {
        lastProblem = "no member has answered in time";
        noteLost();
    }
    if (options.withoutServer == StartWithoutServer::fail) throw Unreachable(lastProblem);
    if (options.withoutServer == StartWithoutServer::lastKnown) {
        try {
            LastKnown known = readLastKnown(options.lastKnownFile, core->prefix);
            core->change([&](ValueTable& table) {
                return core->replica.replaceAll(table, std::move(known.values),
                                                known.position.revision, false);
            });
            position = std::move(known.position);
        } catch (const std::runtime_error& problem) {
            lastProblem += std::string("; ") + problem.what();
            throw;
        }
        hasValues = true;
        core->standing.noteRevision(position.revision);
        report(common::warning, "etcd is not reached, the values are those of revision ",
               position.revision, " in ", options.lastKnownFile.string());
    }
    hasStarted = true;
    start->finish("");
}

void Follower::noteChanged() {
    core->standing.noteRevision(position.revision);
    if (!core->options.lastKnownFile.empty() && !saveDue) saveDue = Clock::now() + saveDelay;
}

void Follower::save() noexcept {
    saveDue.reset();
    try {
        LastKnown known{position, {}};
        core->change([&](ValueTable& table) {
            known.values = core->replica.serverValues(table);
            return Replica::Keys();
        });
        writeLastKnown(core->options.lastKnownFile, core->prefix, known);
        couldSave = true;
    } catch (const std::exception& error) {
        if (couldSave) {
            report(common::warning, "the last known values can't be kept: ", error.what());
        }
        couldSave = false;
    }
}

}  // namespace velkor::layers::etcd
