// How the store tells of changes, and what it offers beyond `Configuration`: a look at the sources,
// several keys at once, forgetting, the stream of changes, and sources that change by themselves.

#include <algorithm>
#include <exception>
#include <iterator>
#include <new>
#include <stdexcept>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/StoreErrors.hpp"
#include "configuration/detail/AwaitedReport.hpp"
#include "configuration/detail/ChangeList.hpp"
#include "configuration/detail/Lookup.hpp"
#include "configuration/detail/StoreOperation.hpp"
#include "configuration/detail/SubscriberErrors.hpp"
#include "configuration/detail/Transaction.hpp"
#include "configuration/detail/WatchList.hpp"

namespace velkor::configuration {

namespace {

/// Collects the keys that sources report while it lives, in the place of telling of them.
class Deferral {
public:
    Deferral(std::vector<std::string>*& collecting, std::vector<std::string>& keys)
        : current(collecting), before(std::exchange(collecting, &keys)) {}
    ~Deferral() { current = before; }

    Deferral(const Deferral&) = delete;
    Deferral& operator=(const Deferral&) = delete;

private:
    std::vector<std::string>*& current;
    std::vector<std::string>* const before;
};

using detail::ChangeList;
using detail::ChangePublisher;
using detail::Transaction;

void serve(detail::StoreLock::Level& level, ChangeList::Due& due) {
    if (!due.empty()) level.releasedWhile([&] { due.serve(); });
}

// `keys` without those that stood before, in their order. All of them without the memory for that:
// who is told of a key twice misses nothing.
std::vector<std::string> unique(std::vector<std::string>&& keys) noexcept {
    try {
        std::unordered_set<std::string_view> seen;
        std::vector<std::string> first;
        std::copy_if(keys.begin(), keys.end(), std::back_inserter(first),
                     [&](const std::string& key) { return seen.insert(key).second; });
        return first;
    } catch (const std::bad_alloc&) {
        return std::move(keys);
    }
}

// The keys that `changes` change, whether or not their sources report it.
std::vector<std::string> changedKeys(const std::vector<Change>& changes,
                                     const std::vector<AppliedChange>& outcome) {
    std::vector<std::string> keys;
    for (std::size_t i = 0; i < changes.size(); ++i) {
        if (changes[i].value || outcome[i].before) keys.push_back(changes[i].key);
    }
    return keys;
}

}  // namespace

Future<std::vector<SourceDescription>> ConfigurationImpl::describeSources() {
    const auto layers = [this] {
        const Operation operation(*this);
        return sources.list();
    }();
    return makeReadyFuture(detail::SourceRegistry::describe(*layers));
}

Future<std::shared_ptr<ConfigurationSource>> ConfigurationImpl::findSource(
    const std::string& name) {
    const Operation operation(*this);
    const auto* const found = sources.find(name);
    return makeReadyFuture(found == nullptr ? nullptr : found->source);
}

Future<std::vector<std::string>> ConfigurationImpl::keysFrom(const std::string& first,
                                                             std::size_t most) {
    const Operation operation(*this);
    return makeReadyFuture(sources.keysFrom(first, most));
}

Future<std::vector<Option>> ConfigurationImpl::explain(const std::string& key) {
    const Operation operation(*this);
    return makeReadyFuture(sources.holders(key));
}

Future<Reading> ConfigurationImpl::read(const std::vector<std::string>& keys) {
    const Operation operation(*this);
    Reading reading;
    // Before the values: a source that changes meanwhile makes the version grow afterwards.
    reading.version = currentVersion();
    reading.options.reserve(keys.size());
    for (const auto& key : keys) {
        const detail::Lookup layer(sources, key);
        reading.options.push_back(layer ? std::optional<Option>(layer.option()) : std::nullopt);
    }
    return makeReadyFuture(std::move(reading));
}

Future<bool> ConfigurationImpl::unset(const std::string& key) {
    const Operation operation(*this, "unset: ", key);
    return forget({key}, sources.firstWritable(key, nullptr));
}

Future<bool> ConfigurationImpl::unset(const std::string& key, const std::string& sourceName) {
    const Operation operation(*this, "unset: ", key, ", ", sourceName);
    return forget({key, std::nullopt, sourceName}, sources.firstWritable(key, &sourceName));
}

Future<bool> ConfigurationImpl::forget(const Change& change,
                                       const detail::RegisteredSource* target) {
    const std::string refusal = detail::refusalOf(change, target);
    if (!refusal.empty()) return failed<bool>(refusal);
    storeLogger.write(common::debug, "unset: ", change.key, "@", target->name);
    detail::KeyBuffer buffer(sources.keyBuffers());
    const std::string& relativeKey = buffer.within(target->group, change.key);
    Answer<bool> answer;
    const detail::AwaitedReport report(awaited, change.key);
    const bool known = target->forgetting->unset(relativeKey).has_value();
    if (known && !target->reportsChanges && !report.hasCome()) reportChange("", change.key);
    return answer.with(known);
}

Future<std::vector<AppliedChange>> ConfigurationImpl::apply(const std::vector<Change>& changes,
                                                            bool dryRun) {
    Operation operation(*this, dryRun ? "apply, dry run: " : "apply: ", changes.size());
    Transaction transaction(sources, changes);
    const std::string refusals = transaction.refusals();
    if (!refusals.empty()) {
        return failed<std::vector<AppliedChange>>(store_errors::changesRefused + refusals);
    }
    const auto& outcome = transaction.outcome();
    auto answer = makeReadyFuture(outcome);
    if (dryRun) return answer;
    // Sources that report nothing to the store, or not yet, change all the same.
    std::vector<std::string> changed = changedKeys(changes, outcome);
    {
        const Deferral deferral(deferred, changed);
        transaction.write(sources);
    }
    if (!changed.empty()) version.fetch_add(1, std::memory_order_release);
    tellAll(operation.mutexLevel(), unique(std::move(changed)));
    return answer;
}

class ConfigurationImpl::Host final : public SourceHost {
public:
    explicit Host(ConfigurationImpl& hostingStore) : store(hostingStore) {}

