#include "layers/etcd/detail/Sender.hpp"

#include <algorithm>
#include <cstddef>
#include <map>
#include <random>
#include <stdexcept>
#include <string_view>
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

template <class Exception>
std::exception_ptr failure(const char* text, std::string_view reason) noexcept {
    try {
        return std::make_exception_ptr(Exception(text + std::string(reason)));
    } catch (...) {
        return std::current_exception();
    }
}

std::exception_ptr refusal(std::string_view reason) noexcept {
    return failure<std::runtime_error>(etcd_errors::notWritten, reason);
}

std::exception_ptr unknown(std::string_view reason) noexcept {
    return failure<UnknownOutcome>(etcd_errors::unknownOutcome, reason);
}

std::string joined(const char* text, std::string_view reason) noexcept {
    try {
        return text + std::string(reason);
    } catch (...) {
        return {};
    }
}

/// Lets `changes` have seen what `answer` says of their keys.
void lookAgain(std::vector<KeyChange>& changes, const TransactionAnswer& answer) {
    if (answer.ranges.size() != changes.size()) throw Unreachable("the answer makes no sense");
    for (std::size_t i = 0; i < changes.size(); ++i) {
        changes[i].condition = {answer.header.revision, !answer.ranges[i].entries.empty()};
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
    core->outbox.refuseAll(refusal(joined(etcd_errors::notReached, etcd_errors::sourceEnded)));
}

// What is thrown on the way says that the group was not sent, or not done, and may be sent again.
void Sender::send(const Group& group) {
    std::string problem;
    const auto deadline = group.accepted + core->options.writeWithin;
    do {
        try {
            connect(deadline);
            return transact(group, Clock::now() + core->options.writeWithin);
        } catch (const Stopped&) {
            throw;
        } catch (const std::exception& error) {
            problem = saying(error);
        }
        disconnect();
        core->stop.sleepUntil(std::min(deadline, Clock::now() + backoff.next()));
    } while (Clock::now() < deadline);
    onRefused(group, joined(etcd_errors::notReached, problem));
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

std::string Sender::saying(const std::exception& error) const noexcept {
    try {
        return endpoints.current().text + ": " + error.what();
    } catch (...) {
        return "out of memory";  // short enough to need none
    }
}

void Sender::transact(const Group& group, Clock::time_point deadline) {
    Changes changes = changesOf(group);
    const bool isStrict = core->options.compareAndSwap;
    for (;;) {
        const auto answer = ask(group, transactionRequest(changes, isStrict), deadline);
        if (!answer) return;
        if (answer->succeeded) return onTaken(group, answer->header.revision);
        if (isStrict) return onRefused(group, etcd_errors::changedMeanwhile);
        lookAgain(changes, *answer);
    }
}

// Whatever happens once the group may have been sent ends here: it is never sent again.
std::optional<TransactionAnswer> Sender::ask(const Group& group, const std::string& request,
                                             Clock::time_point deadline) {
    try {
        auto answer = readTransaction(gateway->ask(transactionPath, request, deadline));
        backoff.reset();
        return answer;
    } catch (const Stopped&) {
        core->outbox.finish(unknown(etcd_errors::sourceEnded));
        throw;
    } catch (const Refused& refused) {
        if (refused.isUnauthenticated()) throw;
        if (refused.isFinal()) {
            onRefused(group, refused.what());
        } else {
            onUnknown(saying(refused));
        }
    } catch (const std::exception& error) {
        onUnknown(saying(error));
    }
    return std::nullopt;
}

/// Changes the table by `mutation`, which adds what it changes to the keys that it is given, and
/// goes on where it was when memory was short.
template <class Mutation>
void Sender::changeUntilDone(const Mutation& mutation) {
    Replica::Keys changed;
    for (;;) {
        try {
            return core->change([&](ValueTable& table) {
                mutation(table, changed);
                return std::move(changed);
            });
        } catch (const Stopped&) {
            throw;
        } catch (const std::exception&) {
            core->stop.sleepUntil(Clock::now() + memoryPause);
        }
    }
}

/// Who waits is told also when the source ends meanwhile.
template <class Mutation>
void Sender::finish(std::exception_ptr outcome, const Mutation& mutation) {
    try {
        changeUntilDone(mutation);
    } catch (const Stopped&) {
        core->outbox.finish(std::move(outcome));
        throw;
    }
    core->outbox.finish(std::move(outcome));
}

void Sender::onTaken(const Group& group, std::int64_t revision) {
    core->outbox.noteTaken(group, revision);
    finish(nullptr, [&](ValueTable& table, Replica::Keys& changed) {
        core->replica.take(table, group, revision, changed);
    });
}

void Sender::noteError(const char* text, const std::string& reason) const noexcept {
    core->standing.noteWriteError(joined(text, reason));
    report(common::error, text, reason);
}

void Sender::onRefused(const Group& group, const std::string& reason) {
    noteError(etcd_errors::notWritten, reason);
    finish(refusal(reason), [&](ValueTable& table, Replica::Keys& changed) {
        core->replica.refuse(table, group, changed);
    });
}

void Sender::onUnknown(const std::string& reason) {
    noteError(etcd_errors::unknownOutcome, reason);
    const auto unanswered = core->outbox.finish(unknown(reason));
    for (;;) {
        disconnect();
        core->stop.sleepUntil(Clock::now() + backoff.next());
        try {
            connect(Clock::time_point::max());
            return settle(unanswered.front());
        } catch (const Stopped&) {
            throw;
        } catch (const std::exception& error) {
            refuseOverdue(saying(error));
        }
    }
}

// Those that wait for a member no longer than others do.
void Sender::refuseOverdue(const std::string& problem) {
    const auto latest = Clock::now() - core->options.writeWithin;
    while (const Group* group = core->outbox.overdue(latest)) {
        onRefused(*group, joined(etcd_errors::notReached, problem));
    }
}

void Sender::settle(const Group& group) {
    const auto changes = changesOf(group);
    std::vector<Found> found;
    for (auto each = changes.begin(); each != changes.end();) {
        const auto end = each + std::min<std::ptrdiff_t>(mostInTransaction, changes.end() - each);
        found.push_back(read(each, end));
        each = end;
    }
    backoff.reset();
    const std::int64_t revision = found.back().revision;
    changeUntilDone([&](ValueTable& table, Replica::Keys& changed) {
        for (const Found& each : found) {
            core->replica.settle(table, group, each.updates, each.revision, changed);
        }
    });
    report(common::warning, "etcd was asked again what it holds, at revision ", revision);
}

Sender::Found Sender::read(Changes::const_iterator begin, Changes::const_iterator end) {
    std::vector<std::string> keys;
    for (auto each = begin; each != end; ++each) keys.push_back(each->key);
    const auto answer = readTransaction(
        gateway->ask(transactionPath, readRequest(keys), Clock::now() + core->options.silence));
    if (answer.ranges.size() != keys.size()) throw Unreachable("the answer makes no sense");
    Found found{{}, answer.header.revision};
    for (std::size_t i = 0; i < keys.size(); ++i) {
        KeyUpdate update{keys[i].substr(core->prefix.size())};
        for (const KeyValue& entry : answer.ranges[i].entries) {
            if (entry.key != keys[i]) throw Unreachable("the answer makes no sense");
            update.value = fromValueText(entry.value);
        }
        found.updates.push_back(std::move(update));
    }
    return found;
}

// Of several writes of a key the last one counts; what was seen before the first one.
Sender::Changes Sender::changesOf(const Group& group) const {
    std::map<std::string, KeyChange> changes;
    for (const Write& write : group.writes) {
        const std::string key = core->prefix + write.key;
        const auto [change, isFirst] = changes.try_emplace(key, KeyChange{key});
        if (isFirst) change->second.condition = write.seen;
        change->second.value = write.text;
    }
    Changes all;
    all.reserve(changes.size());
    for (auto& each : changes) all.push_back(std::move(each.second));
    return all;
}

}  // namespace velkor::layers::etcd
