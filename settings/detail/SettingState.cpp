#include "settings/detail/SettingState.hpp"

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
    {
        const Passage passage(gate);
        closed = true;
        removeCallbacks();
        left.swap(hub);
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
    version = newVersion;
    const bool first = !hasValue;
    Verdict verdict = judge(options, first);
    if (verdict.holds) {
        hasValue = true;
        publish(stand(verdict) && !first);
        if (verdict.complaints.empty() || closed) return;
        settingsLogger.write(verdict.severity, verdict.complaints, "; the default is taken");
        return;
    }
    note(verdict.complaints);
    if (first) return;  // whoever constructs the setting is told
    settingsLogger.write(verdict.severity, verdict.complaints, "; the last good value stays");
}

// Whether the values of the keys are other ones than before.
bool SettingState::stand(Verdict& verdict) {
    bool changes = false;
    const common::MutexLock lock(mutex);
    for (std::size_t i = 0; i < verdict.standings.size(); ++i) {
        Standing& next = verdict.standings[i];
        const bool isNew = i >= standing.size();
        const bool differs = isNew || next.value != standing[i].value;
        const bool moved = isNew || next.source != standing[i].source;
        next.since = differs || moved ? std::chrono::system_clock::now() : standing[i].since;
        changes = changes || differs;
    }
    standing.swap(verdict.standings);
    complaint.reset();
    if (!verdict.complaints.empty()) complaint = verdict.complaints;
    return changes;
}

void SettingState::note(const std::string& text) {
    const common::MutexLock lock(mutex);
    complaint = text;
}

void SettingState::endCallback(std::uint64_t id) {
    const Passage passage(gate);
    removeCallback(id);
}

std::vector<Standing> SettingState::standings() const {
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