    void changeTogether(const std::function<void()>& change) override {
        store.changeTogether(change);
    }

private:
    ConfigurationImpl& store;
};

// Registers a source, which knows of it beforehand if it wants to.
std::shared_ptr<detail::RegisteredSource> ConfigurationImpl::insert(ConfigurationSourceMap entry) {
    auto* const attached = dynamic_cast<AttachedSource*>(entry.source.get());
    if (attached == nullptr) return sources.insert(std::move(entry));
    if (host == nullptr) host = std::make_unique<Host>(*this);
    attached->attach(std::shared_ptr<SourceHost>(weak_from_this().lock(), host.get()));
    try {
        return sources.insert(std::move(entry));
    } catch (...) {
        attached->detach();
        throw;
    }
}

void ConfigurationImpl::changeTogether(const std::function<void()>& change) {
    Operation operation(*this);
    std::vector<std::string> changed;
    std::exception_ptr failure;
    {
        const Deferral deferral(deferred, changed);
        try {
            change();
        } catch (...) {
            failure = std::current_exception();
        }
    }
    tellAll(operation.mutexLevel(), unique(std::move(changed)));
    if (failure) std::rethrow_exception(failure);
}

void ConfigurationImpl::onSourceChanged(const std::string& group, const std::string& key) {
    Operation operation(*this);
    detail::KeyBuffer buffer(sources.keyBuffers());
    const std::string* joined = nullptr;
    try {
        joined = &buffer.joined(group, key);
    } catch (const std::bad_alloc&) {
        if (deferred != nullptr) throw;
        changeStreams->failAll(std::current_exception());
        return detail::reportSubscriberError("value", key);
    }
    const std::string& fullKey = *joined;
    detail::AwaitedReport::note(awaited, fullKey);
    if (deferred != nullptr) return deferred->push_back(fullKey);
    if (!changeStreams->empty()) {
        ChangeList::Due due;
        changeStreams->keep(sources, fullKey, currentVersion(), due);
        serve(operation.mutexLevel(), due);
    }
    publishers->update(operation.mutexLevel(), sources, fullKey);
}

std::function<void()> ConfigurationImpl::forgetting(std::uint64_t streamId) {
    return [store = std::weak_ptr(std::static_pointer_cast<ConfigurationImpl>(shared_from_this())),
            streamId] {
        if (const auto alive = store.lock()) alive->removeStream(streamId);
    };
}

// Tells the streams of changes of `keys`, each with `group` in front.
void ConfigurationImpl::tellStreams(detail::StoreLock::Level& level, const std::string& group,
                                    const std::set<std::string>& keys) {
    if (changeStreams->empty()) return;
    ChangeList::Due due;
    for (const auto& key : keys) changeStreams->keep(sources, group + key, currentVersion(), due);
    serve(level, due);
}

// Tells of `keys` together: each watcher finds all of them changed.
void ConfigurationImpl::tellAll(detail::StoreLock::Level& level,
                                const std::vector<std::string>& keys) {
    if (deferred != nullptr) {
        deferred->insert(deferred->end(), keys.begin(), keys.end());
        return;
    }
    if (!foreignCodeMayRun()) return;
    ChangeList::Due due;
    for (const auto& key : keys) changeStreams->keep(sources, key, currentVersion(), due);
    serve(level, due);
    for (const auto& key : keys) publishers->update(level, sources, key);
}

std::shared_ptr<reactive_streams::PublisherAPI<OptionChange>> ConfigurationImpl::watchChanges(
    const std::string& prefix) {
    const Operation operation(*this, "watchChanges: ", prefix);
    const std::uint64_t streamId = nextStreamId.fetch_add(1);
    auto publisher = std::make_shared<ChangePublisher>(forgetting(streamId));
    changeStreams->add(publisher, prefix, streamId);
    updateHasForeignCode();
    return publisher;
}

}  // namespace velkor::configuration
