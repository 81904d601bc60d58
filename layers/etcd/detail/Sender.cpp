#include "layers/etcd/detail/Sender.hpp"

#include <algorithm>
#include <map>
#include <new>
#include <random>
#include <stdexcept>
#include <utility>

#include "layers/etcd/EtcdErrors.hpp"
#include "layers/etcd/detail/Answers.hpp"
#include "layers/etcd/detail/GatewayErrors.hpp"
#include "layers/etcd/detail/Requests.hpp"
#include "layers/etcd/detail/ValueText.hpp"

namespace velkor::layers::etcd {

using configuration::ValueTable;

namespace {

constexpr const char* transactionPath = "/v3/kv/txn";
constexpr std::chrono::milliseconds memoryPause{10};

std::exception_ptr refusal(const std::string& reason) {
    return std::make_exception_ptr(std::runtime_error(etcd_errors::notWritten + reason));
}

std::exception_ptr unknown(const std::string& reason) {
    return std::make_exception_ptr(UnknownOutcome(etcd_errors::unknownOutcome + reason));
}

/// Lets `changes` have seen what `answer` says of their keys.
void lookAgain(std::vector<KeyChange>& changes, const TransactionAnswer& answer) {
    if (answer.ranges.size() != changes.size()) throw Unreachable("the answer makes no sense");
    for (std::size_t i = 0; i < changes.size(); ++i) {
        changes[i].condition = {answer.header.revision, !answer.ranges[i].entries.empty()};
    }
}

/// Changes the table by `mutation`, which adds what it changes to the keys that it is given, and
/// goes on where it was when memory was short.
void changeUntilDone(const Core& core,
                     const std::function<void(ValueTable&, Replica::Keys&)>& mutation) {
    Replica::Keys changed;
    bool isDone = false;
    while (!isDone) {
        try {
            core.change([&](ValueTable& table) {
                mutation(table, changed);
                isDone = true;
                return std::move(changed);
            });
        } catch (const Stopped&) {
            throw;
        } catch (...) {
            // Memory is short, or a watcher has thrown.
            if (!isDone) core.stop.sleepUntil(std::chrono::steady_clock::now() + memoryPause);
        }
    }
}

}  // namespace

Sender::Sender(std::shared_ptr<Core> shared)
    : core(std::move(shared)),
      endpoints(core->endpoints, std::random_device()()),
      backoff(core->options.shortestPause, core->options.longestPause) {}

void Sender::run() {
    try {
        while (const Group* group = core->outbox.await()) send(*group);
    } catch (const Stopped&) {
        gateway.reset();
    }
    core->outbox.refuseAll(
        refusal(std::string(etcd_errors::notReached) + etcd_errors::sourceEnded));
}

void Sender::send(const Group& group) {
    std::string problem = "no member has answered in time";
    const auto deadline = group.accepted + core->options.writeWithin;
    do {
        try {
            connect(deadline);
            return sendUntil(group, Clock::now() + core->options.writeWithin);
        } catch (const Stopped&) {
            throw;
        } catch (const std::exception& error) {
            problem = endpoints.current().text + ": " + error.what();
        }
        disconnect();
        core->stop.sleepUntil(std::min(deadline, Clock::now() + backoff.next()));
    } while (Clock::now() < deadline);
    onRefused(group, etcd_errors::notReached + problem);
}

void Sender::connect(Clock::time_point deadline) {
    if (gateway && gateway->isUsable()) return;
    gateway.reset();
    const auto limit = std::min(deadline, Clock::now() + core->options.silence);
    gateway.emplace(endpoints.current(), core->options, core->stop, limit);
}

void Sender::disconnect() {
    gateway.reset();
    endpoints.next();
}

// What it throws says that the group was not sent, or not done, and may be sent again.
void Sender::sendUntil(const Group& group, Clock::time_point deadline) {
    std::vector<KeyChange> changes = changesOf(group);
    const bool isStrict = core->options.compareAndSwap;
    try {
        for (;;) {
            const std::string request = transactionRequest(changes, isStrict);
            const auto answer = readTransaction(gateway->ask(transactionPath, request, deadline));
            backoff.reset();
            if (answer.succeeded) return onTaken(group, answer.header.revision);
            if (isStrict) return onRefused(group, etcd_errors::changedMeanwhile);
            lookAgain(changes, answer);
        }
    } catch (const Stopped&) {
        core->outbox.finish(unknown(etcd_errors::sourceEnded));
        throw;
    } catch (const Refused& refused) {
        if (refused.isUnauthenticated()) throw;
        if (refused.isFinal()) return onRefused(group, refused.what());
        onUnknown(group, endpoints.current().text + ": " + refused.what());
    } catch (const std::exception& error) {
        onUnknown(group, endpoints.current().text + ": " + error.what());
    }
}

void Sender::onTaken(const Group& group, std::int64_t revision) {
    core->outbox.noteTaken(group, revision);
    changeUntilDone(*core, [&](ValueTable& table, Replica::Keys& changed) {
        core->replica.take(table, group, revision, changed);
    });
    core->outbox.finish(nullptr);
}

void Sender::onRefused(const Group& group, const std::string& reason) {
    core->standing.noteWriteError(etcd_errors::notWritten + reason);
    report(common::error, etcd_errors::notWritten + reason);
    changeUntilDone(*core, [&](ValueTable& table, Replica::Keys& changed) {
        core->replica.refuse(table, group, changed);
    });
    core->outbox.finish(refusal(reason));
}

void Sender::onUnknown(const Group& group, const std::string& reason) {
    core->standing.noteWriteError(etcd_errors::unknownOutcome + reason);
    report(common::error, etcd_errors::unknownOutcome + reason);
    const Group unanswered = group;
    core->outbox.finish(unknown(reason));
    for (;;) {
        disconnect();
        core->stop.sleepUntil(Clock::now() + backoff.next());
        try {
            connect(Clock::time_point::max());
            return settle(unanswered);
        } catch (const Stopped&) {
            throw;
        } catch (const std::exception&) {
            // The next member is asked.
            continue;
        }
    }
}

void Sender::settle(const Group& group) {
    std::map<std::string, KeyUpdate> found;
    for (const Write& write : group.writes) found[core->prefix + write.key].key = write.key;
    std::vector<std::string> keys;
    keys.reserve(found.size());
    for (const auto& each : found) keys.push_back(each.first);
    const auto answer = readTransaction(
        gateway->ask(transactionPath, readRequest(keys), Clock::now() + core->options.silence));
    for (const RangeAnswer& range : answer.ranges) {
        for (const KeyValue& entry : range.entries) {
            const auto update = found.find(entry.key);
            if (update == found.end()) throw Unreachable("the answer makes no sense");
            update->second.value = fromValueText(entry.value);
        }
    }
    std::vector<KeyUpdate> updates;
    updates.reserve(found.size());
    for (auto& each : found) updates.push_back(std::move(each.second));
    backoff.reset();
    changeUntilDone(*core, [&](ValueTable& table, Replica::Keys& changed) {
        core->replica.settle(table, group, updates, answer.header.revision, changed);
    });
    report(common::warning, "etcd was asked again what it holds, at revision " +
                                std::to_string(answer.header.revision));
}

// Of several writes of a key the last one counts; what was seen before the first one.
std::vector<KeyChange> Sender::changesOf(const Group& group) const {
    std::map<std::string, KeyChange> changes;
    for (const Write& write : group.writes) {
        const std::string key = core->prefix + write.key;
        const auto [change, isFirst] = changes.try_emplace(key, KeyChange{key});
        if (isFirst) change->second.condition = write.seen;
        change->second.value = write.text;
    }
    std::vector<KeyChange> all;
    all.reserve(changes.size());
    for (auto& each : changes) all.push_back(std::move(each.second));
    return all;
}

}  // namespace velkor::layers::etcd
