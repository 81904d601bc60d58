#include "settings/detail/SettingState.hpp"

#include <algorithm>
#include <chrono>
#include <exception>
#include <stdexcept>
#include <utility>

#include "settings/Loggers.hpp"
#include "settings/SettingError.hpp"
#include "settings/detail/Hub.hpp"

namespace velkor::settings::detail {

namespace {

std::vector<std::string> namesOf(const std::vector<Declared>& keys) {
    std::vector<std::string> names;
    names.reserve(keys.size());
    for (const Declared& key : keys) names.push_back(key.key);
    return names;
}

}  // namespace

SettingState::SettingState(std::string name, std::vector<Declared> keys)
    : title(std::move(name)), declared(std::move(keys)) {}

SettingState::~SettingState() = default;

void SettingState::begin(const std::shared_ptr<configuration::ConfigurationImpl>& store) {
    if (store == nullptr) throw std::invalid_argument("A setting needs a store.");
    const auto joined = Hub::of(store);
    {
        const common::MutexLock lock(mutex);
        followed = store;
    }
    {
        const Passage passage(gate);
        hub = joined;
    }
    joined->add(shared_from_this());
    const auto reading = store->read(namesOf(declared)).get();
    deliver(reading.version, reading.options.data());
    const Passage passage(gate);
    if (!hasValue) throw SettingError(lastError().value_or(""));
}

void SettingState::close() {
    std::shared_ptr<Hub> left;
    Listeners removed;  // destroyed without the locks
    {
        const Passage passage(gate);
        closed = true;
        left.swap(hub);
        const common::MutexLock lock(mutex);
        removed.swap(listeners);
    }
    if (left != nullptr) left->remove(*this);
}

void SettingState::onChange(const configuration::OptionChange& change) {
    if (declared.size() == 1) return deliver(change.version, &change.option);
    // Keys that are changed together are read together, at the first of their changes.
    if (!isKnown(change.version)) refresh();
}

bool SettingState::isKnown(std::uint64_t changeVersion) {
    const Passage passage(gate);
    return hasValue && changeVersion <= version;
}

void SettingState::refresh() {
    const auto store = storeIfAlive();
    if (store == nullptr) return;
    try {
        const auto reading = store->read(namesOf(declared)).get();
        deliver(reading.version, reading.options.data());
    } catch (const std::exception& failure) {
        fail(failure.what());
    }
}

void SettingState::fail(const std::string& reason) {
    const std::string text = title + ": can't be read: " + reason;
    note(text);
    settingsLogger.write(common::error, text);
}

void SettingState::deliver(std::uint64_t newVersion,
                           const std::optional<configuration::Option>* options) {
    const Passage passage(gate);
    if (closed || newVersion < version) return;
    const bool first = !hasValue;
    Verdict verdict = judge(options, first);
    // What was thrown until here leaves the version to the next try.
    version = newVersion;
    if (verdict.holds) {
        hasValue = true;
        publish(stand(verdict));
        if (verdict.complaints.empty() || closed) return;
        settingsLogger.write(verdict.severity, verdict.complaints, "; the default is taken");
        return;
    }
    note(verdict.complaints);
    if (first) return;  // whoever constructs the setting is told
    settingsLogger.write(verdict.severity, verdict.complaints, "; the last good value stays");
}

// Gives those who are to be told that the values are other ones than before.
SettingState::Listeners SettingState::stand(Verdict& verdict) {
    // What takes memory comes first, so that nothing stands as new that is not published.
    std::optional<std::string> said;
    if (!verdict.complaints.empty()) said = verdict.complaints;
    Listeners told;
    const common::MutexLock lock(mutex);
    const bool isFirst = standing.empty();
    if (!isFirst && isNews(verdict)) told = listeners;
    standing.resize(verdict.standings.size());
    for (std::size_t i = 0; i < standing.size(); ++i) {
        Standing& next = verdict.standings[i];
        const bool differs = isFirst || next.value != standing[i].value;
        if (!differs && next.source == standing[i].source) continue;
        standing[i] = std::move(next);
        standing[i].since = std::chrono::system_clock::now();
    }
    complaint.swap(said);
    return told;
}

// Whether a value has become another one.
bool SettingState::isNews(const Verdict& verdict) const {
    return !std::equal(standing.begin(), standing.end(), verdict.standings.begin(),
                       [](const auto& now, const auto& next) { return now.value == next.value; });
}

void SettingState::note(const std::string& text) {
    const common::MutexLock lock(mutex);
    complaint = text;
}

std::uint64_t SettingState::addListener(std::shared_ptr<const void> callback) {
    const common::MutexLock lock(mutex);
    listeners.push_back({++lastListener, std::move(callback)});
    return lastListener;
}

bool SettingState::isListening(const Listener& listener) const {
    const common::MutexLock lock(mutex);
    return std::any_of(listeners.begin(), listeners.end(),
                       [&](const Listener& each) { return each.id == listener.id; });
}

void SettingState::endCallback(std::uint64_t id) {
    std::shared_ptr<const void> removed;  // destroyed without the locks
    const Passage passage(gate);
    const common::MutexLock lock(mutex);
    const auto ended = std::find_if(listeners.begin(), listeners.end(),
                                    [id](const Listener& each) { return each.id == id; });
    if (ended == listeners.end()) return;
    removed.swap(ended->callback);
    listeners.erase(ended);
}

Standings SettingState::standings() const {
    const common::MutexLock lock(mutex);
    return standing;
}

std::optional<std::string> SettingState::lastError() const {
    const common::MutexLock lock(mutex);
    return complaint;
}

bool SettingState::isStoreGone() const {
    const common::MutexLock lock(mutex);
    return followed.expired();
}

std::shared_ptr<configuration::ConfigurationImpl> SettingState::storeIfAlive() const {
    const common::MutexLock lock(mutex);
    return followed.lock();
}

Following::Following(std::shared_ptr<SettingState> followingState,
                     const std::shared_ptr<configuration::ConfigurationImpl>& store)
    : state(std::move(followingState)) {
    try {
        state->begin(store);
    } catch (...) {
        state->close();
        throw;
    }
}

Following::~Following() {
    state->close();
}

}  // namespace velkor::settings::detail
